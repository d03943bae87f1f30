#include <gmock/gmock.h>

#include <string>

#include "tests/doctor/appliance.h"
#include "tests/doctor/doctor_process.h"
#include "tests/support/files.h"

// The command line.
namespace Test {

namespace {

using ::testing::AllOf;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;
using ::testing::StartsWith;

TEST(CommandLine, ReportsErrorsOnStandardError) {
    const Strings wrong[] = {
        {"examine"},
        {"--no-such-option"},
        {"--timeout", "0"},
        {"--timeout", "soon"},
        {"--timeout"},
        {"token"},
        {"token", "a", "b"},
        {"explain"},
        {"login", "now"},
        {"login", "explain", "a"},
        {"--user", "no-one"},
        {"--domain"},
        {"--profile", "Azure"},
        {"--quiet", "--verbose"},
        {"--quiet", "--json"},
        {"explain", "a", "--list"},
        {"explain", "a", "--markdown"},
    };
    for (const Strings &arguments : wrong) {
        SCOPED_TRACE(::testing::PrintToString(arguments));
        const DoctorRun run = RunDoctor(arguments);
        EXPECT_EQ(run.status, 2);
        EXPECT_THAT(run.errors, Not(IsEmpty()));
        EXPECT_EQ(run.output, "");
    }
}

TEST(CommandLine, AcceptsOptionsBeforeAndAfterCommand) {
    const DoctorRun before = RunDoctor({"--json", "explain", "id_token expired."});
    const DoctorRun behind = RunDoctor({"explain", "id_token expired.", "--json"});
    EXPECT_THAT(before.output, StartsWith("{"));
    EXPECT_EQ(before.output, behind.output);
}

TEST(Summary, HasOneLinePerHealthyGroup) {
    Appliance appliance(Profile::kAzure);
    EXPECT_THAT(RunDoctor({}).output, AllOf(HasSubstr("[ ok ] Profile: "), HasSubstr("[ ok ] Client (azure): "),
                                            Not(HasSubstr("azure_token_endpoint"))));
    EXPECT_THAT(RunDoctor({"--verbose"}).output, HasSubstr("[ ok ] azure_token_endpoint"));
}

TEST(Summary, BeginsWithFindings) {
    Appliance appliance(Profile::kAzure);
    appliance.SetClient("token_endpoint", "");
    for (const Strings &arguments : {Strings{}, {"--verbose"}, {"--quiet"}}) {
        EXPECT_THAT(RunDoctor(arguments).output, StartsWith("[FAIL] azure_token_endpoint"));
    }
}

TEST(Quiet, PrintsFindingsOnly) {
    Appliance appliance(Profile::kAzure);
    EXPECT_EQ(RunDoctor({"--quiet"}).output, "");
    WriteFile(kProfileFile, R"({"sso_enable": false})");
    const DoctorRun run = RunDoctor({"--quiet"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.output,
              "[FAIL] sso_enable                      is false\n"
              "         library: sso does not enable.\n"
              "         do: Set \"sso_enable\" to true in /usr/tavo/etc/ssoclient/profile.conf, without quotation "
              "marks.\n");
}

TEST(ProfileOption, ChecksAProfileThatIsSwitchedOff) {
    Appliance appliance(Profile::kAzure);
    WriteFile(kProfileFile, R"({"sso_enable": false, "sso_profile": "websphere"})");
    EXPECT_THAT(Ask({"--profile", "azure"}).Findings(), IsEmpty());
    EXPECT_THAT(Ask({"token", "-", "--profile", "azure"}, appliance.Token()).Findings(), IsEmpty());
}

TEST(CommandLine, PrintsHelpAndVersion) {
    const DoctorRun help = RunDoctor({"--help"});
    EXPECT_EQ(help.status, 0);
    for (const char *word :
         {"token", "login", "explain", "--json", "--user", "--timeout", "Examples:\n  sudo tavosso-doctor "}) {
        EXPECT_THAT(help.output, HasSubstr(word));
    }
    const DoctorRun version = RunDoctor({"--version"});
    EXPECT_EQ(version.status, 0);
    EXPECT_THAT(version.output, StartsWith("tavosso-doctor "));
}

}  // namespace

}  // namespace Test
