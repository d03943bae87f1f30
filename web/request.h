#ifndef TAVOSSO_WEB_REQUEST_H
#define TAVOSSO_WEB_REQUEST_H

#include <map>
#include <optional>
#include <string>

// The query parameters of a request.
namespace TAVO::Web {

using Parameters = std::multimap<std::string, std::string>;

/// The parameters of a query, percent-decoded.
Parameters ParseQuery(const std::string &query);

/// The value of a parameter that is given exactly once: of two values, one would be checked and the other one used.
std::optional<std::string> OnlyValue(const Parameters &parameters, const std::string &name);

}  // namespace TAVO::Web

#endif
