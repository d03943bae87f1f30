#include "doctor/settings_file.h"

#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <boost/algorithm/string/predicate.hpp>
#include <cerrno>
#include <cstring>
#include <fstream>
#include <numeric>
#include <sstream>

namespace Doctor {

namespace {

// Names that are further from each other were hardly meant to be the same.
constexpr std::size_t kFarthestSlip = 4;
constexpr std::size_t kLongestKey = 64;

/// How many characters have to be put in, taken away or exchanged (the Levenshtein distance). A name that is longer
/// than any key is far from all of them.
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

/// Where a reader of the file has to look. The reader's own message is left out where it quotes the file: that may be
/// the secret.
std::string Position(const std::string &text, const Json::Reader::StructuredError &error) {
    const auto offset = std::min<std::size_t>(static_cast<std::size_t>(error.offset_start), text.size());
    const auto end = text.begin() + static_cast<std::ptrdiff_t>(offset);
    const auto line = 1 + std::count(text.begin(), end, '\n');
    const std::size_t lineBreak = offset == 0 ? std::string::npos : text.rfind('\n', offset - 1);
    const std::size_t column = lineBreak == std::string::npos ? offset + 1 : offset - lineBreak;
    const bool quotes = boost::contains(error.message, "is not a number");
    return "line " + std::to_string(line) + ", column " + std::to_string(column) + ": " +
           (quotes ? "this is no number" : error.message);
}

// What the library parses its files with, and so what decides whether it can.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations"

std::string ProblemOf(const std::string &text, Json::Value &content) {
    Json::Reader reader;
    try {
        if (reader.parse(text.data(), text.data() + text.size(), content, true)) {
            return content.isObject() ? "" : "is JSON, but no object";
        }
    } catch (const Json::Exception &) {
        return "is no JSON: nested too deeply";
    }
    const auto errors = reader.getStructuredErrors();
    return "is no JSON" + (errors.empty() ? "" : ": " + Position(text, errors.front()));
}

#pragma GCC diagnostic pop

}  // namespace

SettingsFile ReadSettingsFile(const std::string &path) {
    SettingsFile file{path, Json::Value(), "", "", false};
    errno = 0;
    const std::ifstream stream(path, std::ios::binary);
    std::ostringstream content;
    content << stream.rdbuf();  // which throws nothing where it is a directory
    if (errno != 0) {
        const bool isMissing = errno == ENOENT;
        file.isRefused = errno == EACCES;
        file.problem = path + (isMissing ? " is missing" : std::string(" cannot be read: ") + std::strerror(errno));
        file.remedy =
            isMissing ? "write it; its manual page has an example: man 5 tavosso-" + path.substr(path.rfind('/') + 1)
                      : "look at what it is, who owns it, and who may read it: ls -l " + path;
        return file;
    }
    const std::string problem = ProblemOf(content.str(), file.content);
    if (!problem.empty()) {
        file.content = Json::Value();
        file.problem = path + " " + problem;
        file.remedy = "mend the file at that place; the library treats it as if it were missing";
    }
    return file;
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
            report.Finding(id, "unknown key", Quoted(name) + " is ignored: no key has this name",
                           "call it " + Quoted(nearest) + ", if that was meant; capitals count");
        }
    }
}

void ReportRights(Report &report, const std::string &id, const SettingsFile &file, bool holdsSecret) {
    struct stat status = {};
    if (stat(file.path.c_str(), &status) != 0) {
        return;  // which the check of the file has already told
    }
    constexpr mode_t kOthersRead = S_IRGRP | S_IROTH;
    constexpr mode_t kOthersWrite = S_IWGRP | S_IWOTH;
    char mode[8];
    std::snprintf(mode, sizeof mode, "%04o", static_cast<unsigned int>(status.st_mode & 07777));
    const std::string found = std::string("mode ") + mode + ", owner " + std::to_string(status.st_uid);
    if (holdsSecret && (status.st_mode & kOthersRead) != 0) {
        report.Finding(id, "rights", found + ": others can read the client secret",
                       "chmod 600 " + file.path + ", and get a new secret from the provider");
    } else if (status.st_uid != 0 || (status.st_mode & kOthersWrite) != 0) {
        report.Finding(id, "rights", found + ": others than root can change it",
                       "chown root " + file.path + "; chmod go-w " + file.path);
    } else {
        report.Good(id, "rights", found);
    }
}

}  // namespace Doctor
