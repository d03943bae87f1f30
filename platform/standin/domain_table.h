#ifndef TAVOSSO_PLATFORM_STANDIN_DOMAIN_TABLE_H
#define TAVOSSO_PLATFORM_STANDIN_DOMAIN_TABLE_H

#include <optional>
#include <string>

namespace TAVO::Platform {

/// Returns the domain's NetBIOS name from the administrator's table, ignoring the domain's case. Returns nothing if the
/// table has no such domain, is missing, unreadable or not JSON. Throws if memory runs out or the table is nested too
/// deeply.
std::optional<std::string> FindInDomainTable(const std::string &domain);

}  // namespace TAVO::Platform

#endif
