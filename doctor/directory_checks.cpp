// The conversion of domain names: the stand-in's table, and the machine's directory.
#include <sso/limits.h>

#include <boost/algorithm/string/case_conv.hpp>
#include <boost/algorithm/string/predicate.hpp>
#include <boost/algorithm/string/replace.hpp>
#include <boost/algorithm/string/trim.hpp>

#include "doctor/checks.h"
#include "doctor/file_text.h"
#include "doctor/settings_file.h"
#include "doctor/watch.h"
#include "platform/platform.h"
#include "platform/standin/domain_table.h"

namespace Doctor {

namespace {

using TAVO::Platform::kDomainTable;

constexpr char kTableID[] = "directory.table";
constexpr char kTableSubject[] = "table of domains";
constexpr std::size_t kMostShown = 5;

struct Conversion {
    std::string name;  // DOMAIN\user; empty if it failed
    std::string log;   // of the platform
};

/// Converts a name in the form that a login passes: the domain in capitals, and the size without the NUL.
Conversion Convert(Report &report, const std::string &user, const std::string &domain) {
    char buffer[TAVO::SSO::kPlatformBuffer] = {};
    const std::string name = boost::to_upper_copy(domain) + '\\' + user;
    const bool isConverted = TAVOWinsUserNameFqdn2Netbios(name.c_str(), buffer, sizeof buffer - 1) >= 0;
    std::string log;
    for (const std::string &line : TakeLogLines()) {
        report.Detail("log: " + line);
        log += (log.empty() ? "" : "; ") + MessageOf(line);
    }
    return {isConverted ? std::string(buffer) : "", log};
}

/// Reads the table with the stand-in's parser.
SettingsFile ReadTable(RunAs runAs) {
    SettingsFile file = ReadTextFile(kDomainTable, runAs);
    if (!file.problem.empty()) {
        return file;
    }
    std::string errors;
    try {
        file.content = TAVO::Platform::ParseDomainTable(file.text, &errors);
    } catch (const Json::Exception &) {
        errors = "nested too deeply";
    }
    if (!file.content.isObject()) {
        const TextProblem mistake = FindMistake(file.text);
        file.content = Json::Value();
        boost::trim_if(errors, boost::is_any_of("* \n"));
        file.problem = file.path + ' ' +
                       (errors.empty()         ? "is JSON, but not an object"
                        : mistake.what.empty() ? "is not JSON: " + errors
                                               : mistake.what);
        file.remedy = mistake.what.empty() ? R"(Write an object: {"corp.example.net": "CORP"})" : mistake.remedy;
    }
    return file;
}

/// Returns the first domain without a usable NetBIOS name.
std::string FindUnnamed(const Json::Value &table) {
    for (const std::string &domain : table.getMemberNames()) {
        if (!table[domain].isString() || table[domain].asString().empty()) {
            return domain;
        }
    }
    return {};
}

std::string Describe(const Json::Value &table) {
    std::string text = "domains: " + std::to_string(table.size());
    std::size_t shown = 0;
    for (const std::string &domain : table.getMemberNames()) {
        if (shown++ == kMostShown) {
            return text + ", ...";
        }
        text += ", " + domain + " is " + Quoted(table[domain].asString());
    }
    return text;
}

SettingsFile CheckTable(Report &report, RunAs runAs) {
    SettingsFile table = ReadTable(runAs);
    if (table.isMissing) {
        report.Note(kTableID, kTableSubject, table.problem + "; the directory converts all domains");
        return table;
    }
    if (!table.problem.empty()) {
        report.Finding(kTableID, kTableSubject, table.problem, table.remedy);
        return table;
    }
    ReportText(report, "directory", table);
    ReportRights(report, "directory.rights", table, false);
    const std::string unnamed = FindUnnamed(table.content);
    if (unnamed.empty()) {
        report.Good(kTableID, kTableSubject, Describe(table.content));
    } else {
        report.Finding(kTableID, kTableSubject, Quoted(unnamed) + " has no NetBIOS name",
                       "Write its name in quotation marks, or remove the line.");
    }
    return table;
}

/// Converts a domain that does not exist (RFC 6761, section 6.4). The platform's log shows whether a directory answers.
void CheckSource(Report &report, const SettingsFile &table) {
    constexpr char kID[] = "directory.source";
    constexpr char kSubject[] = "directory";
    const std::string log = Convert(report, "user", "tavosso-doctor.invalid").log;
    if (boost::ends_with(log, "winbindd does not know it")) {
        report.Good(kID, kSubject, "winbindd answers");
        return;
    }
    if (log.empty()) {
        report.Note(kID, kSubject, "the platform does not log whether one answers",
                    "Test a user: tavosso-doctor --domain USER@DOMAIN");
        return;
    }
    // The test domain is not the subject.
    const std::string reason = log.substr(log.rfind(", and ") == std::string::npos ? 0 : log.rfind(", and ") + 6);
    if (!table.problem.empty() && !table.isMissing) {
        report.NotChecked(kID, kSubject, "the table cannot be read, and " + reason);
    } else if (table.content.empty()) {
        report.Finding(kID, kSubject, "no domain can be converted: the table is empty or missing, and " + reason,
                       RemedyForDomain("corp.example.net"));
    } else {
        report.Note(kID, kSubject, "only the domains of the table are converted: " + reason);
    }
}

void CheckDomain(Report &report, const std::string &domainOrUser) {
    constexpr char kID[] = "directory.domain";
    const std::size_t at = domainOrUser.find('@');
    const bool isUser = at != std::string::npos;
    const std::string domain = isUser ? domainOrUser.substr(at + 1) : domainOrUser;
    const std::string user = isUser ? domainOrUser.substr(0, at) : "user";
    const std::string subject = "domain " + domain;
    const Conversion conversion = Convert(report, user, domain);
    if (conversion.name.empty()) {
        report.Finding(kID, subject, "is not converted" + (conversion.log.empty() ? "" : ": " + conversion.log),
                       RemedyForDomain(domain));
        return;
    }
    const std::string source = TAVO::Platform::FindInDomainTable(domain) ? "the table" : "the directory (winbindd)";
    const std::string converted = isUser ? conversion.name : conversion.name.substr(0, conversion.name.find('\\'));
    report.Good(kID, subject, "is " + Quoted(converted) + ", by " + source);
    report.Result(domainOrUser + (isUser ? " signs in as " : " is ") + Quoted(converted) + ", by " + source + ".");
}

}  // namespace

std::string RemedyForDomain(const std::string &domain) {
    return "Join the domain and start winbindd, or add the domain with its NetBIOS name to " +
           std::string(kDomainTable) + ": {" + Quoted(domain) +
           R"(: "NAME"}. The domain's administrator knows NAME; on a Windows member of the domain, run: echo %USERDOMAIN%)";
}

void CheckDirectory(Report &report, const std::optional<std::string> &domainOrUser, RunAs runAs) {
    report.Section("Directory");
    TakeLogLines();
    CheckSource(report, CheckTable(report, runAs));
    if (domainOrUser) {
        CheckDomain(report, *domainOrUser);
    } else {
        report.NotChecked("directory.domain", "domain of the users", "name a user with --domain USER@DOMAIN");
    }
}

}  // namespace Doctor
