// RootPrivilege, tested through the constructor of a client, which reads its file with it.
#include <cerrno>
#include <filesystem>
#include <new>

#include "sso/sso.h"
#include "tests/support/interposed/calls.h"
#include "tests/support/interposed/memory.h"
#include "tests/support/interposed/process.h"
#include "tests/unit/fixture.h"

namespace Test {

namespace {

using namespace TAVO::SSO;
using testing::ElementsAre;
using testing::IsEmpty;

LogLine AuthError(const std::string &text) { return {LOG_AUTH | LOG_ERR, "azuresso:N ERROR: " + text}; }
LogLine AuthWarning(const std::string &text) { return {LOG_AUTH | LOG_INFO, "azuresso:N WARNING: " + text}; }

class RootPrivilege : public Library {
  protected:
    /// Constructs a client in a process with these ids. The change of ids number `failing` fails; 0 means none.
    void ReadAs(uid_t uid, gid_t gid, int failing = 0) {
        WriteFile(kAzureFile, R"({"azure_client_id": "read"})");
        SetEffectiveIDs(uid, gid);
        FailSetID(failing);
        errno = EDOM;
        AzureSSOClient client;
        errno_ = errno;
        EXPECT_EQ(client.GetClientID(), "read") << "a failed change must not stop the read";
    }

    int errno_ = 0;
};

TEST_F(RootPrivilege, ChangesAndLogsNothingAsRoot) {
    ReadAs(0, 0);
    EXPECT_THAT(TakeSetIDCalls(), IsEmpty());
    EXPECT_THAT(TakeSystemLog(), IsEmpty());
    EXPECT_EQ(errno_, 0);
}

TEST_F(RootPrivilege, LogsRaiseButNotRestoreOfGroup) {
    ReadAs(0, 100);
    EXPECT_THAT(TakeSetIDCalls(), ElementsAre("setresgid(-1, 0, -1)", "setresgid(-1, 100, -1)"));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(AuthWarning("setresgid(-1, 0, -1)")));
    EXPECT_EQ(EffectiveGID(), 100u);
    EXPECT_EQ(errno_, 0);
}

TEST_F(RootPrivilege, RaisesGroupFirstAndRestoresThroughUser0) {
    ReadAs(1024, 100);
    EXPECT_THAT(TakeSetIDCalls(), ElementsAre("setresgid(-1, 0, -1)", "setresuid(-1, 0, -1)", "setresuid(-1, 0, -1)",
                                              "setresgid(-1, 100, -1)", "setresuid(-1, 1024, -1)"));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(AuthWarning("setresgid(-1, 0, -1)"), AuthWarning("setresuid(-1, 0, -1)"),
                                             AuthWarning("setresuid(-1, 0, -1)")));
    EXPECT_EQ(EffectiveUID(), 1024u);
    EXPECT_EQ(EffectiveGID(), 100u);
    EXPECT_EQ(ErrnoAtOpen(), 0);
    EXPECT_EQ(errno_, 0);
}

TEST_F(RootPrivilege, KeepsGroup0WhenRaisingUser) {
    ReadAs(1024, 0);
    EXPECT_THAT(TakeSetIDCalls(),
                ElementsAre("setresuid(-1, 0, -1)", "setresuid(-1, 0, -1)", "setresuid(-1, 1024, -1)"));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(AuthWarning("setresuid(-1, 0, -1)"), AuthWarning("setresuid(-1, 0, -1)")));
}

TEST_F(RootPrivilege, KeepsUserIfGroupCannotBeRaised) {
    ReadAs(1024, 100, 1);
    EXPECT_THAT(TakeSetIDCalls(), ElementsAre("setresgid(-1, 0, -1)"));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(AuthError("setresgid(-1, 0, -1) [Operation not permitted]"),
                                             AuthError("ENTERCriticalSection")));
    EXPECT_EQ(ErrnoAtOpen(), 1);
    EXPECT_EQ(errno_, 0) << "no id was changed, so none is restored";
}

TEST_F(RootPrivilege, RestoresGroupIfUserCannotBeRaised) {
    ReadAs(1024, 100, 2);
    EXPECT_THAT(TakeSetIDCalls(),
                ElementsAre("setresgid(-1, 0, -1)", "setresuid(-1, 0, -1)", "setresgid(-1, 100, -1)"));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(AuthWarning("setresgid(-1, 0, -1)"),
                                             AuthError("setresuid(-1, 0, -1) [Operation not permitted]"),
                                             AuthError("ENTERCriticalSection")));
    EXPECT_EQ(ErrnoAtOpen(), 1);
    EXPECT_EQ(EffectiveGID(), 100u);
}

