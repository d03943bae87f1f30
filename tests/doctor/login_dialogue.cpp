#include "tests/doctor/login_dialogue.h"

#include <gtest/gtest.h>

#include <sstream>

#include "sso/sso.h"
#include "tests/doctor/appliance.h"

namespace Test {

namespace {

constexpr std::size_t kMarkWidth = 7;      // including the following blank
constexpr std::size_t kSubjectWidth = 30;  // and two blanks

std::string After(const std::string &text, const std::string &begin, const std::string &end) {
    const std::size_t found = text.find(begin);
    if (found == std::string::npos) {
        return {};
    }
    const std::size_t from = found + begin.size();
    return text.substr(from, text.find(end, from) - from);
}

/// The mark in JSON. Empty if the line is not a check.
std::string MarkOf(const std::string &line) {
    const std::string mark = line.substr(0, kMarkWidth);
    return mark == "[FAIL] " ? "finding" : mark == "[note] " ? "note" : mark == "[ ok ] " ? "good" : "";
}

std::vector<Check> ReadChecks(const std::string &output) {
    std::vector<Check> checks;
    std::istringstream lines(output);
    for (std::string line; std::getline(lines, line);) {
        const std::string mark = MarkOf(line);
        if (!mark.empty() && line.size() > kMarkWidth + kSubjectWidth) {
            const std::string subject = line.substr(kMarkWidth, kSubjectWidth);
            checks.push_back({"", mark, subject.substr(0, subject.find_last_not_of(' ') + 1),
                              line.substr(kMarkWidth + kSubjectWidth + 2), "", ""});
        } else if (!checks.empty()) {
            checks.back().library += After(line, "library: ", "\n");
            checks.back().remedy += After(line, " do: ", "\n");
        }
    }
    return checks;
}

}  // namespace

LoginDialogue::LoginDialogue(const Strings &arguments)
    : dialogue_(Dialogue::Over::kPipes, With(arguments, "--verbose")),
      address_(After(dialogue_.ReadUntil(kEndOfPrompt), "\n\n  https://", "\n")) {
    EXPECT_NE(address_, "") << "no address to open in a browser";
}

std::string LoginDialogue::Parameter(const std::string &name) const { return After(address_ + "&", name + "=", "&"); }

std::string LoginDialogue::ReturnAddress(const std::string &code) const {
    return kReturnURI + ("?code=" + TAVO::SSO::URLEncode(code)) + "&state=" + Parameter("state");
}

Report LoginDialogue::Paste(const std::string &address) {
    dialogue_.Write(address + "\n");
    const DoctorRun run = dialogue_.Finish();
    Report report;
    report.status = run.status;
    report.checks = ReadChecks(run.output);
    return report;
}

Report WalkLogin() {
    LoginDialogue dialogue;
    return dialogue.Paste(dialogue.ReturnAddress(kCode));
}

}  // namespace Test
