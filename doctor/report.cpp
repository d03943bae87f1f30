#include "doctor/report.h"

#include <sso/sso.h>

#include <algorithm>
#include <boost/algorithm/string/replace.hpp>
#include <iomanip>
#include <iostream>
#include <utility>

#include "web/text.h"

namespace Doctor {

namespace {

constexpr char kHidden[] = "[hidden]";
constexpr int kSubjectWidth = 30;
constexpr std::size_t kLongestText = 1000;
// What is shorter is no secret, and words hold it by chance.
constexpr std::size_t kShortest = 6;

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
        // A secret that begins with another one would leave its end behind.
        std::sort(hidden_.begin(), hidden_.end(), [](const auto &a, const auto &b) { return a.size() > b.size(); });
    }
}

std::string Report::Redact(std::string text) const {
    for (const std::string &secret : hidden_) {
        boost::replace_all(text, secret, kHidden);
    }
    // Cut last: what is left of a secret that was cut would not be found.
    return TAVO::Web::OneLine(text, kLongestText);
}

void Report::Section(const std::string &title) {
    if (!presentation_.isJson) {
        std::cout << '\n' << title << '\n';
    }
}

void Report::Add(Check check) {
    for (std::string *text : {&check.subject, &check.found, &check.remedy, &check.library}) {
        *text = Redact(std::move(*text));
    }
    if (!presentation_.isJson) {
        Print(check);
    }
    checks_.push_back(std::move(check));
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

void Report::Detail(const std::string &text) {
    if (presentation_.isVerbose && !presentation_.isJson) {
        std::cout << "         " << Redact(text) << '\n';
    }
}

void Report::Say(const std::string &text) {
    if (!presentation_.isJson) {
        std::cout << text << std::endl;
    }
}

bool Report::HasFindings() const {
    return std::any_of(checks_.begin(), checks_.end(), [](const Check &check) { return check.mark == Mark::kFinding; });
}

void Report::Print(const Check &check) const {
    const MarkNames names = NamesOf(check.mark);
    if (presentation_.hasColours) {
        std::cout << "\033[" << names.colour << 'm' << names.forPeople << "\033[0m";
    } else {
        std::cout << names.forPeople;
    }
    std::cout << ' ' << std::left << std::setw(kSubjectWidth) << check.subject << "  " << check.found << '\n';
    if (!check.library.empty()) {
        std::cout << "         the library says: " << check.library << '\n';
    }
    if (!check.remedy.empty()) {
        std::cout << "         do: " << check.remedy << '\n';
    }
    std::cout.flush();
}

/// That nothing was found says little of them.
void Report::PrintNotChecked() const {
    for (const Check &check : checks_) {
        if (check.mark == Mark::kNotChecked) {
            std::cout << "Not checked: " << check.subject << " (" << check.found << ")\n";
        }
    }
}

void Report::Finish(const std::string &command, const Json::Value &more) {
    const auto findings =
        std::count_if(checks_.begin(), checks_.end(), [](const Check &check) { return check.mark == Mark::kFinding; });
    if (!presentation_.isJson) {
        std::cout << '\n'
                  << (findings == 0 ? "No findings."
                                    : std::to_string(findings) + (findings == 1 ? " finding." : " findings."))
                  << '\n';
        PrintNotChecked();
        return;
    }
    Json::Value json = more;
    json["version"] = kJsonVersion;
    json["command"] = command;
    json["healthy"] = findings == 0;
    json["checks"] = Json::arrayValue;
    for (const Check &check : checks_) {
        json["checks"].append(ToJson(check));
    }
    WriteJson(json);
}

}  // namespace Doctor
