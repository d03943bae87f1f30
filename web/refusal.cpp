#include "web/refusal.h"

#include "web/text.h"

namespace TAVO::Web {

namespace {

bool IsJson(const std::string &text) {
    const std::size_t begin = text.find_first_not_of(" \t\r\n");
    return begin != std::string::npos && (text[begin] == '{' || text[begin] == '[');
}

std::string DescribeProviderError(const std::string &error, const std::string &description) {
    const std::string named = error.empty() ? "unknown error" : error;
    return OneLine("The provider refused: " + named + (description.empty() ? "" : " (" + description + ")"));
}

}  // namespace

ProviderRefusal::ProviderRefusal(const std::string &error, const std::string &description)
    : Refusal(DescribeProviderError(error, description)), providerError(OneLine(error)) {}

std::string ReasonOf(const std::exception &failure) {
    const std::string text = failure.what();
    if (!IsJson(text)) {
        return OneLine(text);
    }
    const Json::Value answer = ParseObject(text);
    return DescribeProviderError(StringMember(answer, "error"), StringMember(answer, "error_description"));
}

std::optional<std::string> ProviderErrorOf(const std::exception &failure) {
    const std::string text = failure.what();
    if (const auto *refusal = dynamic_cast<const ProviderRefusal *>(&failure)) {
        return refusal->providerError;
    }
    return IsJson(text) ? std::optional(OneLine(StringMember(ParseObject(text), "error"))) : std::nullopt;
}

}  // namespace TAVO::Web
