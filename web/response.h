#ifndef TAVOSSO_WEB_RESPONSE_H
#define TAVOSSO_WEB_RESPONSE_H

#include <string>
#include <utility>
#include <vector>

namespace TAVO::Web {

/// The response to a browser's request, as plain values. Every response has the headers that keep it out of caches,
/// frames and referrers.
class Response {
  public:
    std::string status = "200 OK";
    std::vector<std::pair<std::string, std::string>> headers;
    std::string body;

    /// The page that the user is on the way to. A page that reports a failure leads back to it.
    std::string origin;

    Response();

    /// Throws std::invalid_argument for a value that is not one printable line.
    void AddHeader(const std::string &name, const std::string &value);
    /// Sets a cookie with the attributes of `MakeCookie`.
    void SetCookie(const std::string &name, const std::string &value, const std::string &attributes = "");
    void ExpireCookie(const std::string &name);
    void Redirect(const std::string &address);
};

}  // namespace TAVO::Web

#endif
