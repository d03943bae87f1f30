#include "doctor/settings_file.h"

#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <boost/algorithm/string/predicate.hpp>
#include <cerrno>
#include <fstream>
#include <numeric>
#include <sstream>
#include <system_error>

#include "doctor/file_text.h"
#include "doctor/rights.h"

namespace Doctor {

namespace {

// More edits make another name.
constexpr std::size_t kFarthestSlip = 4;
constexpr std::size_t kLongestKey = 64;

/// Returns the Levenshtein distance. A name that is longer than every key is far from all of them.
std::size_t Distance(const std::string &name, const std::string &key) {
    std::array<std::size_t, kLongestKey + 1> row{};
    if (name.size() > kLongestKey || key.size() > kLongestKey) {
        return kLongestKey;
    }
    std::iota(row.begin(), row.end(), 0);
    for (const char c : name) {
        std::size_t diagonal = row[0]++;
        for (std::size_t i = 0; i < key.size(); ++i) {
            const std::size_t exchanged = diagonal + (c == key[i] ? 0 : 1);
            diagonal = row[i + 1];
            row[i + 1] = std::min({exchanged, row[i] + 1, row[i + 1] + 1});
        }
    }
    return row[key.size()];
}

std::string NearestOf(const std::vector<std::string> &known, const std::string &name) {
    const auto distance = [&](const std::string &other) {
        return boost::iequals(name, other) ? 0 : Distance(name, other);
    };
    const auto nearest = std::min_element(known.begin(), known.end(),
                                          [&](const auto &a, const auto &b) { return distance(a) < distance(b); });
    return distance(*nearest) <= kFarthestSlip ? *nearest : "";
}

/// Describes an error of the JSON reader. Omits the reader's message if it quotes the file, which may hold the secret.
std::string Describe(const std::string &text, const Json::Reader::StructuredError &error) {
    const auto offset = std::min<std::size_t>(static_cast<std::size_t>(error.offset_start), text.size());
    const bool quotes = boost::contains(error.message, "is not a number");
    return PositionOf(text, offset) + ": " + (quotes ? "not a number" : error.message);
}

// The library's JSON reader.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations"

std::string ProblemOf(const std::string &text, Json::Value &content) {
    Json::Reader reader;
    try {
        if (reader.parse(text.data(), text.data() + text.size(), content, true)) {
            return content.isObject() ? "" : "is JSON, but not an object";
        }
    } catch (const Json::Exception &) {
        return "is not JSON: nested too deeply";
    }
    const auto errors = reader.getStructuredErrors();
    return "is not JSON" + (errors.empty() ? "" : ": " + Describe(text, errors.front()));
}

#pragma GCC diagnostic pop

/// What to do if the rights of this process do not suffice to read a file. `refusing` is the file or a folder above it.
std::string RemedyForRefusal(const std::string &path, const std::string &refusing, RunAs runAs) {
    if (runAs == RunAs::kOrdinaryUser) {
        return "Run: sudo tavosso-doctor";
    }
    if (runAs == RunAs::kRoot) {
        return "Compare: namei -l " + path +
               ". If the modes allow root, a security module refuses: check aa-status, getenforce and the system log.";
    }
    if (refusing != path) {
        return "Run: sudo chmod a+rx " + refusing;
    }
    return path == kAzureFile || path == kWebSphereFile ? kStartAsRoot : "Run: sudo chmod a+r " + path;
}

void ExplainError(SettingsFile &file, int error, RunAs runAs) {
    const std::string page = "tavosso-" + file.path.substr(file.path.rfind('/') + 1);
    const std::string write = "Write the file. For an example, run: man 5 " + page;
    struct stat status = {};
    const bool isLink = lstat(file.path.c_str(), &status) == 0 && S_ISLNK(status.st_mode);
    if (error == ENOENT) {
        file.isMissing = !isLink;
        file.problem = file.path + (isLink ? " is a link to a file that is missing" : " is missing");
        file.remedy = isLink ? "Run: ls -l " + file.path + ". Restore the file, or remove the link. " + write : write;
        return;
    }
    file.problem = file.path + " cannot be read: " + std::generic_category().message(error);
    file.remedy = "Run: ls -ld " + file.path + ". It must be a regular file. Move it away: sudo mv " + file.path + " " +
                  file.path + ".old. " + write;
    if (error == EACCES) {
        const std::string refusing = WhatRefuses(file.path);
        if (stat(refusing.c_str(), &status) == 0) {
            file.problem += "; " + refusing + " refuses: " + DescribeRights(status);
        }
        file.remedy = RemedyForRefusal(file.path, refusing, runAs);
    }
}

}  // namespace

SettingsFile ReadTextFile(const std::string &path, RunAs runAs) {
    SettingsFile file;
    file.path = path;
    errno = 0;
    const std::ifstream stream(path, std::ios::binary);
    std::ostringstream content;
    content << stream.rdbuf();  // does not throw if it is a directory
    if (errno != 0) {
        ExplainError(file, errno, runAs);
    }
    file.text = content.str();
    return file;
}

SettingsFile ReadSettingsFile(const std::string &path, RunAs runAs) {
    SettingsFile file = ReadTextFile(path, runAs);
    if (!file.problem.empty()) {
        return file;
    }
    const std::string problem = ProblemOf(file.text, file.content);
    if (!problem.empty()) {
        const TextProblem mistake = FindMistake(file.text);
        file.content = Json::Value();
        file.problem = path + ' ' + (mistake.what.empty() ? problem : mistake.what);
        file.remedy = mistake.what.empty() ? "Correct this place. The library treats the file as missing."
                                           : mistake.remedy + " The library treats the file as missing.";
    }
    return file;
}

void ReportText(Report &report, const std::string &group, const SettingsFile &file) {
    const TextProblem byte = FindInvalidByte(file.text);
    if (!byte.what.empty()) {
        report.Finding(group + ".encoding", "encoding", file.path + ", " + byte.what, byte.remedy);
    }
    const TextProblem key = FindDuplicateKey(file.text);
    if (!key.what.empty()) {
        report.Finding(group + ".duplicate_key", "repeated key", file.path + ", " + key.what, key.remedy);
    }
}

void ReportUnknownKeys(Report &report, const std::string &id, const SettingsFile &file,
                       const std::vector<std::string> &known) {
    for (const std::string &name : file.content.getMemberNames()) {
        if (std::find(known.begin(), known.end(), name) != known.end()) {
            continue;
        }
        const std::string nearest = NearestOf(known, name);
        if (nearest.empty()) {
            report.Note(id, "unknown key", Quoted(name) + " is ignored");
        } else {
            report.Finding(id, "unknown key", Quoted(name) + " is ignored: it is not a key",
                           "Rename it to " + Quoted(nearest) + " in " + file.path + ". Keys are case-sensitive.");
        }
    }
}

void ReportRights(Report &report, const std::string &id, const SettingsFile &file, bool holdsSecret) {
    constexpr char kSubject[] = "rights";
    struct stat status = {};
    if (stat(file.path.c_str(), &status) != 0) {
        return;  // a finding of the file
    }
    if (holdsSecret && (status.st_mode & (S_IRGRP | S_IROTH)) != 0) {
        report.Finding(id, kSubject,
                       file.path + ": " + DescribeRights(status) + ": other users can read the client secret",
                       "Run: sudo chmod 600 " + file.path + ". Then request a new client secret from the provider.");
        return;
    }
    std::vector<std::string> paths = FoldersAbove(file.path);
    paths.push_back(file.path);
    for (const std::string &path : paths) {
        if (stat(path.c_str(), &status) == 0 && !IsChangedByRootOnly(status)) {
            report.Finding(id, kSubject, path + ": " + DescribeRights(status) + ": users other than root can change it",
                           std::string("Run: sudo chown root ").append(path).append("; sudo chmod go-w ").append(path));
            return;
        }
    }
    report.Good(id, kSubject, DescribeRights(status));
}

}  // namespace Doctor
