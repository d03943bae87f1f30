#include <dlfcn.h>
#include <gmock/gmock.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <syslog.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <fstream>
#include <functional>
#include <ostream>
#include <string>
#include <tuple>
#include <vector>

#include "sso/sso.h"
#include "tests/support/files.h"
#include "tests/support/system_log.h"

namespace {

std::vector<int> errorsAtReading;  // errno, whenever a file is opened for the library

}  // namespace

extern "C" FILE *fopen(const char *path, const char *mode) {
    errorsAtReading.push_back(errno);
    static const auto realOpen = reinterpret_cast<FILE *(*)(const char *, const char *)>(dlsym(RTLD_NEXT, "fopen"));
    return realOpen(path, mode);
}

// What a web front end does that runs under ids of its own: it becomes them for good, or keeps the right to go back to
// root's, and then reads files that only root may read.
namespace Test {

namespace {

using ::testing::Each;
using ::testing::ElementsAreArray;
using ::testing::IsEmpty;
using ::testing::SizeIs;

constexpr uid_t kUser = 1024;
constexpr gid_t kGroup = 100;

constexpr int kRaised = LOG_AUTH | LOG_INFO;
constexpr int kFailed = LOG_AUTH | LOG_ERR;

struct Ids {
    const char *name;
    uid_t user;
    gid_t group;
    uid_t savedUser;
    gid_t savedGroup;
    std::vector<LogLine> log;  // of one file's reading, without the source's name
    bool mayRead = true;
};

void PrintTo(const Ids &ids, std::ostream *stream) { *stream << ids.name; }

const Ids kRoot{"Root", 0, 0, 0, 0, {}};
const Ids kRootInAnotherGroup{"RootInAnotherGroup", 0, kGroup, 0, 0, {{kRaised, "WARNING: setresgid(-1, 0, -1)"}}};
const Ids kUserInRootsGroup{"UserInRootsGroup",
                            kUser,
                            0,
                            0,
                            0,
                            {{kRaised, "WARNING: setresuid(-1, 0, -1)"}, {kRaised, "WARNING: setresuid(-1, 0, -1)"}}};
const Ids kUserWhoMayGoBack{"UserWhoMayGoBack",
                            kUser,
                            kGroup,
                            0,
                            0,
                            {{kRaised, "WARNING: setresgid(-1, 0, -1)"},
                             {kRaised, "WARNING: setresuid(-1, 0, -1)"},
                             {kRaised, "WARNING: setresuid(-1, 0, -1)"}}};
const Ids kUserForGood{
    "UserForGood",
    kUser,
    kGroup,
    kUser,
    kGroup,
    {{kFailed, "ERROR: setresgid(-1, 0, -1) [Operation not permitted]"}, {kFailed, "ERROR: ENTERCriticalSection"}},
    false};
const Ids kUserForGoodInRootsGroup{
    "UserForGoodInRootsGroup",
    kUser,
    0,
    kUser,
    0,
    {{kFailed, "ERROR: setresuid(-1, 0, -1) [Operation not permitted]"}, {kFailed, "ERROR: ENTERCriticalSection"}},
    false};

/// The group may be raised, then the user may not: the group has to come back.
const Ids kUserWhoMayRaiseTheGroupOnly{"UserWhoMayRaiseTheGroupOnly",
                                       kUser,
                                       kGroup,
                                       kUser,
                                       0,
                                       {{kRaised, "WARNING: setresgid(-1, 0, -1)"},
                                        {kFailed, "ERROR: setresuid(-1, 0, -1) [Operation not permitted]"},
                                        {kFailed, "ERROR: ENTERCriticalSection"}},
                                       false};

/// Something that reads configuration files when it is constructed.
struct Reader {
    const char *name;
    const char *profile;
    const char *clientID;
    std::vector<std::string> sources;        // those that read a file, in their order
    std::function<std::string()> construct;  // gives the client ID that it then has
};

void PrintTo(const Reader &reader, std::ostream *stream) { *stream << reader.name; }

template <typename Client>
std::string ConstructClient() {
    return Client().GetClientID();
}

std::string ConstructProfile() { return TAVO::SSO::SSOProfile().GetSSOClient()->GetClientID(); }

std::vector<Reader> Readers() {
    return {
        {"AzureClient", "azure", "azure-id", {"azuresso"}, ConstructClient<TAVO::SSO::AzureSSOClient>},
        {"WebSphereClient",
         "websphere",
         "websphere-id",
         {"webspheresso"},
         ConstructClient<TAVO::SSO::WebSphereSSOClient>},
        {"AzureProfile", "azure", "azure-id", {"profile", "azuresso"}, ConstructProfile},
        {"WebSphereProfile", "websphere", "websphere-id", {"profile", "webspheresso"}, ConstructProfile},
    };
}

void WriteFilesThatOnlyRootMayRead(const std::string &profile) {
    RemoveFiles();
    WriteFile(kProfileFile, R"({"sso_enable": true, "sso_profile": ")" + profile + "\"}");
    WriteFile(kAzureFile, R"({"azure_client_id": "azure-id"})");
    WriteFile(kWebSphereFile, R"({"websphere_client_id": "websphere-id"})");
    for (const char *folder : {"/usr/tavo/etc/ssoclient", "/usr/tavo/etc"}) {
        ASSERT_EQ(chmod(folder, 0700), 0);
    }
}

std::vector<unsigned int> CurrentIds() {
    uid_t users[3];
    gid_t groups[3];
    EXPECT_EQ(getresuid(&users[0], &users[1], &users[2]), 0);
    EXPECT_EQ(getresgid(&groups[0], &groups[1], &groups[2]), 0);
    return {users[0], users[1], users[2], groups[0], groups[1], groups[2]};
}

/// Runs what is given in a child process that has become those ids; its failures are this test's.
void RunAs(const Ids &ids, const std::function<void()> &body) {
    std::fflush(nullptr);
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        if (setresgid(ids.group, ids.group, ids.savedGroup) != 0 || setresuid(ids.user, ids.user, ids.savedUser) != 0) {
            ADD_FAILURE() << "cannot become " << ids.name;
        } else {
            body();
        }
        std::fflush(nullptr);
        _exit(::testing::Test::HasFailure() ? 1 : 0);
    }
    int status = 0;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << "status " << status << " of the child";
}

