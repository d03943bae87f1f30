#include "doctor/report.h"

#include <sso/sso.h>

#include <algorithm>
#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/replace.hpp>
#include <boost/algorithm/string/split.hpp>
#include <iostream>
#include <iterator>
#include <utility>

#include "web/text.h"

namespace Doctor {

namespace {

constexpr char kHidden[] = "[hidden]";
constexpr std::size_t kMarkWidth = 7;  // with the blank after it
constexpr std::size_t kSubjectWidth = 30;
constexpr std::size_t kIndent = 9;
constexpr char kLibrary[] = "library: ";
constexpr char kRemedy[] = "do: ";
constexpr std::size_t kLongestText = 1000;
// Shorter texts occur in words by chance.
constexpr std::size_t kShortest = 6;

/// The number of characters of a text in UTF-8.
std::size_t WidthOf(const std::string &text) {
    return static_cast<std::size_t>(
        std::count_if(text.begin(), text.end(), [](char c) { return (static_cast<unsigned char>(c) & 0xc0) != 0x80; }));
}

struct MarkNames {
    const char *forMachines;
    const char *forPeople;
    const char *colour;  // SGR parameters (ECMA-48)
};

MarkNames NamesOf(Mark mark) {
    switch (mark) {
        case Mark::kGood:
            return {"good", "[ ok ]", "32"};
        case Mark::kNote:
            return {"note", "[note]", "33"};
        case Mark::kFinding:
            return {"finding", "[FAIL]", "1;31"};
        case Mark::kNotChecked:
            break;
    }
    return {"not checked", "[ -- ]", "2"};
}

Json::Value ToJson(const Check &check) {
    Json::Value json;
    json["id"] = check.id;
    json["subject"] = check.subject;
    json["mark"] = NamesOf(check.mark).forMachines;
    json["found"] = check.found;
    json["remedy"] = check.remedy;
    json["library"] = check.library;
    return json;
}

}  // namespace

std::string Printable(const std::string &text) { return TAVO::Web::OneLine(text, std::string::npos); }

std::string Quoted(const std::string &text) { return '"' + text + '"'; }

std::string TimeText(std::time_t time, const char *format) {
    char text[sizeof "2026-01-01 00:00:00 UTC"];
    std::tm utc{};
    const bool isTime = gmtime_r(&time, &utc) != nullptr && std::strftime(text, sizeof text, format, &utc) != 0;
    return isTime ? text : std::to_string(time);
}

void WriteJson(const Json::Value &json) {
    Json::StreamWriterBuilder writer;
    writer["indentation"] = "  ";
    std::cout << Json::writeString(writer, json) << '\n';
}

void Report::Hide(const std::string &secret) {
    if (secret.size() >= kShortest) {
        hidden_.push_back(secret);
        hidden_.push_back(TAVO::SSO::URLEncode(secret));
        // Longest first: a secret may begin with another one.
        std::sort(hidden_.begin(), hidden_.end(), [](const auto &a, const auto &b) { return a.size() > b.size(); });
    }
}

std::string Report::Redact(std::string text) const {
    for (const std::string &secret : hidden_) {
        boost::replace_all(text, secret, kHidden);
    }
    // Cut last: part of a secret would not be found.
    return TAVO::Web::OneLine(text, kLongestText);
}

void Report::Section(const std::string &title) { groups_.push_back({title, {}, {}}); }

void Report::Add(Check check) {
    for (std::string *text : {&check.subject, &check.found, &check.remedy, &check.library}) {
        *text = Redact(std::move(*text));
    }
    groups_.back().checks.push_back(std::move(check));
}

void Report::Good(const std::string &id, const std::string &subject, const std::string &found) {
    Add({id, subject, Mark::kGood, found, "", ""});
}

void Report::Note(const std::string &id, const std::string &subject, const std::string &found,
                  const std::string &remedy) {
    Add({id, subject, Mark::kNote, found, remedy, ""});
}

void Report::Finding(const std::string &id, const std::string &subject, const std::string &found,
                     const std::string &remedy) {
    Add({id, subject, Mark::kFinding, found, remedy, ""});
}

void Report::NotChecked(const std::string &id, const std::string &subject, const std::string &why) {
    Add({id, subject, Mark::kNotChecked, why, "", ""});
}

void Report::Detail(const std::string &text) { groups_.back().details.push_back(Redact(text)); }

void Report::Unproved(const std::string &what) { unproved_.push_back(Redact(what)); }

void Report::Result(const std::string &text) { results_.push_back(Redact(text)); }

void Report::Say(const std::string &text) { std::cout << text << std::endl; }

std::vector<Check> Report::ChecksOf(Mark mark) const {
    std::vector<Check> checks;
    for (const Group &group : groups_) {
        std::copy_if(group.checks.begin(), group.checks.end(), std::back_inserter(checks),
                     [&](const Check &check) { return check.mark == mark; });
    }
    return checks;
}

bool Report::HasFindings() const { return !ChecksOf(Mark::kFinding).empty(); }

void Report::PrintMark(Mark mark) const {
    const MarkNames names = NamesOf(mark);
    if (presentation_.hasColours) {
        std::cout << "\033[" << names.colour << 'm' << names.forPeople << "\033[0m";
    } else {
        std::cout << names.forPeople;
    }
    std::cout << ' ';
}

/// Continues a line at `column`. Breaks lines at blanks, because commands and addresses must stay whole.
void Report::PrintWrapped(const std::string &text, std::size_t indent, std::size_t column) const {
    std::vector<std::string> words;
    boost::split(words, text, boost::is_any_of(" "));
    bool isFirst = true;
    for (const std::string &word : words) {
        const std::size_t width = WidthOf(word);
        if (!isFirst && presentation_.width != 0 && column + 1 + width > presentation_.width) {
            std::cout << '\n' << std::string(indent, ' ');
            column = indent;
        } else if (!isFirst) {
            std::cout << ' ';
            ++column;
        }
        std::cout << word;
        column += width;
        isFirst = false;
    }
    std::cout << '\n';
}

void Report::Print(const Check &check) const {
    PrintMark(check.mark);
    const std::size_t width = std::max(kSubjectWidth, WidthOf(check.subject));
    std::cout << check.subject << std::string(width - WidthOf(check.subject) + 2, ' ');
    PrintWrapped(check.found, kIndent, kMarkWidth + width + 2);
    for (const auto &[label, text] : {std::pair(kLibrary, check.library), std::pair(kRemedy, check.remedy)}) {
        if (!text.empty()) {
            const std::string begin = std::string(kIndent, ' ') + label;
            std::cout << begin;
            PrintWrapped(text, kIndent, begin.size());
        }
    }
}

/// One line for a group without findings.
void Report::PrintSummary(const Group &group) const {
    const auto count = [&](Mark mark) {
        return std::count_if(group.checks.begin(), group.checks.end(),
                             [&](const Check &check) { return check.mark == mark; });
    };
    if (count(Mark::kFinding) == 0 && count(Mark::kGood) > 0) {
        PrintMark(Mark::kGood);
        std::cout << group.title << ": " << count(Mark::kGood) << (count(Mark::kGood) == 1 ? " check" : " checks")
                  << '\n';
    }
}

void Report::PrintGroups() const {
    for (const Check &finding : ChecksOf(Mark::kFinding)) {
        Print(finding);
    }
    if (presentation_.isQuiet) {
        return;
    }
    if (presentation_.isVerbose) {
        for (const Group &group : groups_) {
            std::cout << '\n' << group.title << '\n';
            for (const std::string &detail : group.details) {
                std::cout << std::string(kIndent, ' ') << detail << '\n';
            }
            for (const Check &check : group.checks) {
                if (check.mark != Mark::kFinding) {
                    Print(check);
                }
            }
        }
        return;
    }
    for (const Check &note : ChecksOf(Mark::kNote)) {
        Print(note);
    }
    for (const Group &group : groups_) {
        PrintSummary(group);
    }
}

/// What the checks do not show, and the next step.
void Report::PrintEnd(const std::string &nextStep) const {
    const std::size_t findings = ChecksOf(Mark::kFinding).size();
    std::cout << '\n';
    for (const std::string &result : results_) {
        PrintWrapped(result, 0, 0);
    }
    std::cout << (findings == 0 ? "No findings."
                                : std::to_string(findings) + (findings == 1 ? " finding." : " findings."))
              << '\n';
    if (!presentation_.isVerbose) {
        for (const Check &check : ChecksOf(Mark::kNotChecked)) {
            PrintWrapped("Not checked: " + check.subject + " (" + check.found + ")", kIndent, 0);
        }
    }
    if (findings == 0 && !nextStep.empty()) {
        for (const std::string &what : unproved_) {
            PrintWrapped("Not proved: " + what, kIndent, 0);
        }
        PrintWrapped(nextStep, kIndent, 0);
    }
}

void Report::PrintJson(const std::string &command, const Json::Value &more) const {
    Json::Value json = more;
    json["version"] = kJsonVersion;
    json["command"] = command;
    json["healthy"] = !HasFindings();
    json["checks"] = Json::arrayValue;
    for (const Group &group : groups_) {
        for (const Check &check : group.checks) {
            json["checks"].append(ToJson(check));
        }
    }
    WriteJson(json);
}

void Report::Finish(const std::string &command, const std::string &nextStep, const Json::Value &more) {
    if (presentation_.isJson) {
        PrintJson(command, more);
        return;
    }
    PrintGroups();
    if (!presentation_.isQuiet) {
        PrintEnd(nextStep);
    }
}

}  // namespace Doctor
