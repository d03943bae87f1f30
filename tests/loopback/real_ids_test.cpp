#include <dlfcn.h>
#include <gmock/gmock.h>
#include <sched.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <syslog.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <functional>
#include <optional>
#include <ostream>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "sso/sso.h"
#include "tests/support/files.h"
#include "tests/support/refused_calls.h"
#include "tests/support/system_log.h"

namespace {

std::vector<int> errorsAtReading;         // errno, whenever a file is opened for the library
std::function<void()> whenAFileIsOpened;  // what happens then, once

}  // namespace

extern "C" FILE *fopen(const char *path, const char *mode) {
    errorsAtReading.push_back(errno);
    if (const auto happens = std::exchange(whenAFileIsOpened, nullptr)) {
        happens();
    }
    static const auto realOpen = reinterpret_cast<FILE *(*)(const char *, const char *)>(dlsym(RTLD_NEXT, "fopen"));
    return realOpen(path, mode);
}

// What a web front end does that runs under ids of its own: it becomes them for good, or keeps the right to go back to
// root's, and then reads files that only root may read. The kernel grants the changes of the ids, or refuses them.
namespace Test {

namespace {

using ::testing::ElementsAreArray;
using ::testing::IsEmpty;

constexpr uid_t kUser = 1024;
constexpr gid_t kGroup = 100;

/// The real and effective ids, and those that the process may go back to.
struct Ids {
    uid_t user;
    gid_t group;
    uid_t savedUser;
    gid_t savedGroup;
};

constexpr Ids kRoot{0, 0, 0, 0};
constexpr Ids kRootInAnotherGroup{0, kGroup, 0, 0};
constexpr Ids kUserInRootsGroup{kUser, 0, 0, 0};
constexpr Ids kUserWhoMayGoBack{kUser, kGroup, 0, 0};
constexpr Ids kUserForGood{kUser, kGroup, kUser, kGroup};
constexpr Ids kUserForGoodInRootsGroup{kUser, 0, kUser, 0};
constexpr Ids kUserWhoMayRaiseTheGroupOnly{kUser, kGroup, kUser, 0};

struct EffectiveIds {
    uid_t user;
    gid_t group;
};

/// How one file is read.
struct Reading {
    std::vector<LogLine> log = {};  // without the source's name
    bool succeeds = true;
    int errorAtOpening = 0;
    int error = 0;
    std::optional<EffectiveIds> left = std::nullopt;  // what the process is left with; none: what it had
};

LogLine Raised(const std::string &call) { return {LOG_AUTH | LOG_INFO, "WARNING: " + call}; }
LogLine Failed(const std::string &what) { return {LOG_AUTH | LOG_ERR, "ERROR: " + what}; }

const LogLine kGroupRaised = Raised("setresgid(-1, 0, -1)");
const LogLine kUserRaised = Raised("setresuid(-1, 0, -1)");
const LogLine kGroupNotRaised = Failed("setresgid(-1, 0, -1) [Operation not permitted]");
const LogLine kUserNotRaised = Failed("setresuid(-1, 0, -1) [Operation not permitted]");
const LogLine kGroupNotRestored = Failed("setresgid(-1, 100, -1) [Operation not permitted]");
const LogLine kUserNotRestored = Failed("setresuid(-1, 1024, -1) [Operation not permitted]");
const LogLine kNotEntered = Failed("ENTERCriticalSection");
const LogLine kNotLeft = Failed("LEAVECriticalSection");

/// No call of the library's tells the raise of the user from the return to it: only the time does.
enum class Refused { kFromTheStart, kAfterTheRaise };

struct Case {
    const char *name;
    Ids ids;
    Reading first;
    std::vector<IdChange> refusals = {};
    Refused refused = Refused::kFromTheStart;
    std::optional<Reading> later = std::nullopt;  // how the process then reads other files; none: like the first
    bool ofANamespace = false;                    // that has those ids alone, and in which the files are its user's
};

void PrintTo(const Case &row, std::ostream *stream) { *stream << row.name; }

const Reading kReadWithoutACall{};
const Reading kGroupIsNotRaised{{kGroupNotRaised, kNotEntered}, false, 1};
const Reading kUserIsNotRaised{{kUserNotRaised, kNotEntered}, false, 1};
const Reading kOnlyGroupIsRaised{{kGroupRaised, kUserNotRaised, kNotEntered}, false, 1};

/// As the ids themselves allow it.
std::vector<Case> Allowed() {
    return {
        {"Root", kRoot, kReadWithoutACall},
        {"RootInAnotherGroup", kRootInAnotherGroup, {{kGroupRaised}}},
        {"UserInRootsGroup", kUserInRootsGroup, {{kUserRaised, kUserRaised}}},
        {"UserWhoMayGoBack", kUserWhoMayGoBack, {{kGroupRaised, kUserRaised, kUserRaised}}},
        {"UserForGood", kUserForGood, kGroupIsNotRaised},
        {"UserForGoodInRootsGroup", kUserForGoodInRootsGroup, kUserIsNotRaised},
        // The group may be raised, then the user may not: the group has to come back.
        {"UserWhoMayRaiseTheGroupOnly", kUserWhoMayRaiseTheGroupOnly, kOnlyGroupIsRaised},
    };
}

constexpr IdChange kRaiseGroup{SYS_setresgid, 0};
constexpr IdChange kRaiseUser{SYS_setresuid, 0};
constexpr IdChange kRestoreGroup{SYS_setresgid, kGroup};
constexpr IdChange kRestoreUser{SYS_setresuid, kUser};

/// A policy of the machine refuses what the ids allow.
std::vector<Case> RefusedAtTheRaise() {
    return {
        {"GroupOfAUser", kUserWhoMayGoBack, kGroupIsNotRaised, {kRaiseGroup}},
        // Whose files they are nevertheless: a failed raise does not stop the reading.
        {"GroupOfRoot", kRootInAnotherGroup, {{kGroupNotRaised, kNotEntered}, true, 1}, {kRaiseGroup}},
        {"UserAfterTheGroup", kUserWhoMayGoBack, kOnlyGroupIsRaised, {kRaiseUser}},
        {"UserAlone", kUserInRootsGroup, kUserIsNotRaised, {kRaiseUser}},
        {"UserAndThenTheGroupsRestoring",
         kUserWhoMayGoBack,
         {{kGroupRaised, kUserNotRaised, kNotEntered, kGroupNotRestored, kNotLeft},
          false,
          1,
          1,
          EffectiveIds{kUser, 0}},
         {kRaiseUser, kRestoreGroup},
         Refused::kFromTheStart,
         Reading{{kUserNotRaised, kNotEntered}, false, 1, 0, EffectiveIds{kUser, 0}}},
    };
}

const EffectiveIds kRootsIds{0, 0};
const Reading kReadByWhoStayedRoot{{}, true, 0, 0, kRootsIds};

std::vector<Case> RefusedAtLeaving() {
    return {
        {"ReturnToRoot",
         kUserWhoMayGoBack,
         {{kGroupRaised, kUserRaised, kUserNotRaised, kNotLeft}, true, 0, 1, kRootsIds},
         {kRaiseUser},
         Refused::kAfterTheRaise,
         kReadByWhoStayedRoot},
        {"ReturnToRootOfRootsGroup",
         kUserInRootsGroup,
         {{kUserRaised, kUserNotRaised, kNotLeft}, true, 0, 1, kRootsIds},
         {kRaiseUser},
         Refused::kAfterTheRaise,
         kReadByWhoStayedRoot},
        {"GroupOfAUser",
         kUserWhoMayGoBack,
         {{kGroupRaised, kUserRaised, kUserRaised, kGroupNotRestored, kNotLeft}, true, 0, 1, kRootsIds},
         {kRestoreGroup},
         Refused::kFromTheStart,
         kReadByWhoStayedRoot},
        {"GroupOfRoot",
         kRootInAnotherGroup,
         {{kGroupRaised, kGroupNotRestored, kNotLeft}, true, 0, 1, kRootsIds},
         {kRestoreGroup},
         Refused::kFromTheStart,
         kReadByWhoStayedRoot},
        // The group is its own again, and so is raised and restored for whatever is read later.
        {"UserAfterTheGroup",
         kUserWhoMayGoBack,
         {{kGroupRaised, kUserRaised, kUserRaised, kUserNotRestored, kNotLeft}, true, 0, 1, EffectiveIds{0, kGroup}},
         {kRestoreUser},
         Refused::kFromTheStart,
         Reading{{kGroupRaised}, true, 0, 0, EffectiveIds{0, kGroup}}},
        {"UserAlone",
         kUserInRootsGroup,
         {{kUserRaised, kUserRaised, kUserNotRestored, kNotLeft}, true, 0, 1, kRootsIds},
         {kRestoreUser},
         Refused::kFromTheStart,
         kReadByWhoStayedRoot},
    };
}

/// There is no root to become. Nothing but the ids that an ordinary user of the machine has is needed for this.
std::vector<Case> OfANamespaceWithoutRoot() {
    const Reading noGroup{{Failed("setresgid(-1, 0, -1) [Invalid argument]"), kNotEntered}, true, 1};
    const Reading noUser{{Failed("setresuid(-1, 0, -1) [Invalid argument]"), kNotEntered}, true, 1};
    return {
        {"User", kUserForGood, noGroup, {}, {}, {}, true},
        {"UserInRootsGroup", kUserForGoodInRootsGroup, noUser, {}, {}, {}, true},
    };
}

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

/// Writes to a file that has been there before.
bool Tell(const std::string &path, const std::string &text) {
    std::ofstream file(path, std::ios::in);
    return static_cast<bool>(file << text << std::flush);
}

/// A new user namespace, in which the process has these ids and there are no others.
bool MakeNamespaceOf(const Ids &ids) {
    const std::string user = std::to_string(geteuid());
    const std::string group = std::to_string(getegid());
    return unshare(CLONE_NEWUSER) == 0 && Tell("/proc/self/setgroups", "deny") &&
           Tell("/proc/self/uid_map", std::to_string(ids.user) + " " + user + " 1") &&
           Tell("/proc/self/gid_map", std::to_string(ids.group) + " " + group + " 1");
}

bool Become(const Ids &ids) {
    return setresgid(ids.group, ids.group, ids.savedGroup) == 0 && setresuid(ids.user, ids.user, ids.savedUser) == 0;
}

/// Runs what is given in a child process; its failures are this test's, and what it throws ends it.
void RunInAChild(const std::function<void()> &body) noexcept {
    std::fflush(nullptr);
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        body();
        std::fflush(nullptr);
        _exit(::testing::Test::HasFailure() ? 1 : 0);
    }
    int status = 0;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << "status " << status << " of the child";
}

class RealIds : public ::testing::TestWithParam<std::tuple<Case, Reader>> {
  protected:
    static const Case &row() { return std::get<0>(GetParam()); }
    static const Reader &reader() { return std::get<1>(GetParam()); }