class Ownership : public ::testing::TestWithParam<std::tuple<Ids, Reader>> {
  protected:
    static const Ids &ids() { return std::get<0>(GetParam()); }
    static const Reader &reader() { return std::get<1>(GetParam()); }

    static std::vector<std::string> SourcesThatRead() {
        std::vector<std::string> sources = reader().sources;
        if (!ids().mayRead) {
            sources.resize(1);  // a profile that was not read names no client
        }
        return sources;
    }

    static std::vector<LogLine> ExpectedLog() {
        std::vector<LogLine> lines;
        for (const std::string &source : SourcesThatRead()) {
            for (const LogLine &line : ids().log) {
                lines.push_back({line.priority, source + ":N " + line.text});
            }
        }
        return lines;
    }
};

TEST_P(Ownership, IsRootsForTheReadingAndThenAsItWas) {
    WriteFilesThatOnlyRootMayRead(reader().profile);
    RunAs(ids(), [] {
        const std::vector<unsigned int> before = CurrentIds();
        EXPECT_EQ(access(kAzureFile, R_OK) == 0, ids().user == 0) << "the file is not root's alone";

        errorsAtReading.clear();
        errno = EINTR;
        const std::string clientID = reader().construct();
        const int error = errno;

        EXPECT_EQ(clientID, ids().mayRead ? reader().clientID : "");
        EXPECT_EQ(CurrentIds(), before);
        EXPECT_THAT(errorsAtReading, SizeIs(SourcesThatRead().size()));
        EXPECT_THAT(errorsAtReading, Each(ids().mayRead ? 0 : 1));
        EXPECT_EQ(error, 0);  // nothing had to be put back, or all was
        EXPECT_THAT(TakeSystemLog(), ElementsAreArray(ExpectedLog()));
    });
}

INSTANTIATE_TEST_SUITE_P(
    OfTheProcess, Ownership,
    ::testing::Combine(::testing::Values(kRoot, kRootInAnotherGroup, kUserInRootsGroup, kUserWhoMayGoBack, kUserForGood,
                                         kUserForGoodInRootsGroup, kUserWhoMayRaiseTheGroupOnly),
                       ::testing::ValuesIn(Readers())),
    [](const auto &row) { return std::string(std::get<0>(row.param).name) + std::get<1>(row.param).name; });

TEST(LogIn, ReadsTheProfileWithTheIdsThatTheProcessHas) {
    WriteFilesThatOnlyRootMayRead("azure");
    RunAs(kUserWhoMayGoBack, [] {
        std::string userName = "as it was before";
        try {
            TAVO::SSO::OIDCLogin("a code", userName);
            ADD_FAILURE() << "the profile was read";
        } catch (const TAVO::SSO::sso_op_failed &error) {
            EXPECT_STREQ(error.what(), "read profile file failed.");
        }
        EXPECT_EQ(userName, "as it was before");
        EXPECT_THAT(TakeSystemLog(), IsEmpty());
    });
}

bool IsMapped(const char *map, unsigned int id) {
    std::ifstream ranges(map);
    unsigned long inside = 0;
    unsigned long outside = 0;
    unsigned long length = 0;
    while (ranges >> inside >> outside >> length) {
        if (id >= inside && id - inside < length) {
            return true;
        }
    }
    return false;
}

}  // namespace

}  // namespace Test

int main(int count, char **arguments) {
    constexpr int kNotRun = 77;  // as the build tells ctest
    ::testing::InitGoogleMock(&count, arguments);
    if (!Test::IsMapped("/proc/self/uid_map", Test::kUser) || !Test::IsMapped("/proc/self/gid_map", Test::kGroup)) {
        std::puts("Not run: an ordinary user has no other ids to change to. Run it as root.");
        return kNotRun;
    }
    return RUN_ALL_TESTS();
}
