#include "web/refusal.h"

#include "web/text.h"

namespace TAVO::Web {

std::string ReasonOf(const std::exception &failure) {
    const std::string text = failure.what();
    const std::size_t begin = text.find_first_not_of(" \t\r\n");
    if (begin == std::string::npos || (text[begin] != '{' && text[begin] != '[')) {
        return OneLine(text);
    }
    const Json::Value answer = ParseObject(text);
    return ProviderError(StringMember(answer, "error"), StringMember(answer, "error_description"));
}

std::string ProviderError(const std::string &error, const std::string &description) {
    const std::string named = error.empty() ? "unknown error" : error;
    return OneLine("The provider refused: " + named + (description.empty() ? "" : " (" + description + ")"));
}

}  // namespace TAVO::Web
