#ifndef TAVOSSO_FRONTEND_LANGUAGE_H
#define TAVOSSO_FRONTEND_LANGUAGE_H

#include <string>

namespace Frontend {

/// Returns the language of the pages that an Accept-Language header (RFC 9110, section 12.5.4) prefers, such as "de".
/// English if there is none.
std::string PreferredLanguage(const std::string &acceptLanguage);

}  // namespace Frontend

#endif
