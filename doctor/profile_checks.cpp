// The profile file.
#include <unistd.h>

#include "doctor/checks.h"
#include "doctor/settings_file.h"

namespace Doctor {

namespace {

constexpr char kEnable[] = "sso_enable";
constexpr char kName[] = "sso_profile";

std::string Describe(const Json::Value &file, const char *key) {
    if (!file.isMember(key)) {
        return "is missing";
    }
    switch (file[key].type()) {
        case Json::booleanValue:
            return file[key].asBool() ? "is true" : "is false";
        case Json::stringValue:
            return "is the string " + Quoted(file[key].asString());
        case Json::nullValue:
            return "is null";
        case Json::arrayValue:
            return "is a list";
        case Json::objectValue:
            return "is an object";
        default:
            return "is a number";
    }
}

}  // namespace

std::optional<Profile> CheckProfile(Report &report, RunAs runAs) {
    report.Section("Profile");
    const SettingsFile file = ReadSettingsFile(kProfileFile, runAs);
    const std::optional<std::string> refusal = RefusalOfProfile();
    const std::string library = refusal.value_or("");
    if (!file.problem.empty()) {
        report.Add({"profile.file", "file", Mark::kFinding, file.problem, file.remedy, library});
        return std::nullopt;
    }
    report.Good("profile.file", "file", file.path + " is JSON, and user " + std::to_string(geteuid()) + " can read it");
    ReportText(report, "profile", file);
    ReportUnknownKeys(report, "profile.unknown_key", file, {kEnable, kName});
    ReportRights(report, "profile.rights", file, false);

    const bool isOn = file.content[kEnable].isBool() && file.content[kEnable].asBool();
    if (!isOn) {
        report.Add({"profile.sso_enable", kEnable, Mark::kFinding, Describe(file.content, kEnable),
                    "Set \"sso_enable\" to true in " + file.path + ", without quotation marks.", library});
        return std::nullopt;
    }
    report.Good("profile.sso_enable", kEnable, Describe(file.content, kEnable));
    if (refusal) {
        report.Add({"profile.sso_profile", kName, Mark::kFinding, Describe(file.content, kName),
                    R"(Set "sso_profile" to "azure" or "websphere", in lower case.)", library});
        return std::nullopt;
    }
    const std::string name = TAVO::SSO::SSOProfile().GetSSOProfile();
    report.Good("profile.sso_profile", kName, "is the string " + Quoted(name));
    return ProfileNamed(name);
}

}  // namespace Doctor