TEST_F(RootPrivilege, RestoresNothingIfReturnToUser0Fails) {
    ReadAs(1024, 100, 3);
    EXPECT_THAT(TakeSetIDCalls(), ElementsAre("setresgid(-1, 0, -1)", "setresuid(-1, 0, -1)", "setresuid(-1, 0, -1)"));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(AuthWarning("setresgid(-1, 0, -1)"), AuthWarning("setresuid(-1, 0, -1)"),
                                             AuthError("setresuid(-1, 0, -1) [Operation not permitted]"),
                                             AuthError("LEAVECriticalSection")));
    EXPECT_EQ(errno_, 1);
}

TEST_F(RootPrivilege, KeepsUserIfGroupCannotBeRestored) {
    ReadAs(1024, 100, 4);
    EXPECT_THAT(TakeSetIDCalls(), ElementsAre("setresgid(-1, 0, -1)", "setresuid(-1, 0, -1)", "setresuid(-1, 0, -1)",
                                              "setresgid(-1, 100, -1)"));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(AuthWarning("setresgid(-1, 0, -1)"), AuthWarning("setresuid(-1, 0, -1)"),
                                             AuthWarning("setresuid(-1, 0, -1)"),
                                             AuthError("setresgid(-1, 100, -1) [Operation not permitted]"),
                                             AuthError("LEAVECriticalSection")));
    EXPECT_EQ(errno_, 1);
}

TEST_F(RootPrivilege, LogsIdIfUserCannotBeRestored) {
    ReadAs(1024, 100, 5);
    EXPECT_THAT(TakeSystemLog(), ElementsAre(AuthWarning("setresgid(-1, 0, -1)"), AuthWarning("setresuid(-1, 0, -1)"),
                                             AuthWarning("setresuid(-1, 0, -1)"),
                                             AuthError("setresuid(-1, 1024, -1) [Operation not permitted]"),
                                             AuthError("LEAVECriticalSection")));
    EXPECT_EQ(errno_, 1);
}

TEST_F(RootPrivilege, LogsNumberOfUnknownError) {
    WriteFile(kAzureFile, "{}");
    SetEffectiveIDs(0, 100);
    FailSetID(1, 9999);
    AzureSSOClient client;
    EXPECT_THAT(TakeSystemLog(),
                ElementsAre(AuthError("setresgid(-1, 0, -1) [Unknown error 9999]"), AuthError("ENTERCriticalSection")));
}

TEST_F(RootPrivilege, ClosesFileAndSetsCloseOnExec) {
    const auto openFiles = [] {
        const std::filesystem::directory_iterator files("/proc/self/fd");
        return std::distance(begin(files), end(files));
    };
    const auto before = openFiles();
    ReadAs(0, 0);
    SSOProfile profile;
    EXPECT_EQ(openFiles(), before);
    EXPECT_EQ(ModeAtOpen(), "re") << "executed programs must not inherit the file";
}

TEST_F(RootPrivilege, OverwritesBuffersAfterReading) {
    TakeCleansed();
    ReadAs(0, 0);
    const std::vector<std::string> cleansed = TakeCleansed();
    const std::string content = R"({"azure_client_id": "read"})";
    EXPECT_THAT(cleansed, testing::Contains(content)) << "the file's content";
    EXPECT_THAT(cleansed, testing::Contains(testing::AllOf(testing::StartsWith(content), testing::SizeIs(4096))))
        << "the buffer for reading";
}

TEST_F(RootPrivilege, RestoresIdsIfMemoryRunsOut) {
    WriteFile(kAzureFile, R"({"azure_client_id": ")" + std::string(100000, 'x') + "\"}");
    SetEffectiveIDs(1024, 100);
    {
        const MemoryLimit limit(50000);
        EXPECT_THROW(AzureSSOClient(), std::bad_alloc);
    }
    EXPECT_EQ(EffectiveUID(), 1024u);
    EXPECT_EQ(EffectiveGID(), 100u);
    EXPECT_EQ(TakeSystemLog().size(), 3u);
}

TEST_F(RootPrivilege, LogsNameOfReadingSource) {
    const auto sourceOf = [](auto construct) {
        SetEffectiveIDs(0, 100);
        construct();
        const std::vector<LogLine> lines = TakeSystemLog();
        return lines.size() == 1 ? lines.front().text : "not one line";
    };
    EXPECT_EQ(sourceOf([] { AzureSSOClient(); }), "azuresso:N WARNING: setresgid(-1, 0, -1)");
    EXPECT_EQ(sourceOf([] { WebSphereSSOClient(); }), "webspheresso:N WARNING: setresgid(-1, 0, -1)");
    EXPECT_EQ(sourceOf([] { SSOProfile(); }), "profile:N WARNING: setresgid(-1, 0, -1)");
}

}  // namespace

}  // namespace Test
