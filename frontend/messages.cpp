#include "frontend/messages.h"

#include "frontend/catalogues.h"
#include "frontend/language.h"
#include "web/text.h"

namespace Frontend {

Messages::Messages(const std::string &acceptLanguage)
    : catalogue_(TAVO::Web::ParseObject(FindCatalogue(PreferredLanguage(acceptLanguage)))) {}

std::string Messages::operator[](const char *id) const {
    return TAVO::Web::EscapeHtml(TAVO::Web::StringMember(catalogue_, id));
}

}  // namespace Frontend
