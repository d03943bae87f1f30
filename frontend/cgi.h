#ifndef TAVOSSO_FRONTEND_CGI_H
#define TAVOSSO_FRONTEND_CGI_H

#include <map>
#include <optional>
#include <string>

// What a CGI program is told about its request (RFC 3875).
namespace Frontend {

using Parameters = std::multimap<std::string, std::string>;

/// A request variable, empty where the web server set none.
std::string Variable(const char *name);

/// The parameters of a query, percent-decoded.
Parameters ParseQuery(const std::string &query);

/// The value of a parameter that is given exactly once: of two values, one would be checked and the other one used.
std::optional<std::string> OnlyValue(const Parameters &parameters, const std::string &name);

/// Whether the request's Cookie header has a cookie of that name.
bool HasCookie(const std::string &header, const std::string &name);

/// The value of a cookie that the request's Cookie header has exactly once.
std::optional<std::string> FindCookie(const std::string &header, const std::string &name);

}  // namespace Frontend

#endif
