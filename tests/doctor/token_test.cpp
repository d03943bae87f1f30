#include "tests/support/token.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <iostream>
#include <random>
#include <string>

#include "sso/sso.h"
#include "tests/doctor/appliance.h"
#include "tests/doctor/doctor_process.h"
#include "tests/support/emulation.h"
#include "tests/support/failure.h"
#include "tests/support/files.h"

// `tavosso-doctor token`: the library's result and the values that it compared.
namespace Test {

namespace {

using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::StartsWith;

constexpr int kMutations = 150;

template <typename Client>
std::string VerificationBy(const std::string &token) {
    Client client;
    Json::Value response;
    response["id_token"] = token;
    return FailureOf([&] {
               std::string userName;
               client.ProcessTokenResponse(Compact(response));
               client.VerifyIDToken();
               client.GetUserName(userName);
           })
        .text;
}

/// The text of the library's exception for a token. Empty if it accepts the token.
std::string Verification(Profile profile, const std::string &token) {
    return profile == Profile::kAzure ? VerificationBy<TAVO::SSO::AzureSSOClient>(token)
                                      : VerificationBy<TAVO::SSO::WebSphereSSOClient>(token);
}

/// Replaces one byte by another one that is not a line break.
class Mutations {
  public:
    explicit Mutations(unsigned int seed) : random_(seed) {}

    std::string Of(std::string token) {
        char &byte = token[random_() % token.size()];
        const char before = byte;
        do {
            byte = static_cast<char>('!' + random_() % ('~' - '!' + 1));
        } while (byte == before);
        return token;
    }

