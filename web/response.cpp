#include <algorithm>
#include <cctype>
#include <cstring>
#include <stdexcept>

#include "web/cookie.h"
#include "web/text.h"
#include "web/web.h"

namespace TAVO::Web {

namespace {

/// A token of HTTP (RFC 9110, section 5.6.2).
bool IsToken(const std::string &name) {
    const auto isTokenCharacter = [](unsigned char c) {
        return (c < 0x80 && std::isalnum(c) != 0) || (c != 0 && std::strchr("!#$%&'*+-.^_`|~", c) != nullptr);
    };
    return !name.empty() && std::all_of(name.begin(), name.end(), isTokenCharacter);
}

}  // namespace

// With the referrer policy "no-referrer", browsers would send no Origin with a form.
Response::Response()
    : headers{{"Cache-Control", "no-store"},
              {"Referrer-Policy", "same-origin"},
              {"X-Content-Type-Options", "nosniff"},
              {"Content-Security-Policy",
               "default-src 'none'; script-src 'self'; style-src 'self'; img-src 'self'; base-uri 'none'; "
               "form-action 'self'; frame-ancestors 'none'"}} {}

void Response::AddHeader(const std::string &name, const std::string &value) {
    if (!IsToken(name) || !IsPrintable(value)) {
        throw std::invalid_argument("A header must be one printable line.");
    }
    headers.emplace_back(name, value);
}

void Response::SetCookie(const std::string &name, const std::string &value, const std::string &more) {
    if (!IsToken(name) || value.find_first_of(" \",;\\") != std::string::npos) {
        throw std::invalid_argument("A cookie must not contain separators.");
    }
    AddHeader("Set-Cookie", MakeCookie(name, value, more));
}

void Response::ExpireCookie(const std::string &name) { SetCookie(name, "", "; Max-Age=0"); }

void Response::Redirect(const std::string &address) {
    AddHeader("Location", address);
    const auto former =
        std::find_if(headers.begin(), headers.end() - 1, [](const auto &header) { return header.first == "Location"; });
    if (former != headers.end() - 1) {
        headers.erase(former);
    }
    status = "302 Found";
}

}  // namespace TAVO::Web
