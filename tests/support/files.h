#ifndef TAVOSSO_TESTS_SUPPORT_FILES_H
#define TAVOSSO_TESTS_SUPPORT_FILES_H

#include <string>

// Files at the appliance's fixed paths. The tests run in private namespaces (tools/private-root), each with its own
// /usr/tavo.
namespace Test {

constexpr char kProfileFile[] = "/usr/tavo/etc/ssoclient/profile.conf";
constexpr char kAzureFile[] = "/usr/tavo/etc/ssoclient/azure.conf";
constexpr char kWebSphereFile[] = "/usr/tavo/etc/ssoclient/websphere.conf";
constexpr char kDomainTable[] = "/usr/tavo/etc/domains.conf";
constexpr char kTrustedAuthorities[] = "/etc/ssl/certs/ca-certificates.crt";

/// Writes a file with mode 0600, and creates its folders.
void WriteFile(const std::string &path, const std::string &content);

/// Empties /usr/tavo.
void RemoveFiles();

}  // namespace Test

#endif
