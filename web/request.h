#ifndef TAVOSSO_WEB_REQUEST_H
#define TAVOSSO_WEB_REQUEST_H

#include <map>
#include <optional>
#include <string>

// Query parameters of a request.
namespace TAVO::Web {

using Parameters = std::multimap<std::string, std::string>;

/// Returns the parameters of a query, percent-decoded.
Parameters ParseQuery(const std::string &query);

/// Returns the value of a parameter that is given exactly once. Of two values, the wrong one might be checked.
std::optional<std::string> OnlyValue(const Parameters &parameters, const std::string &name);

}  // namespace TAVO::Web

#endif
