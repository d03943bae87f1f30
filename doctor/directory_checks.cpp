// The conversion of domain names: the platform's table, and whatever it asks beside that.
#include <sso/limits.h>

#include <algorithm>
#include <boost/algorithm/string/case_conv.hpp>
#include <boost/algorithm/string/predicate.hpp>
#include <filesystem>

#include "doctor/checks.h"
#include "doctor/settings_file.h"
#include "doctor/watch.h"
#include "platform/platform.h"

namespace Doctor {

namespace {

constexpr char kUser[] = "\\user";
constexpr std::size_t kMostShown = 5;  // of the table, for whoever may see a slip in it

struct Conversion {
    std::string domain;  // empty where it failed
    std::string log;     // what the platform wrote about that
};

Conversion Convert(Report &report, const std::string &domain) {
    char buffer[TAVO::SSO::kPlatformBuffer] = {};
    // As a login asks: the domain in capitals, the room for the NUL not counted.
    const std::string name = boost::to_upper_copy(domain) + kUser;
    const bool isConverted = TAVOWinsUserNameFqdn2Netbios(name.c_str(), buffer, sizeof buffer - 1) >= 0;
    std::string log;
    for (const std::string &line : TakeLogLines()) {
        report.Detail("log: " + line);
        log += (log.empty() ? "" : "; ") + MessageOf(line);
    }
    const std::string converted = buffer;
    return {isConverted ? converted.substr(0, converted.find('\\')) : "", log};
}

bool IsInTable(const Json::Value &table, const std::string &domain) {
    const std::vector<std::string> names = table.getMemberNames();
    return std::any_of(names.begin(), names.end(), [&](const auto &name) { return boost::iequals(name, domain); });
}

/// The administrator's own table, which a machine need not have.
SettingsFile CheckTable(Report &report) {
    constexpr char kID[] = "directory.table";
    constexpr char kSubject[] = "table of domains";
    SettingsFile table = ReadSettingsFile(kDomainTable);
    if (!std::filesystem::exists(kDomainTable)) {
        report.Note(kID, kSubject, std::string(kDomainTable) + " is not there: the directory alone is asked");
        return table;
    }
    if (!table.problem.empty()) {
        report.Finding(kID, kSubject, table.problem, table.remedy);
        return table;
    }
    for (const std::string &name : table.content.getMemberNames()) {
        if (!table.content[name].isString() || table.content[name].asString().empty()) {
            report.Finding(kID, kSubject, Quoted(name) + " has no NetBIOS name",
                           "write its name as a text, or take the line out");
            return table;
        }
    }
    std::string found = std::string(kDomainTable) + " names " + std::to_string(table.content.size());
    std::size_t left = kMostShown;
    for (const std::string &name : table.content.getMemberNames()) {
        if (left-- == 0) {
            found += ", ...";
            break;
        }
        found += ", " + name + " as " + Quoted(table.content[name].asString());
    }
    report.Good(kID, kSubject, found);
    return table;
}

const char kHowToTell[] =
    R"(join the domain and start winbindd, or write it into /usr/tavo/etc/domains.conf: {"corp.example.net": "CORP"})";

/// Whether there is a directory: the platform logs why it has no name for a domain that nobody has (RFC 6761, section
/// 6.4).
void CheckSource(Report &report, const SettingsFile &table) {
    constexpr char kID[] = "directory.source";
    constexpr char kSubject[] = "directory";
    const std::string kTested = "; the log about a made-up domain: ";
    const std::string log = Convert(report, "tavosso-doctor.invalid").log;
    if (boost::ends_with(log, "winbindd does not know it")) {
        report.Good(kID, kSubject, "winbindd answers");
    } else if (log.empty()) {
        report.Note(kID, kSubject, "the platform does not log whether one answers", "test a domain: --domain NAME");
    } else if (table.content.empty()) {
        report.Finding(kID, kSubject, "no domain can be converted" + kTested + log, kHowToTell);
    } else {
        report.Note(kID, kSubject, "only the domains of the table are converted" + kTested + log);
    }
}

}  // namespace

void CheckDirectory(Report &report, const std::optional<std::string> &domainOrUser) {
    report.Section("Directory");
    TakeLogLines();
    const SettingsFile table = CheckTable(report);
    CheckSource(report, table);
    constexpr char kID[] = "directory.domain";
    if (domainOrUser) {
        const std::string domain = domainOrUser->substr(domainOrUser->find('@') + 1);
        const std::string subject = "domain " + domain;
        const Conversion conversion = Convert(report, domain);
        if (conversion.domain.empty()) {
            report.Add({kID, subject, Mark::kFinding,
                        "is not converted" + (conversion.log.empty() ? "" : ": " + conversion.log), kHowToTell, ""});
        } else {
            report.Good(kID, subject,
                        "is " + Quoted(conversion.domain) + ", by " +
                            (IsInTable(table.content, domain) ? "the table" : "the directory (winbindd)"));
        }
        return;
    }
    report.NotChecked(kID, "a domain of the users", "tell one with --domain NAME");
}

}  // namespace Doctor