    static void BecomeTheProcess() {
        ASSERT_TRUE(row().ofANamespace ? MakeNamespaceOf(row().ids) : Become(row().ids)) << std::strerror(errno);
        EXPECT_EQ(access(kAzureFile, R_OK) == 0, row().ids.user == 0 || row().ofANamespace) << "whose is the file?";
        if (row().refused == Refused::kAfterTheRaise) {
            whenAFileIsOpened = [] { RefuseIdChanges(row().refusals); };
        } else if (!row().refusals.empty()) {
            RefuseIdChanges(row().refusals);
        }
    }

    /// Of each file, if the first and any others are to be read so.
    static std::vector<Reading> Readings(const Reading &first, const Reading &others) {
        std::vector<Reading> readings(reader().sources.size(), others);
        readings.front() = first;
        if (!first.succeeds) {
            readings.resize(1);  // a profile that was not read names no client
        }
        return readings;
    }

    static std::vector<LogLine> LogOf(const std::vector<Reading> &readings) {
        std::vector<LogLine> lines;
        for (std::size_t i = 0; i < readings.size(); ++i) {
            for (const LogLine &line : readings[i].log) {
                lines.push_back({line.priority, reader().sources[i] + ":N " + line.text});
            }
        }
        return lines;
    }

    static std::vector<unsigned int> IdsAfter(const Reading &reading) {
        const Ids &ids = row().ids;
        const EffectiveIds effective = reading.left.value_or(EffectiveIds{ids.user, ids.group});
        return {ids.user, effective.user, ids.savedUser, ids.group, effective.group, ids.savedGroup};
    }

