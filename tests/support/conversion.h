#ifndef TAVOSSO_TESTS_SUPPORT_CONVERSION_H
#define TAVOSSO_TESTS_SUPPORT_CONVERSION_H

#include <string>

namespace Test {

/// The log line on a domain that stands in no table, where nobody answers at winbindd's place: so it is in the private
/// namespaces that the tests run in.
std::string UnknownDomain(const std::string &domain);

/// The same on a name whose domain is empty, about which winbindd is not asked.
std::string EmptyDomain();

}  // namespace Test

#endif
