#include <gmock/gmock.h>

#include <cctype>
#include <map>
#include <set>
#include <string>

#include "tests/doctor/doctor_process.h"
#include "tests/support/token.h"
#include "web/failure_lookup.h"

// `tavosso-doctor explain`: each text of the table of failures is explained by its own row.
namespace Test {

namespace {

using ::testing::AllOf;
using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::Not;

const std::map<std::string, std::string> kWords = {
    {"N", "1234"},
    {"CURL", "Couldn't connect to server"},
    {"SYSTEM", "Operation not permitted"},
    {"NAME", R"(CORP\alice)"},
    {"UID", "4711"},
    {"GID", "100"},
    {"ALG", "ES256"},
    {"SOURCE", "webspheresso"},
    {"REASON", "no reason that anyone knows"},
    {"DOMAIN", "CORP.EXAMPLE"},
};

/// A real text for one of the table: each placeholder is replaced.
std::string Fill(const TAVO::Web::FailureRow &failure, const std::string &text) {
    if (failure.kind == TAVO::Web::FailureKind::kTransfer) {
        return curl_easy_strerror(failure.result);
    }
    std::string filled;
    std::string word;
    for (const char c : text + '\n') {
        if (std::isalnum(static_cast<unsigned char>(c)) != 0) {
            word += c;
            continue;
        }
        const auto found = kWords.find(word);
        filled += (found != kWords.end() ? found->second : word) + c;
        word.clear();
    }
    return filled;
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

TEST(Explain, FindsRowOfEveryText) {
    for (const char *placeholder : TAVO::Web::kPlaceholders) {
        EXPECT_EQ(kWords.count(placeholder), 1U) << placeholder;
    }
    for (const TAVO::Web::FailureRow &failure : TAVO::Web::FailureTable()) {
        for (const std::string text : failure.texts) {
            const std::string filled = Fill(failure, text);
            if (text == "CURL") {
                EXPECT_THAT(Explanations(filled), ElementsAre("CURLE_COULDNT_CONNECT")) << "not as any text";
            } else {
                EXPECT_THAT(Explanations(filled), Contains(text)) << filled;
            }
        }
    }
}

TEST(Explain, PrintsTheRow) {
    const DoctorRun run = RunDoctor({"explain", "id_token expired."});
    EXPECT_EQ(run.status, 0);
    EXPECT_THAT(run.output, AllOf(HasSubstr("id_token expired.\n"), HasSubstr("  class: std::invalid_argument\n"),
                                  HasSubstr("check the clock with timedatectl.\n")));
    EXPECT_THAT(run.output, Not(HasSubstr("`")));
}

TEST(Explain, RecognisesTextsOfLibcurl7And8) {
    for (const char *text : {"Couldn't resolve host name", "Could not resolve hostname"}) {
        EXPECT_THAT(Explanations(text), ElementsAre("CURLE_COULDNT_RESOLVE_HOST")) << text;
    }
    EXPECT_THAT(Explanations("return.cgi[4711]: sso:74 request token uri Could not connect to server."),
                ElementsAre("sso:N request token uri CURL.", "CURLE_COULDNT_CONNECT"));
}

TEST(Explain, RecognisesProviderResponseByItsError) {
    EXPECT_THAT(Explanations(R"({"error": "invalid_client", "error_description": "AADSTS7000215"})"),
                Contains(TAVO::Web::kErrorAnswer));
    for (const char *text :
         {"The provider refused: access_denied (not today)", "The provider refused: unknown error"}) {
        EXPECT_THAT(Explanations(text), Contains("The provider refused: REASON"));
    }
}

TEST(Explain, RecognisesLogLines) {
    for (const std::string line : {"return.cgi[4711]: sso:69 Couldn't connect to server",
                                   "return.cgi[4711]: frontend: sign-in failed: id_token expired."}) {
        EXPECT_EQ(Explanations(line).size(), 2U) << line;
        EXPECT_EQ(Explanations("Nov 20 18:30:12 nas " + line + "\n").size(), 2U) << line;
    }
}

TEST(Explain, ExplainsReasonInFrontEndLine) {
    EXPECT_THAT(Explanations("return.cgi[1]: frontend: sign-in failed: kid does not exist in Azure verified kyes"),
                ElementsAre("frontend: sign-in failed: REASON", "kid does not exist in Azure verified kyes"));
}

struct TypedText {
    const char *text;
    const char *about;
};

TEST(Explain, AcceptsTextsAsPeopleTypeThem) {
    const TypedText typed[] = {
        {"id_token expired", "id_token expired."},
        {"ID_TOKEN EXPIRED.", "id_token expired."},
        {"Tenant id invalid", "tenant ID invalid"},
        {"sso does not enable", "sso does not enable."},
        {"invalid_client", "invalid_client"},
        {"Invalid_Grant", "invalid_grant"},
        {"\"error\":\"login_required\"", "login_required"},
        {"AADSTS7000215: Invalid client secret provided.", "AADSTS7000215"},
        {"aadsts50011", "AADSTS50011"},
        {"Your sign-in took too long, or was already completed. Sign in again",
         "This sign-in took too long, or was already completed."},
        {"Your organisation does not accept this device. Contact your administrator.", "invalid_client"},
    };
    for (const auto &[text, about] : typed) {
        EXPECT_THAT(Explanations(text), Contains(about)) << text;
    }
    EXPECT_THAT(Explanations("AADSTS700016"), Not(Contains("AADSTS70001"))) << "codes are words";
}

TEST(Explain, ReportsUnknownText) {
    for (const std::string text : {"systemd[1]: Started lighttpd.service", "", " ", "*", "[", "\\", "{}"}) {
        EXPECT_EQ(Explanations(text), Strings()) << text;
    }
    EXPECT_EQ(RunDoctor({"explain", "a text of someone else"}).output,
              "Unknown text. Use a whole line of the log, or the text of an exception.\n");
}

TEST(Explain, ListsEveryRow) {
    const Json::Value report = Parse(RunDoctor({"explain", "--list", "--json"}).output);
    const std::string printed = "\n" + RunDoctor({"explain", "--list"}).output;
    const std::string markdown = RunDoctor({"explain", "--list", "--markdown"}).output;
    std::set<std::string> listed;
    for (const Json::Value &explanation : report["explanations"]) {
        listed.insert(explanation["about"].asString());
    }
    for (const TAVO::Web::FailureRow &failure : TAVO::Web::FailureTable()) {
        for (const std::string text : failure.texts) {
            EXPECT_EQ(listed.count(text), 1U) << text;
            EXPECT_THAT(printed, HasSubstr("\n" + text + "\n  ")) << text;
            EXPECT_THAT(markdown, HasSubstr('`' + text + '`'));
        }
    }
}

}  // namespace

}  // namespace Test