    static void ExpectToRead(const std::vector<Reading> &readings) {
        std::vector<int> errorsAtOpening;
        for (const Reading &reading : readings) {
            errorsAtOpening.push_back(reading.errorAtOpening);
        }
        errorsAtReading.clear();
        errno = EINTR;
        const std::string clientID = reader().construct();
        const int error = errno;

        EXPECT_EQ(clientID, readings.back().succeeds ? reader().clientID : "");
        EXPECT_EQ(CurrentIds(), IdsAfter(readings.back()));
        EXPECT_EQ(errorsAtReading, errorsAtOpening);
        EXPECT_EQ(error, readings.back().error);
        EXPECT_THAT(TakeSystemLog(), ElementsAreArray(LogOf(readings)));
    }
};

TEST_P(RealIds, AreRaisedForReadingIfKernelAllows) {
    WriteFilesThatOnlyRootMayRead(reader().profile);
    RunInAChild([] {
        ASSERT_NO_FATAL_FAILURE(BecomeTheProcess());
        const Reading later = row().later.value_or(row().first);
        ExpectToRead(Readings(row().first, later));
        SCOPED_TRACE("another one in the same process");
        ExpectToRead(Readings(later, later));
    });
}

constexpr auto NameOfTest = [](const auto &row) {
    return std::string(std::get<0>(row.param).name) + std::get<1>(row.param).name;
};

#define INSTANTIATE_OWNERSHIP(suite, cases) \
    INSTANTIATE_TEST_SUITE_P(               \
        suite, RealIds, ::testing::Combine(::testing::ValuesIn(cases), ::testing::ValuesIn(Readers())), NameOfTest)

INSTANTIATE_OWNERSHIP(OfTheProcess, Allowed());
INSTANTIATE_OWNERSHIP(RefusedAtTheRaise, RefusedAtTheRaise());
INSTANTIATE_OWNERSHIP(RefusedAtLeaving, RefusedAtLeaving());
INSTANTIATE_OWNERSHIP(OfANamespaceWithoutRoot, OfANamespaceWithoutRoot());

TEST(OIDCLogin, ReadsProfileWithoutRaisingIds) {
    WriteFilesThatOnlyRootMayRead("azure");
    RunInAChild([] {
        ASSERT_TRUE(Become(kUserWhoMayGoBack));
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
    if (Test::IsMapped("/proc/self/uid_map", Test::kUser) && Test::IsMapped("/proc/self/gid_map", Test::kGroup)) {
        return RUN_ALL_TESTS();
    }
    GTEST_FLAG_SET(filter, "OfANamespaceWithoutRoot/*");
    const int result = RUN_ALL_TESTS();
    std::puts("Not run, all but these: an ordinary user has no other ids to change to. Run it as root.");
    return result == 0 ? kNotRun : result;
}
