#include <gmock/gmock.h>

#include <string>

#include "tests/doctor/doctor_process.h"

// The command line.
namespace Test {

namespace {

using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;
using ::testing::StartsWith;

TEST(CommandLine, ThatIsWrongIsRefusedOnStandardError) {
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

TEST(CommandLine, OptionsStandBeforeAndBehindTheCommand) {
    const DoctorRun before = RunDoctor({"--json", "explain", "id_token expired."});
    const DoctorRun behind = RunDoctor({"explain", "id_token expired.", "--json"});
    EXPECT_THAT(before.output, StartsWith("{"));
    EXPECT_EQ(before.output, behind.output);
}

TEST(CommandLine, AsksForHelpAndVersion) {
    const DoctorRun help = RunDoctor({"--help"});
    EXPECT_EQ(help.status, 0);
    for (const char *word : {"token", "login", "explain", "--json", "--user", "--timeout"}) {
        EXPECT_THAT(help.output, HasSubstr(word));
    }
    const DoctorRun version = RunDoctor({"--version"});
    EXPECT_EQ(version.status, 0);
    EXPECT_THAT(version.output, StartsWith("tavosso-doctor "));
}

}  // namespace

}  // namespace Test
