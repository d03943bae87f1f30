#include <gmock/gmock.h>

#include <cctype>
#include <map>
#include <set>
#include <sstream>
#include <string>

#include "tests/doctor/doctor_process.h"
#include "tests/doctor/guides.h"
#include "tests/support/token.h"

// `tavosso-doctor explain`, held against the guides: each text in them is explained by its own row.
namespace Test {

namespace {

using ::testing::Contains;
using ::testing::HasSubstr;
using ::testing::Not;
using ::testing::SizeIs;

using Words = std::map<std::string, std::string>;

/// What stands in the place of the words in capitals, by the head of the table.
const Words &WordsOf(const std::string &head) {
    static const Words none;
    static const std::map<std::string, Words> words = {
        {"line",
         {{"N", "1234"},
          {"CURL", "Couldn't connect to server"},
          {"SYSTEM", "Operation not permitted"},
          {"NAME", R"(CORP\alice)"},
          {"ID", "4711"},
          {"SOURCE", "webspheresso"},
          {"DOMAIN", "CORP.EXAMPLE"},
          {"REASON", "no reason that anyone knows"}}},
        {"reason", {{"SYSTEM", "No such file or directory"}, {"ERROR", "access_denied"}, {"DESCRIPTION", "not today"}}},
        {"text", {{"ALG", "ES256"}}},
        {"CURL", {}},
    };
    const auto found = words.find(head);
    return found != words.end() ? found->second : none;
}

bool IsWordCharacter(char c) { return std::isalnum(static_cast<unsigned char>(c)) != 0; }

std::string Fill(const std::string &text, const Words &words) {
    std::string filled;
    for (std::size_t i = 0; i < text.size();) {
        std::size_t end = i;
        while (end < text.size() && IsWordCharacter(text[end])) {
            ++end;
        }
        end = end == i ? i + 1 : end;
        const auto word = words.find(text.substr(i, end - i));
        filled += word != words.end() ? word->second : text.substr(i, end - i);
        i = end;
    }
    return filled;
}

/// A row of the kinds that are explained, and one text of it.
struct Explained {
    GuideRow row;
    std::string text;
};

std::vector<Explained> AllExplained() {
    static const std::set<std::string> kinds = {"line", "reason", "text", "CURL"};
    std::vector<Explained> all;
    for (const char *guide : {"operations.md", "integration.md"}) {
        for (const GuideRow &row : RowsOf(ReadGuide(guide))) {
            // The texts of other libraries stand there without being quoted, and so does the provider's answer.
            const bool isQuoted = row.cells.front().find('`') != std::string::npos;
            if (kinds.count(row.head) == 1 && (row.head != "text" || isQuoted)) {
                for (const std::string &text : row.Texts()) {
                    all.push_back({row, text});
                }
            }
        }
    }
    return all;
}

/// The texts of the rows that explain this one.
Strings Explanations(const std::string &text) {
    const DoctorRun run = RunDoctor({"explain", "--json", "--", text});
    const Json::Value report = Parse(run.output);
    EXPECT_EQ(run.status, report["explanations"].empty() ? 1 : 0);
    EXPECT_EQ(report["command"], "explain");
    Strings about;
    for (const Json::Value &explanation : report["explanations"]) {
        about.push_back(explanation["about"].asString());
    }
    return about;
}

TEST(Explain, KnowsEveryTextOfTheGuidesByItsOwnRow) {
    std::map<std::string, int> counts;
    for (const Explained &explained : AllExplained()) {
        ++counts[explained.row.head];
        const std::string text = Fill(explained.text, WordsOf(explained.row.head));
        EXPECT_THAT(Explanations(text), Contains(explained.text)) << text;
    }
    EXPECT_THAT(counts, SizeIs(4)) << "a kind of table is not there any more";
}

TEST(Explain, TellsWhatStandsInTheRow) {
    const DoctorRun run = RunDoctor({"explain", "id_token expired."});
    EXPECT_EQ(run.status, 0);
    EXPECT_THAT(run.output, HasSubstr("id_token expired.\n"));
    EXPECT_THAT(run.output, HasSubstr("  for the administrator: the clock of this device\n"));
    EXPECT_THAT(run.output, Not(HasSubstr("`")));
}

TEST(Explain, KnowsAProvidersAnswerByItsError) {
    EXPECT_THAT(Explanations(R"({"error": "invalid_client", "error_description": "AADSTS7000215"})"),
                Contains("the provider's answer as JSON (Azure alone)"));
    EXPECT_THAT(Explanations("The provider refused: access_denied (not today)"),
                Contains("The provider refused: ERROR (DESCRIPTION)"));
    EXPECT_THAT(Explanations("The provider refused: unknown error"),
                Contains("The provider refused: ERROR (DESCRIPTION)"));
}

TEST(Explain, KnowsEachLineOfALoginThatFailedAsTheLogHasIt) {
    std::istringstream guide(ReadGuide("operations.md"));
    int count = 0;
    for (std::string line; std::getline(guide, line);) {
        if (line.compare(0, 11, "return.cgi[") == 0) {
            ++count;
            EXPECT_NE(Explanations(line), Strings()) << line;
            EXPECT_NE(Explanations("Nov 20 18:30:12 nas " + line + "\n"), Strings()) << line;
        }
    }
    EXPECT_GE(count, 3) << "the guide shows no login that failed";
}

TEST(Explain, ExplainsTheReasonInTheFrontEndsLineToo) {
    EXPECT_THAT(Explanations("return.cgi[1]: frontend: sign-in failed: kid does not exist in Azure verified kyes"),
                Contains("kid does not exist in Azure verified kyes"));
}

TEST(Explain, SaysSoWhereTheGuidesDoNotKnowAText) {
    for (const std::string text : {"systemd[1]: Started lighttpd.service", "", " ", "*", "[", "\\"}) {
        EXPECT_EQ(Explanations(text), Strings()) << text;
    }
    EXPECT_EQ(RunDoctor({"explain", "a text of someone else"}).output,
              "The guides do not know this text. Try a whole line of the log, or an exception's text.\n");
}

}  // namespace

}  // namespace Test
