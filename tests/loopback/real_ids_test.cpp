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
#include "tests/support/emulation.h"
#include "tests/support/files.h"
#include "tests/support/refused_calls.h"
#include "tests/support/system_log.h"

namespace {

std::vector<int> errorsAtReading;  // errno at each fopen of the library
std::function<void()> atNextOpen;  // called once, at the next fopen

}  // namespace

extern "C" FILE *fopen(const char *path, const char *mode) {
    errorsAtReading.push_back(errno);
    if (const auto happens = std::exchange(atNextOpen, nullptr)) {
        happens();
    }
    static const auto realOpen = reinterpret_cast<FILE *(*)(const char *, const char *)>(dlsym(RTLD_NEXT, "fopen"));
    return realOpen(path, mode);
}

// Reading configuration files in a process that drops root's ids permanently or temporarily. The kernel permits or
// refuses each change of ids.
namespace Test {

namespace {

using ::testing::ElementsAreArray;
using ::testing::IsEmpty;

constexpr uid_t kUser = 1024;
constexpr gid_t kGroup = 100;

/// The real ids, which are also the effective ids, and the saved ids.
struct Ids {
    uid_t user;
    gid_t group;
    uid_t savedUser;
    gid_t savedGroup;
};

constexpr Ids kRoot{0, 0, 0, 0};
constexpr Ids kRootInAnotherGroup{0, kGroup, 0, 0};
constexpr Ids kUserInRootsGroup{kUser, 0, 0, 0};
constexpr Ids kUserWhoMayReturn{kUser, kGroup, 0, 0};
constexpr Ids kPermanentUser{kUser, kGroup, kUser, kGroup};
constexpr Ids kPermanentUserInRootsGroup{kUser, 0, kUser, 0};
constexpr Ids kUserWhoMayRaiseTheGroupOnly{kUser, kGroup, kUser, 0};

struct EffectiveIds {
    uid_t user;
    gid_t group;
};

/// The expected result of reading one file.
struct Reading {
    std::vector<LogLine> log = {};  // without the name of the source
    bool succeeds = true;
    int errorAtOpening = 0;
    int error = 0;
    std::optional<EffectiveIds> left = std::nullopt;  // ids after reading; unset: unchanged
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

/// The return to user 0 is the same call as the raise. Only its position in time distinguishes it.
enum class Refused { kFromTheStart, kAfterTheRaise };

struct Case {
    const char *name;
    Ids ids;
    Reading first;
    std::vector<IdChange> refusals = {};
    Refused refused = Refused::kFromTheStart;
    std::optional<Reading> later = std::nullopt;  // for later files; unset: as `first`
    bool inNamespace = false;                     // a namespace that maps only these ids; the files belong to its user
};

void PrintTo(const Case &row, std::ostream *stream) { *stream << row.name; }

const Reading kReadWithoutACall{};
const Reading kGroupIsNotRaised{{kGroupNotRaised, kNotEntered}, false, 1};
const Reading kUserIsNotRaised{{kUserNotRaised, kNotEntered}, false, 1};
const Reading kOnlyGroupIsRaised{{kGroupRaised, kUserNotRaised, kNotEntered}, false, 1};

/// Cases that depend only on the ids.
std::vector<Case> Allowed() {
    return {
        {"Root", kRoot, kReadWithoutACall},
        {"RootInAnotherGroup", kRootInAnotherGroup, {{kGroupRaised}}},
        {"UserInRootsGroup", kUserInRootsGroup, {{kUserRaised, kUserRaised}}},
        {"UserWhoMayReturn", kUserWhoMayReturn, {{kGroupRaised, kUserRaised, kUserRaised}}},
        {"PermanentUser", kPermanentUser, kGroupIsNotRaised},
        {"PermanentUserInRootsGroup", kPermanentUserInRootsGroup, kUserIsNotRaised},
        // The group is raised, the user cannot be: the group must be restored.
        {"UserWhoMayRaiseTheGroupOnly", kUserWhoMayRaiseTheGroupOnly, kOnlyGroupIsRaised},
    };
}

constexpr IdChange kRaiseGroup{SYS_setresgid, 0};
constexpr IdChange kRaiseUser{SYS_setresuid, 0};
constexpr IdChange kRestoreGroup{SYS_setresgid, kGroup};
constexpr IdChange kRestoreUser{SYS_setresuid, kUser};

/// A system call filter refuses changes that the ids permit.
std::vector<Case> RaiseRefused() {
    return {
        {"GroupOfAUser", kUserWhoMayReturn, kGroupIsNotRaised, {kRaiseGroup}},
        // Root owns the files: a failed raise does not prevent reading.
        {"GroupOfRoot", kRootInAnotherGroup, {{kGroupNotRaised, kNotEntered}, true, 1}, {kRaiseGroup}},
        {"UserAfterTheGroup", kUserWhoMayReturn, kOnlyGroupIsRaised, {kRaiseUser}},
        {"UserAlone", kUserInRootsGroup, kUserIsNotRaised, {kRaiseUser}},
        {"UserAndThenRestoreOfGroup",
         kUserWhoMayReturn,
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
const Reading kReadWhileStillRoot{{}, true, 0, 0, kRootsIds};

std::vector<Case> DropRefused() {
    return {
        {"ReturnToRoot",
         kUserWhoMayReturn,
         {{kGroupRaised, kUserRaised, kUserNotRaised, kNotLeft}, true, 0, 1, kRootsIds},
         {kRaiseUser},
         Refused::kAfterTheRaise,
         kReadWhileStillRoot},
        {"ReturnToRootOfRootsGroup",
         kUserInRootsGroup,
         {{kUserRaised, kUserNotRaised, kNotLeft}, true, 0, 1, kRootsIds},
         {kRaiseUser},
         Refused::kAfterTheRaise,
         kReadWhileStillRoot},
        {"GroupOfAUser",
         kUserWhoMayReturn,
         {{kGroupRaised, kUserRaised, kUserRaised, kGroupNotRestored, kNotLeft}, true, 0, 1, kRootsIds},
         {kRestoreGroup},
         Refused::kFromTheStart,
         kReadWhileStillRoot},
        {"GroupOfRoot",
         kRootInAnotherGroup,
         {{kGroupRaised, kGroupNotRestored, kNotLeft}, true, 0, 1, kRootsIds},
         {kRestoreGroup},
         Refused::kFromTheStart,
         kReadWhileStillRoot},
        // The group was restored, so later reads raise and restore it again.
        {"UserAfterTheGroup",
         kUserWhoMayReturn,
         {{kGroupRaised, kUserRaised, kUserRaised, kUserNotRestored, kNotLeft}, true, 0, 1, EffectiveIds{0, kGroup}},
         {kRestoreUser},
         Refused::kFromTheStart,
         Reading{{kGroupRaised}, true, 0, 0, EffectiveIds{0, kGroup}}},
        {"UserAlone",
         kUserInRootsGroup,
         {{kUserRaised, kUserRaised, kUserNotRestored, kNotLeft}, true, 0, 1, kRootsIds},
         {kRestoreUser},
         Refused::kFromTheStart,
         kReadWhileStillRoot},
    };
}

/// The namespace has no root. These cases also run as an ordinary user.
std::vector<Case> NamespaceWithoutRoot() {
    const Reading noGroup{{Failed("setresgid(-1, 0, -1) [Invalid argument]"), kNotEntered}, true, 1};
    const Reading noUser{{Failed("setresuid(-1, 0, -1) [Invalid argument]"), kNotEntered}, true, 1};
    return {
        {"User", kPermanentUser, noGroup, {}, {}, {}, true},
        {"UserInRootsGroup", kPermanentUserInRootsGroup, noUser, {}, {}, {}, true},
    };
}

/// A class that reads configuration files in its constructor.
struct Reader {
    const char *name;
    const char *profile;
    const char *clientID;
    std::vector<std::string> sources;        // the sources that read files, in order
    std::function<std::string()> construct;  // returns the client ID that was read
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

/// Writes to an existing file.
bool WriteExisting(const std::string &path, const std::string &text) {
    std::ofstream file(path, std::ios::in);
    return static_cast<bool>(file << text << std::flush);
}

/// Enters a new user namespace that maps only these ids.
bool MakeNamespaceOf(const Ids &ids) {
    const std::string user = std::to_string(geteuid());
    const std::string group = std::to_string(getegid());
    return unshare(CLONE_NEWUSER) == 0 && WriteExisting("/proc/self/setgroups", "deny") &&
           WriteExisting("/proc/self/uid_map", std::to_string(ids.user) + " " + user + " 1") &&
           WriteExisting("/proc/self/gid_map", std::to_string(ids.group) + " " + group + " 1");
}

bool Become(const Ids &ids) {
    return setresgid(ids.group, ids.group, ids.savedGroup) == 0 && setresuid(ids.user, ids.user, ids.savedUser) == 0;
}

/// Runs `body` in a child process. Its failures count for this test; an exception ends the child.
void RunInChild(const std::function<void()> &body) noexcept {
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

    static void ChangeIds() {
        ASSERT_TRUE(row().inNamespace ? MakeNamespaceOf(row().ids) : Become(row().ids)) << std::strerror(errno);
        EXPECT_EQ(access(kAzureFile, R_OK) == 0, row().ids.user == 0 || row().inNamespace)
            << "unexpected access to the file";
        if (row().refused == Refused::kAfterTheRaise) {
            atNextOpen = [] { RefuseIdChanges(row().refusals); };
        } else if (!row().refusals.empty()) {
            RefuseIdChanges(row().refusals);
        }
    }

    /// The expected result for each file.
    static std::vector<Reading> Readings(const Reading &first, const Reading &others) {
        std::vector<Reading> readings(reader().sources.size(), others);
        readings.front() = first;
        if (!first.succeeds) {
            readings.resize(1);  // an unread profile selects no client
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
    if (IsEmulated() && (row().inNamespace || !row().refusals.empty())) {
        GTEST_SKIP() << "qemu-user has neither system call filters nor user namespaces";
    }
    WriteFilesThatOnlyRootMayRead(reader().profile);
    RunInChild([] {
        ASSERT_NO_FATAL_FAILURE(ChangeIds());
        const Reading later = row().later.value_or(row().first);
        ExpectToRead(Readings(row().first, later));
        SCOPED_TRACE("second read in the same process");
        ExpectToRead(Readings(later, later));
    });
}

constexpr auto NameOfTest = [](const auto &row) {
    return std::string(std::get<0>(row.param).name) + std::get<1>(row.param).name;
};

#define INSTANTIATE_REAL_IDS(suite, cases) \
    INSTANTIATE_TEST_SUITE_P(              \
        suite, RealIds, ::testing::Combine(::testing::ValuesIn(cases), ::testing::ValuesIn(Readers())), NameOfTest)

INSTANTIATE_REAL_IDS(Allowed, Allowed());
INSTANTIATE_REAL_IDS(RaiseRefused, RaiseRefused());
INSTANTIATE_REAL_IDS(DropRefused, DropRefused());
INSTANTIATE_REAL_IDS(NamespaceWithoutRoot, NamespaceWithoutRoot());

TEST(OIDCLogin, ReadsProfileWithoutRaisingIds) {
    WriteFilesThatOnlyRootMayRead("azure");
    RunInChild([] {
        ASSERT_TRUE(Become(kUserWhoMayReturn));
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
    constexpr int kNotRun = 77;  // SKIP_RETURN_CODE in CMakeLists.txt
    ::testing::InitGoogleMock(&count, arguments);
    if (Test::IsMapped("/proc/self/uid_map", Test::kUser) && Test::IsMapped("/proc/self/gid_map", Test::kGroup)) {
        return RUN_ALL_TESTS();
    }
    GTEST_FLAG_SET(filter, "NamespaceWithoutRoot/*");
    const int result = RUN_ALL_TESTS();
    std::puts("Not run: all other tests need root.");
    return result == 0 ? kNotRun : result;
}
