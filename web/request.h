#ifndef TAVOSSO_WEB_REQUEST_H
#define TAVOSSO_WEB_REQUEST_H

#include <map>
#include <optional>
#include <string>

// Query parameters and cookies of a request.
namespace TAVO::Web {

using Parameters = std::multimap<std::string, std::string>;

/// The parameters of a query, percent-decoded.
Parameters ParseQuery(const std::string &query);

/// The value of a parameter that is given exactly once: of two values, one would be checked and the other one used.
std::optional<std::string> OnlyValue(const Parameters &parameters, const std::string &name);

/// Whether the request's Cookie header has a cookie of that name.
bool HasCookie(const std::string &header, const std::string &name);

/// The value of a cookie that the request's Cookie header has exactly once.
std::optional<std::string> FindCookie(const std::string &header, const std::string &name);

}  // namespace TAVO::Web

#endif
