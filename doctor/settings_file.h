#ifndef TAVOSSO_DOCTOR_SETTINGS_FILE_H
#define TAVOSSO_DOCTOR_SETTINGS_FILE_H

#include <json/json.h>

#include <string>
#include <vector>

#include "doctor/report.h"

// A configuration file: whether it can be read, and what stands in it beside what should.
namespace Doctor {

constexpr char kProfileFile[] = "/usr/tavo/etc/ssoclient/profile.conf";
constexpr char kAzureFile[] = "/usr/tavo/etc/ssoclient/azure.conf";
constexpr char kWebSphereFile[] = "/usr/tavo/etc/ssoclient/websphere.conf";
constexpr char kDomainTable[] = "/usr/tavo/etc/domains.conf";

struct SettingsFile {
    std::string path;
    Json::Value content;  // an object; null where there is a problem
    std::string problem;  // why the library cannot use the file
    std::string remedy;
    bool isRefused = false;  // it is there, and these ids may not read it
};

/// Reads as the library does, with its JSON reader and with the ids of this process.
SettingsFile ReadSettingsFile(const std::string &path);

/// A note for each key that the library ignores, with the known one that it may have been meant for.
void ReportUnknownKeys(Report &report, const std::string &id, const SettingsFile &file,
                       const std::vector<std::string> &known);

/// Whether others than its owner can read a secret in it, or anyone but root can change it.
void ReportRights(Report &report, const std::string &id, const SettingsFile &file, bool holdsSecret);

}  // namespace Doctor

#endif
