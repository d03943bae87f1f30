#ifndef TAVOSSO_SSO_PARAMETERS_H
#define TAVOSSO_SSO_PARAMETERS_H

#include <map>
#include <string>

namespace TAVO::SSO {

/// Parameters of a request. They are written in the order of their names.
using Parameters = std::map<std::string, std::string>;

/// Returns the body of a form: "name=value" pairs joined by "&", with percent-encoded values.
std::string WriteForm(const Parameters &parameters);

/// Returns the query of a URL: "?" and the form.
std::string WriteQuery(const Parameters &parameters);

}  // namespace TAVO::SSO

#endif
