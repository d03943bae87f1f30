#include "tests/fuzz/domains.h"

#include <strings.h>

#include <algorithm>

#include "tests/fuzz/oracle.h"
#include "tests/support/conversion.h"
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

/// As shown in a log line.
std::string Shown(std::string domain) {
    domain.resize(std::min<std::size_t>(domain.size(), 255));
    for (char &c : domain) {
        c = (static_cast<unsigned char>(c) < ' ') || c == '\x7f' ? '?' : c;
    }
    return domain;
}

}  // namespace

std::vector<std::string> Lines(const Conversion &conversion) {
    return conversion.line ? std::vector{*conversion.line} : std::vector<std::string>();
}

void WriteDomainTable() { Test::WriteFile(Test::kDomainTable, kTable); }

Conversion ToNetBIOS(const std::string &name, std::size_t longest) {
    const std::string text = UpToNUL(name);
    const std::size_t backslash = text.find('\\');
    if (backslash == std::string::npos) {
        return {std::nullopt, "platform:N name without a domain"};
    }
    const std::string domain = text.substr(0, backslash);
    if (backslash + 1 == text.size()) {
        return {std::nullopt, "platform:N name of domain '" + Shown(domain) + "' without a user"};
    }
    const std::optional<std::string> netBIOSName = NetBIOSName(domain);
    if (!netBIOSName) {
        return {std::nullopt, domain.empty() ? Test::EmptyDomain() : Test::UnknownDomain(Shown(domain))};
    }
    const std::string converted = *netBIOSName + text.substr(backslash);
    if (converted.size() > longest) {
        return {std::nullopt, "platform:N name is too long for its buffer"};
    }
    return {converted, std::nullopt};
}

}  // namespace Fuzz
