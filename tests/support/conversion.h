#ifndef TAVOSSO_TESTS_SUPPORT_CONVERSION_H
#define TAVOSSO_TESTS_SUPPORT_CONVERSION_H

#include <string>

namespace Test {

/// The log line for a domain that is not in the table. winbindd is not available in the private namespaces.
std::string UnknownDomain(const std::string &domain);

/// The log line for a name with an empty domain. winbindd is not asked.
std::string EmptyDomain();

}  // namespace Test

#endif
