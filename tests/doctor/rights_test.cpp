#include <gmock/gmock.h>
#include <sys/mount.h>
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

constexpr char kVar[] = "/usr/tavo/var";
constexpr uid_t kNobody = 65534;

class Rights : public ::testing::Test {
  protected:
    void TearDown() override { chmod("/usr/tavo", 0755); }

    Appliance appliance{Profile::kAzure};
};

TEST_F(Rights, ReportsFolderWritableByOthers) {
    ASSERT_EQ(chmod("/usr/tavo/etc", 0777), 0);
    const Check finding = Ask({}).FirstFinding();
    EXPECT_EQ(finding.id, "profile.rights");
    EXPECT_THAT(finding.found, HasSubstr("/usr/tavo/etc: mode 0777, owner root"));
    EXPECT_THAT(finding.remedy, HasSubstr("chmod go-w /usr/tavo/etc"));
}

TEST_F(Rights, ReportsDomainTableWritableByOthers) {
    ASSERT_EQ(chmod(kDomainTable, 0666), 0);
    EXPECT_EQ(OnlyFinding().id, "directory.rights");
}

TEST_F(Rights, NotesMissingFrontEndFolder) {
    EXPECT_THAT(Ask({}).Find("frontend.folder", "note").remedy, HasSubstr("install -d -m 0755 /usr/tavo/var"));
}

TEST_F(Rights, RequiresPrivateFrontEndFolders) {
    std::filesystem::create_directories(std::string(kVar) + "/frontend/logins");
    ASSERT_EQ(chmod("/usr/tavo/var/frontend", 0700), 0);
    ASSERT_EQ(chmod("/usr/tavo/var/frontend/logins", 0700), 0);
    EXPECT_THAT(Ask({}).Findings(), IsEmpty());
    ASSERT_EQ(chmod("/usr/tavo/var/frontend/logins", 0750), 0);
    EXPECT_THAT(OnlyFinding().found, HasSubstr("/usr/tavo/var/frontend/logins: mode 0750"));
    ASSERT_EQ(chmod(kVar, 0777), 0);
    EXPECT_THAT(OnlyFinding().found, HasSubstr("/usr/tavo/var: mode 0777"));
}

TEST_F(Rights, ReportsFullFileSystem) {
    std::filesystem::create_directories(kVar);
    ASSERT_EQ(mount("tmpfs", kVar, "tmpfs", 0, "size=4k,mode=0755"), 0);
    WriteFile(std::string(kVar) + "/large", std::string(4096, 'x'));
    EXPECT_THAT(OnlyFinding().found, HasSubstr("is full"));
    ASSERT_EQ(mount("tmpfs", kVar, "tmpfs", MS_REMOUNT | MS_RDONLY, nullptr), 0);
    EXPECT_THAT(OnlyFinding().found, HasSubstr("read-only"));
    EXPECT_EQ(umount(kVar), 0);
}

TEST_F(Rights, ReportsMissingReturnProgram) {
    appliance.AnswerAt("/return.cgi", "", "200 OK");
    std::string uri = appliance.URL("");
    uri = uri.substr(0, uri.find('/', 8)) + "/webman/sso/return.cgi";
    appliance.SetClient("redirect_uri", uri);
    EXPECT_EQ(Ask({}).Find("frontend.return", "good").found, "answers HTTP 200");
    EXPECT_THAT(appliance.Requests(), Contains(StartsWith("HEAD /webman/sso/return.cgi ")));
    appliance.AnswerAt("/return.cgi", "", "404 Not Found");
    EXPECT_THAT(OnlyFinding().remedy, HasSubstr("lighty-enable-mod tavosso-frontend"));
    const Port port;
    appliance.SetClient("redirect_uri",
                        "https://127.0.0.1:" + std::to_string(port.number()) + "/webman/sso/return.cgi");
    EXPECT_THAT(OnlyFinding().found, HasSubstr("no web server answers at 127.0.0.1 port"));
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
        RunDoctorThrough({"/usr/bin/setpriv", "--reuid=65534", "--regid=65534", "--clear-groups"}).output;
    EXPECT_THAT(output.substr(0, output.find('\n')), AllOf(StartsWith("[FAIL]"), HasSubstr("Run with sudo")));
    EXPECT_THAT(output, Not(HasSubstr("web server")));
}

TEST_F(OtherUsers, GroupsOfRootAreDropped) {
    constexpr gid_t kGroup = 4242;
    ASSERT_EQ(chown(kProfileFile, 0, kGroup), 0);
    ASSERT_EQ(chmod(kProfileFile, 0640), 0);
    const DoctorRun run = RunDoctorThrough({"/usr/bin/setpriv", "--groups=4242"}, {"--user", "nobody"});
    EXPECT_THAT(run.output, HasSubstr("profile.conf cannot be read: Permission denied"));
}

TEST_F(OtherUsers, FolderThatRefusesRootIsNamed) {
    ASSERT_EQ(chown("/usr/tavo/etc", kNobody, kNobody), 0);
    ASSERT_EQ(chmod("/usr/tavo/etc", 0700), 0);
    const std::string output =
        RunDoctorThrough({"/usr/bin/setpriv", "--bounding-set=-dac_override,-dac_read_search"}).output;
    EXPECT_THAT(output, AllOf(HasSubstr("/usr/tavo/etc refuses: mode 0700, owner nobody"), HasSubstr("security module"),
                              Not(HasSubstr("web server"))));
}

}  // namespace

}  // namespace Test
