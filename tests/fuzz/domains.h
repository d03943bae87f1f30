#ifndef TAVOSSO_TESTS_FUZZ_DOMAINS_H
#define TAVOSSO_TESTS_FUZZ_DOMAINS_H

#include <optional>
#include <string>
#include <vector>

// The domain table of the platform's stand-in.
namespace Fuzz {

void WriteDomainTable();

/// The expected conversion of DOMAIN\user: a name, or the log line of the failure.
struct Conversion {
    std::optional<std::string> name;
    std::optional<std::string> line;
};
Conversion ToNetBIOS(const std::string &name, std::size_t longest);

/// The expected log lines, for RequireLog.
std::vector<std::string> Lines(const Conversion &conversion);

}  // namespace Fuzz

#endif
