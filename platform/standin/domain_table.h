#ifndef TAVOSSO_PLATFORM_STANDIN_DOMAIN_TABLE_H
#define TAVOSSO_PLATFORM_STANDIN_DOMAIN_TABLE_H

#include <optional>
#include <string>

namespace TAVO::Platform {

/// The NetBIOS name that the administrator's table gives a domain, whose case does not matter; nothing where it gives
/// none, and where there is no table or none that can be read. Throws where memory runs out, and where the JSON library
/// gives up over a table that is nested too deeply, which it does not tell apart.
std::optional<std::string> FindInDomainTable(const std::string &domain);

}  // namespace TAVO::Platform

#endif
