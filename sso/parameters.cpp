#include "sso/parameters.h"

#include "sso/sso.h"
#include "utils/cleanse.h"

namespace TAVO::SSO {

namespace {

/// How long the text can get: every byte of a value may become "%XX".
std::size_t LongestForm(const Parameters &parameters) {
    std::size_t length = 0;
    for (const auto &[name, value] : parameters) {
        length += name.size() + 3 * value.size() + 2;
    }
    return length;
}

void AppendEncoded(std::string &form, std::string value) {
    const Utils::CleanseTextOnExit cleanseValue(value);
    std::string encoded = URLEncode(value);
    const Utils::CleanseTextOnExit cleanseEncoded(encoded);
    form += encoded;
}

}  // namespace

std::string WriteForm(const Parameters &parameters) {
    std::string form;
    form.reserve(LongestForm(parameters));  // if it had to grow, it would leave pieces of the client secret behind
    for (const auto &[name, value] : parameters) {
        if (!form.empty()) {
            form += '&';
        }
        form += name;
        form += '=';
        AppendEncoded(form, std::string(value));
    }
    return form;
}

std::string WriteQuery(const Parameters &parameters) { return '?' + WriteForm(parameters); }

}  // namespace TAVO::SSO
