#ifndef TAVOSSO_WEB_COOKIE_H
#define TAVOSSO_WEB_COOKIE_H

#include <optional>
#include <string>

// Cookies (RFC 6265): the front end's attributes, and what a browser sends back.
namespace TAVO::Web {

/// The value of a Set-Cookie header: a cookie for this host alone, over TLS alone, out of reach of scripts. Without a
/// Max-Age in `more` it ends with the browser.
std::string MakeCookie(const std::string &name, const std::string &value, const std::string &more = "");

/// Whether the request's Cookie header has a cookie of that name.
bool HasCookie(const std::string &header, const std::string &name);

/// The value of a cookie that the request's Cookie header has exactly once.
std::optional<std::string> FindCookie(const std::string &header, const std::string &name);

}  // namespace TAVO::Web

#endif