  private:
    std::mt19937 random_;
};

bool IsPlain(const std::string &text) {
    return std::all_of(text.begin(), text.end(), [](char c) { return c >= 0x20 && c < 0x7f; });
}

class Token : public ::testing::TestWithParam<Profile> {
  protected:
    Appliance appliance{GetParam()};
};

INSTANTIATE_TEST_SUITE_P(Doctor, Token, ::testing::Values(Profile::kAzure, Profile::kWebSphere),
                         [](const auto &profile) { return Name(profile.param); });

TEST_P(Token, StopsWhereLibraryStopsForAnyChangedByte) {
    const unsigned int seed = std::random_device()();
    std::cout << "seed " << seed << std::endl;
    Mutations mutations(seed);
    // qemu-user takes seconds for each token.
    const int count = IsEmulated() ? kMutations / 10 : kMutations;
    for (int i = 0; i < count && !HasFailure(); ++i) {
        SCOPED_TRACE("mutation " + std::to_string(i) + " of seed " + std::to_string(seed));
        const std::string token = mutations.Of(appliance.Token());
        const Report report = AskMachine({"token", "-", "--fetch"}, token);
        const std::string text = Verification(GetParam(), token);
        // One text contains the algorithm's name with the changed byte.
        EXPECT_TRUE(LibraryIn(report) == text || !IsPlain(text)) << text;
        EXPECT_EQ(LibraryIn(report).empty(), text.empty());
        ExpectToStopAtTheOnlyFinding(report);
    }
}

TEST(AzureToken, HasRemedyWithItsValues) {
    constexpr char kOther[] = "99999999-9b7a-4c3d-8e5f-0a1b2c3d4e5f";
    const struct {
        std::string header;
        std::string claims;
        std::string found;
        std::string remedy;
    } rows[] = {
        {"{}", R"({"tid": ")" + std::string(kOther) + "\"}", kOther, "set azure_tenant_id to \"" + std::string(kOther)},
        {"{}", R"({"aud": ["a", "b"]})", R"(["a","b"])", "the client id alone"},
        {R"({"alg": "HS256", "kid": null})", "{}", R"("alg" is "HS256")", "sign the tokens of this client with RS256"},
        {"{}", R"({"unique_name": ["alice@corp.example"], "email": null})",
         R"("unique_name" is not a string: ["alice@corp.example"])", "as a string"},
    };
    Appliance appliance(Profile::kAzure);
    for (const auto &row : rows) {
        appliance.GiveToken(row.header, row.claims);
        const Check finding = Ask({"token", "-", "--fetch"}, appliance.Token()).FirstFinding();
        EXPECT_THAT(finding.found, HasSubstr(row.found));
        EXPECT_THAT(finding.remedy, HasSubstr(row.remedy));
    }
}

TEST_P(Token, SendsNoRequestWithoutFetch) {
    const Report report = Ask({"token", "-"}, appliance.Token());
    EXPECT_THAT(report.Findings(), IsEmpty());
    const bool needsKeys = GetParam() == Profile::kAzure;
    EXPECT_NE(report.Find("token.signature", needsKeys ? "not checked" : "good").id, "");
    EXPECT_THAT(report.Find("token.domain", "good").found, StartsWith("signs in as "));
    EXPECT_EQ(appliance.Connections(), 0);
}

TEST_P(Token, ReportsUnknownKeyWithPublishedKeys) {
    if (GetParam() == Profile::kAzure) {
        appliance.AnswerAt("/keys", KeySet(R"({"kid": "second key"})"));
        const Check finding = Ask({"token", "-", "--fetch"}, appliance.Token()).FirstFinding();
        EXPECT_EQ(finding.found, R"("first key"; the provider publishes "second key")");
    }
}

TEST_P(Token, StopsAtExpiryWithoutRequests) {
    appliance.GiveToken("{}", R"({"exp": 1700000000})");
    const Report report = Ask({"token", "-"}, appliance.Token());
    EXPECT_EQ(report.json["stops_at"], "token.expiry");
    EXPECT_THAT(report.FirstFinding().found, StartsWith("1700000000, 2023-11-14 22:13:20 UTC; it is 20"));
    EXPECT_EQ(appliance.Connections(), 0);
}

TEST_P(Token, IsReadFromFile) {
    WriteFile("/tmp/token", appliance.Token() + "\r\n");
    EXPECT_THAT(Ask({"token", "/tmp/token", "--fetch"}).Findings(), IsEmpty());
}

TEST_P(Token, MustBeReadable) {
    const DoctorRun missing = RunDoctor({"token", "/tmp/no such file"});
    EXPECT_EQ(missing.status, 2);
    EXPECT_THAT(missing.errors, HasSubstr("/tmp/no such file cannot be read"));

    EXPECT_EQ(RunDoctor({"token", "-"}, std::string(1 << 20, 'a')).status, 1) << "of exactly the longest size";
    const DoctorRun large = RunDoctor({"token", "-"}, std::string((1 << 20) + 1, 'a'));
    EXPECT_EQ(large.status, 2);
    EXPECT_THAT(large.errors, HasSubstr("longer than 1 MiB"));
}

TEST_P(Token, RequiresProfile) {
    RemoveFiles();
    const DoctorRun run = RunDoctor({"token", "-"}, appliance.Token());
    EXPECT_EQ(run.status, 2);
    EXPECT_THAT(run.errors, HasSubstr("no profile is configured"));
    EXPECT_EQ(run.output, "");
}

TEST_P(Token, ReportsMissingClaim) {
    appliance.GiveToken("{}", R"({"aud": null})");
    EXPECT_THAT(Ask({"token", "-", "--fetch"}, appliance.Token()).FirstFinding().found, StartsWith("missing; "));
    appliance.GiveToken("{}", R"({"unique_name": null, "sub": null})");
    EXPECT_EQ(Ask({"token", "-", "--fetch"}, appliance.Token()).FirstFinding().found, "missing");
}

TEST_P(Token, AcceptsUnusualClaims) {
    for (const char *claims :
         {R"({"exp": {}})", R"({"aud": {"a": [1]}})", R"({"tid": 1.5, "sub": null})",
          R"({"unique_name": ["a@b"], "email": 7, "sub": {}})", R"({"exp": "99999999999999999999"})",
          R"({"unique_name": "a@b@c", "sub": ""})", R"({"exp": 1e300})"}) {
        appliance.GiveToken("{}", claims);
        const Report report = Ask({"token", "-", "--fetch"}, appliance.Token());
        EXPECT_EQ(LibraryIn(report), Verification(GetParam(), appliance.Token())) << claims;
        ExpectToStopAtTheOnlyFinding(report);
    }
}

TEST_P(Token, ReportsPartsThatAreNotObjects) {
    for (const char *token : {"W10.W10.e30", "MQ.MQ.MQ", "bnVsbA.bnVsbA.e30", "e30.e30.e30", "..", "...", "e30.e30."}) {
        const Report report = Ask({"token", "-", "--fetch"}, token);
        EXPECT_EQ(LibraryIn(report), Verification(GetParam(), token)) << token;
        ExpectToStopAtTheOnlyFinding(report);
    }
}

}  // namespace

}  // namespace Test
