#include <gmock/gmock.h>

#include <string>

#include "sso/sso.h"
#include "tests/doctor/appliance.h"
#include "tests/doctor/doctor_process.h"
#include "tests/doctor/login_dialogue.h"
#include "tests/support/files.h"

// `tavosso-doctor login` with a user who signs in at the provider.
namespace Test {

namespace {

using ::testing::Each;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;
using ::testing::StartsWith;

class LoginWalk : public ::testing::TestWithParam<Profile> {
  protected:
    /// Puts the login's nonce into the token, like a provider.
    void SignIn(const LoginDialogue &dialogue) {
        appliance.GiveToken("{}", "{\"nonce\": \"" + dialogue.Parameter("nonce") + "\"}");
    }

    void ExpectNoTokenRequest() { EXPECT_THAT(appliance.Requests(), Each(Not(StartsWith("POST ")))); }

    Appliance appliance{GetParam()};
};

INSTANTIATE_TEST_SUITE_P(Doctor, LoginWalk, ::testing::Values(Profile::kAzure, Profile::kWebSphere),
                         [](const auto &profile) { return Name(profile.param); });

TEST_P(LoginWalk, HasNoFindingsForKnownUser) {
    LoginDialogue dialogue;
    SignIn(dialogue);
    const Report report = dialogue.Paste(dialogue.ReturnAddress(kCode));
    EXPECT_THAT(report.Findings(), IsEmpty());
    EXPECT_EQ(report.status, 0);
    EXPECT_EQ(report.checks.back().subject, "nonce");
}

TEST_P(LoginWalk, ReportsTokenOfOtherLogin) {
    const Report report = WalkLogin();
    EXPECT_EQ(report.FirstFinding().subject, "nonce");
    EXPECT_EQ(report.status, 1);
}

TEST_P(LoginWalk, SendsNoCodeForForeignState) {
    LoginDialogue dialogue;
    const Report report = dialogue.Paste(std::string(kReturnURI) + "?code=c&state=c3RhdGU%3D");
    EXPECT_EQ(report.FirstFinding().subject, "state");
    ExpectNoTokenRequest();
}

TEST_P(LoginWalk, ReportsProviderErrorVerbatim) {
    LoginDialogue dialogue;
    const Report report =
        dialogue.Paste(std::string(kReturnURI) + "?error=access_denied&error_description=not+today&state=s");
    EXPECT_EQ(report.FirstFinding().found, "The provider refused: access_denied (not today)");
    EXPECT_EQ(report.FirstFinding().remedy, "Assign the user to the client at the provider.");
    EXPECT_EQ(report.status, 1);
}

TEST_P(LoginWalk, ReportsAddressWithoutCode) {
    for (const char *query : {"", "?", "?state=s", "?code=", "?code=a&code=b"}) {
        LoginDialogue dialogue;
        EXPECT_THAT(dialogue.Paste(kReturnURI + std::string(query)).FirstFinding().found,
                    HasSubstr("not an address with one code"))
            << query;
    }
    LoginDialogue dialogue;
    EXPECT_EQ(dialogue.Paste("no address at all").status, 1);
    ExpectNoTokenRequest();
}

TEST_P(LoginWalk, ReportsRejectedCode) {
    LoginDialogue dialogue;
    const Report report = dialogue.Paste(dialogue.ReturnAddress("a code that was used"));
    EXPECT_EQ(report.FirstFinding().subject, "exchange of the code");
    EXPECT_EQ(report.FirstFinding().found, "The provider refused: invalid_grant");
}

TEST_P(LoginWalk, ReportsResponseWithoutToken) {
    appliance.AnswerAt("/token_endpoint", R"({"access_token": "without OpenID Connect"})");
    EXPECT_THAT(WalkLogin().FirstFinding().found, HasSubstr("no \"id_token\""));
}

TEST_P(LoginWalk, StopsAtFailedTokenCheck) {
    appliance.GiveToken("{}", R"({"aud": "another client"})");
    const Check finding = WalkLogin().FirstFinding();
    EXPECT_THAT(finding.subject, HasSubstr("\"aud\""));
    EXPECT_EQ(finding.library, "client ID invalid");
}

TEST_P(LoginWalk, SendsGivenRedirectURI) {
    LoginDialogue dialogue({"login", "--redirect-uri", "https://other.example/back"});
    EXPECT_EQ(dialogue.Parameter("redirect_uri"), TAVO::SSO::URLEncode("https://other.example/back"));
    SignIn(dialogue);
    EXPECT_EQ(dialogue.Paste(dialogue.ReturnAddress(kCode)).status, 0);
    EXPECT_THAT(appliance.Requests()[0], HasSubstr(TAVO::SSO::URLEncode("https://other.example/back")));
}

TEST_P(LoginWalk, StopsWithoutAddress) {
    for (const std::string input : {"", "\n", " \n"}) {
        const DoctorRun run = RunDoctor({"login"}, input);
        EXPECT_EQ(run.status, 2);
        EXPECT_THAT(run.errors, HasSubstr("no address was given"));
    }
}

TEST_P(LoginWalk, RejectsJSONOutput) {
    const DoctorRun run = RunDoctor({"login", "--json"});
    EXPECT_EQ(run.status, 2);
    EXPECT_THAT(run.errors, HasSubstr("login is a dialogue"));
}

TEST(Login, RequiresProfile) {
    RemoveFiles();
    const DoctorRun run = RunDoctor({"login"});
    EXPECT_EQ(run.status, 2);
    EXPECT_THAT(run.errors, HasSubstr("no profile is configured"));
}

}  // namespace

}  // namespace Test
