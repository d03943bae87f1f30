#ifndef TAVOSSO_WEB_COOKIE_H
#define TAVOSSO_WEB_COOKIE_H

#include <optional>
#include <string>

// Writes and reads cookies (RFC 6265).
namespace TAVO::Web {

/// Returns the value of a Set-Cookie header. The cookie is for this host only, over TLS only, and hidden from scripts.
/// Without a Max-Age in `more` it ends with the browser.
std::string MakeCookie(const std::string &name, const std::string &value, const std::string &more = "");

/// Returns whether the Cookie header has a cookie of that name.
bool HasCookie(const std::string &header, const std::string &name);

/// Returns the value of a cookie that the Cookie header has exactly once.
std::optional<std::string> FindCookie(const std::string &header, const std::string &name);

}  // namespace TAVO::Web

#endif
