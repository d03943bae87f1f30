#ifndef TAVOSSO_PLATFORM_STANDIN_DOMAIN_TABLE_H
#define TAVOSSO_PLATFORM_STANDIN_DOMAIN_TABLE_H

#include <json/json.h>

#include <optional>
#include <string>

namespace TAVO::Platform {

/// A JSON object: DNS domain names and their NetBIOS names.
constexpr char kDomainTable[] = "/usr/tavo/etc/domains.conf";

/// Parses a table. Accepts a byte-order mark and a trailing comma. Returns null and the parser's messages if it is not
/// JSON. Throws a Json::Exception if it is nested too deeply.
Json::Value ParseDomainTable(const std::string &text, std::string *errors);

/// Returns the domain's NetBIOS name from the administrator's table, ignoring the domain's case. Returns nothing if the
/// table has no such domain, is missing, unreadable or not JSON. Throws if memory runs out or the table is nested too
/// deeply.
std::optional<std::string> FindInDomainTable(const std::string &domain);

}  // namespace TAVO::Platform

#endif
