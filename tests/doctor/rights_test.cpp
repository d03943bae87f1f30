#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <string>

#include "tests/doctor/appliance.h"
#include "tests/doctor/doctor_process.h"
#include "tests/support/files.h"

// Rights and owners of files and folders.
namespace Test {

namespace {

using ::testing::AllOf;
using ::testing::Contains;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;
using ::testing::StartsWith;

constexpr uid_t kNobody = 65534;

class Rights : public ::testing::Test {
  protected:
    Appliance appliance{Profile::kAzure};
};

TEST_F(Rights, NotesMissingFrontEndFolder) {
    EXPECT_THAT(Ask({}).Find("frontend.folder", "note").remedy, HasSubstr("install -d -m 0755 /usr/tavo/var"));
}

TEST_F(Rights, AcceptsPrivateFrontEndFolders) {
    std::filesystem::create_directories("/usr/tavo/var/frontend/logins");
    ASSERT_EQ(chmod("/usr/tavo/var/frontend", 0700), 0);
    ASSERT_EQ(chmod("/usr/tavo/var/frontend/logins", 0700), 0);
    EXPECT_THAT(Ask({}).Findings(), IsEmpty());
}

TEST_F(Rights, NotesRedirectURIOfOtherMachine) {
    for (const char *host : {"nas.invalid", "192.0.2.1"}) {
        appliance.SetClient("redirect_uri", "https://" + std::string(host) + "/webman/sso/return.cgi");
        const Report report = Ask({});
        EXPECT_THAT(report.Find("frontend.host", "note").found, HasSubstr(host));
        EXPECT_THAT(report.Findings(), IsEmpty());
    }
}

TEST_F(Rights, RequestsReturnProgramWithHead) {
    appliance.AnswerAt("/return.cgi", "", "200 OK");
    const std::string url = appliance.URL("");
    appliance.SetClient("redirect_uri", url.substr(0, url.find('/', 8)) + "/webman/sso/return.cgi");
    EXPECT_EQ(Ask({}).Find("frontend.return", "good").found, "answers HTTP 200");
    EXPECT_THAT(appliance.Requests(), Contains(StartsWith("HEAD /webman/sso/return.cgi ")));
}

/// Runs the doctor through another command.
class OtherUsers : public Rights {
  protected:
    void SetUp() override {
        WriteFile("/tmp/probe", "");
        if (chown("/tmp/probe", kNobody, kNobody) != 0) {
            GTEST_SKIP() << "needs the ids of other users";
        }
    }
};

TEST_F(OtherUsers, OrdinaryUserReadsFirstToRunWithSudo) {
    const std::string output =
        RunDoctor({}, "", {"/usr/bin/setpriv", "--reuid=65534", "--regid=65534", "--clear-groups"}).output;
    EXPECT_THAT(output.substr(0, output.find('\n')), AllOf(StartsWith("[FAIL]"), HasSubstr("Run with sudo")));
    EXPECT_THAT(output, Not(HasSubstr("web server")));
}

TEST_F(OtherUsers, GroupsOfRootAreDropped) {
    constexpr gid_t kGroup = 4242;
    ASSERT_EQ(chown(kProfileFile, 0, kGroup), 0);
    ASSERT_EQ(chmod(kProfileFile, 0640), 0);
    const DoctorRun run = RunDoctor({"--user", "nobody"}, "", {"/usr/bin/setpriv", "--groups=4242"});
    EXPECT_THAT(run.output, HasSubstr("profile.conf cannot be read: Permission denied"));
}

TEST_F(OtherUsers, FolderThatRefusesRootIsNamed) {
    ASSERT_EQ(chown("/usr/tavo/etc", kNobody, kNobody), 0);
    ASSERT_EQ(chmod("/usr/tavo/etc", 0700), 0);
    const std::string output =
        RunDoctor({}, "", {"/usr/bin/setpriv", "--bounding-set=-dac_override,-dac_read_search"}).output;
    EXPECT_THAT(output, AllOf(HasSubstr("/usr/tavo/etc refuses: mode 0700, owner nobody"), HasSubstr("security module"),
                              Not(HasSubstr("web server"))));
}

}  // namespace

}  // namespace Test
