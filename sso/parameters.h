#ifndef TAVOSSO_SSO_PARAMETERS_H
#define TAVOSSO_SSO_PARAMETERS_H

#include <map>
#include <string>
#include <string_view>

namespace TAVO::SSO {

/// The parameters of a request, in the order in which they are written: by name, byte-wise. Names and values stay the
/// caller's: a copy of the client secret would have to be cleansed. What the views look at has to outlive the map, so
/// write it where it is used and give it no name.
using Parameters = std::map<std::string_view, std::string_view>;

/// "name=value" pairs joined by "&", the values percent-encoded: the body of a form.
std::string WriteForm(const Parameters &parameters);

/// The same behind a "?": the query of a URL.
std::string WriteQuery(const Parameters &parameters);

}  // namespace TAVO::SSO

#endif
