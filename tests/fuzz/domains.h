#ifndef TAVOSSO_TESTS_FUZZ_DOMAINS_H
#define TAVOSSO_TESTS_FUZZ_DOMAINS_H

#include <optional>
#include <string>
#include <vector>

// The domains that the platform's stand-in knows in these programs.
namespace Fuzz {

void WriteDomainTable();

/// What must come of DOMAIN\user: a name, or the line that tells why not, also for want of room.
struct Conversion {
    std::optional<std::string> name;
    std::optional<std::string> line;
};
Conversion ToNetBIOS(const std::string &name, std::size_t longest);

/// For RequireLog.
std::vector<std::string> Lines(const Conversion &conversion);

}  // namespace Fuzz

#endif
