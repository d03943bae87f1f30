#ifndef TAVOSSO_TESTS_FUZZ_DOMAINS_H
#define TAVOSSO_TESTS_FUZZ_DOMAINS_H

#include <optional>
#include <string>

// The domains that the platform's stand-in knows in these programs.
namespace Fuzz {

void WriteDomainTable();

/// What the conversion must make of DOMAIN\user; nothing where it must fail, also for want of room.
std::optional<std::string> ToNetBIOS(const std::string &name, std::size_t longest);

}  // namespace Fuzz

#endif
