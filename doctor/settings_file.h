#ifndef TAVOSSO_DOCTOR_SETTINGS_FILE_H
#define TAVOSSO_DOCTOR_SETTINGS_FILE_H

#include <json/json.h>

#include <string>
#include <vector>

#include "doctor/report.h"

// A configuration file: whether it can be read, its rights and its keys.
namespace Doctor {

constexpr char kProfileFile[] = "/usr/tavo/etc/ssoclient/profile.conf";
constexpr char kAzureFile[] = "/usr/tavo/etc/ssoclient/azure.conf";
constexpr char kWebSphereFile[] = "/usr/tavo/etc/ssoclient/websphere.conf";

/// Whose rights the doctor has.
enum class RunAs {
    kRoot,
    kChosenUser,    // of --user
    kOrdinaryUser,  // who forgot sudo
};

struct SettingsFile {
    std::string path;
    std::string text;
    Json::Value content;  // an object; null where there is a problem
    bool isMissing = false;
    std::string problem;  // why the library cannot use the file, or empty
    std::string remedy;
};

/// The remedy if a program without root's rights reads the client's file.
constexpr char kStartAsRoot[] =
    "Start the programs of the web server as root, or with root as saved user and group id.";

/// Reads the text only.
SettingsFile ReadTextFile(const std::string &path, RunAs runAs);

/// Reads with the library's JSON reader and the ids of this process.
SettingsFile ReadSettingsFile(const std::string &path, RunAs runAs);

/// Reports bytes that are not UTF-8, and repeated keys. `group` begins the ids.
void ReportText(Report &report, const std::string &group, const SettingsFile &file);

/// Reports each key that the library ignores, with the key of a similar name.
void ReportUnknownKeys(Report &report, const std::string &id, const SettingsFile &file,
                       const std::vector<std::string> &known);

/// Reports whether other users can read a secret in the file, or change the file or a folder above it.
void ReportRights(Report &report, const std::string &id, const SettingsFile &file, bool holdsSecret);

}  // namespace Doctor

#endif
