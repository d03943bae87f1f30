#include "sso/parameters.h"

#include "sso/sso.h"
#include "utils/cleanse.h"

namespace TAVO::SSO {

namespace {

/// Returns the length of the form if every byte of a value becomes "%XX".
std::size_t LongestForm(const Parameters &parameters) {
    std::size_t length = 0;
    for (const auto &[name, value] : parameters) {
        length += name.size() + 3 * value.size() + 2;
    }
    return length;
}

}  // namespace

std::string WriteForm(const Parameters &parameters) {
    std::string form;
    form.reserve(LongestForm(parameters));  // growth would leave copies of the client secret in released memory
    try {
        for (const auto &[name, value] : parameters) {
            if (!form.empty()) {
                form += '&';
            }
            std::string encoded = URLEncode(value);
            const Utils::CleanseTextOnExit cleanse(encoded);
            form += name;
            form += '=';
            form += encoded;
        }
    } catch (...) {
        Utils::Cleanse(form);
        throw;
    }
    return form;
}

std::string WriteQuery(const Parameters &parameters) { return '?' + WriteForm(parameters); }

}  // namespace TAVO::SSO
