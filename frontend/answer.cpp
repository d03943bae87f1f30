#include "frontend/answer.h"

#include <iostream>
#include <stdexcept>

#include "frontend/text.h"

namespace Frontend {

namespace {

// Pages must not be cached or framed, and another site must not learn where the user came from. The policy is not
// "no-referrer", under which browsers send no Origin with a form.
constexpr char kEveryAnswer[] =
    "Cache-Control: no-store\n"
    "Referrer-Policy: same-origin\n"
    "X-Content-Type-Options: nosniff\n"
    "Content-Security-Policy: default-src 'none'; script-src 'self'; style-src 'self'; img-src 'self'; "
    "base-uri 'none'; form-action 'self'; frame-ancestors 'none'\n";

constexpr char kBeforeTitle[] =
    "Content-Type: text/html; charset=utf-8\n\n"
    "<!DOCTYPE html>\n<html lang=\"en\">\n<head>\n<meta charset=\"utf-8\">\n"
    "<meta name=\"viewport\" content=\"width=device-width, initial-scale=1\">\n<title>";

constexpr char kBeforeContent[] =
    "</title>\n<link rel=\"icon\" href=\"/webman/ssoclient/mark.svg\" type=\"image/svg+xml\">\n"
    "<link rel=\"stylesheet\" href=\"/webman/ssoclient/style.css\">\n</head>\n<body>\n"
    "<header><img src=\"/webman/ssoclient/mark.svg\" alt=\"\" width=\"32\" height=\"32\"> Network storage</header>\n"
    "<main>\n";

}  // namespace

void Answer::SetCookie(const std::string &name, const std::string &value, const std::string &attributes) {
    // Lax, not Strict: the browser comes back from the provider's site, and brings the cookie only then.
    AddHeader("Set-Cookie", name + "=" + value + "; Path=/; Secure; HttpOnly; SameSite=Lax" + attributes);
}

void Answer::ExpireCookie(const std::string &name) { SetCookie(name, "", "; Max-Age=0"); }

void Answer::AddHeader(const std::string &name, const std::string &value) {
    if (!IsPrintable(value)) {
        throw std::invalid_argument("A header must be one printable line.");
    }
    head += name + ": " + value + "\n";
}

void Answer::Redirect(const std::string &address) {
    AddHeader("Location", address);
    std::cout << "Status: 302 Found\n" << kEveryAnswer << head << "\n";
}

void Answer::Page(const std::string &status, const std::string &title, const std::string &content) {
    std::cout << "Status: " << status << "\n"
              << kEveryAnswer << head << kBeforeTitle << EscapeHtml(title) << kBeforeContent << content
              << "</main>\n</body>\n</html>\n";
}

}  // namespace Frontend
