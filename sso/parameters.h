#ifndef TAVOSSO_SSO_PARAMETERS_H
#define TAVOSSO_SSO_PARAMETERS_H

#include <map>
#include <string>

namespace TAVO::SSO {

/// The parameters of a request. They are written in the map's order: by name, byte-wise.
using Parameters = std::map<std::string, std::string>;

/// "name=value" pairs joined by "&", the values percent-encoded: the body of a form.
std::string WriteForm(const Parameters &parameters);

/// The same behind a "?": the query of a URL.
std::string WriteQuery(const Parameters &parameters);

}  // namespace TAVO::SSO

#endif
