#include "tests/fuzz/domains.h"

#include <strings.h>

#include "tests/fuzz/oracle.h"
#include "tests/support/files.h"

namespace Fuzz {

namespace {

constexpr char kTable[] = R"({"corp.example.net": "CORP", "Lab.Example": "LAB", "unnamed": "", "number": 5})";

std::optional<std::string> NetBIOSName(const std::string &domain) {
    if (domain.find('\0') != std::string::npos) {
        return std::nullopt;
    }
    if (strcasecmp(domain.c_str(), "corp.example.net") == 0) {
        return "CORP";
    }
    return strcasecmp(domain.c_str(), "lab.example") == 0 ? std::optional("LAB") : std::nullopt;
}

}  // namespace

void WriteDomainTable() { Test::WriteFile(Test::kDomainTable, kTable); }

std::optional<std::string> ToNetBIOS(const std::string &name, std::size_t longest) {
    const std::string text = UpToNUL(name);
    const std::size_t backslash = text.find('\\');
    const std::optional<std::string> domain =
        backslash == std::string::npos ? std::nullopt : NetBIOSName(text.substr(0, backslash));
    const std::optional<std::string> converted = domain ? std::optional(*domain + text.substr(backslash)) : domain;
    return converted && converted->size() <= longest ? converted : std::nullopt;
}

}  // namespace Fuzz
