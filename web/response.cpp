#include <stdexcept>

#include "web/cookie.h"
#include "web/text.h"
#include "web/web.h"

namespace TAVO::Web {

// The referrer policy is not "no-referrer", under which browsers send no Origin with a form.
Response::Response()
    : headers{{"Cache-Control", "no-store"},
              {"Referrer-Policy", "same-origin"},
              {"X-Content-Type-Options", "nosniff"},
              {"Content-Security-Policy",
               "default-src 'none'; script-src 'self'; style-src 'self'; img-src 'self'; base-uri 'none'; "
               "form-action 'self'; frame-ancestors 'none'"}} {}

void Response::AddHeader(const std::string &name, const std::string &value) {
    if (!IsPrintable(value)) {
        throw std::invalid_argument("A header must be one printable line.");
    }
    headers.emplace_back(name, value);
}

void Response::SetCookie(const std::string &name, const std::string &value, const std::string &more) {
    AddHeader("Set-Cookie", MakeCookie(name, value, more));
}

void Response::ExpireCookie(const std::string &name) { SetCookie(name, "", "; Max-Age=0"); }

void Response::Redirect(const std::string &address) {
    AddHeader("Location", address);
    status = "302 Found";
}

}  // namespace TAVO::Web
