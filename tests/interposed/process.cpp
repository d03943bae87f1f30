#include "tests/interposed/process.h"

#include <sys/random.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <optional>

#include "tests/interposed/calls.h"

namespace Test {

namespace {

std::optional<uid_t> effectiveUID;
std::optional<gid_t> effectiveGID;
std::optional<std::time_t> clockTime;
std::size_t failingCalloc = 0;
int setIDsUntilFailure = 0;
int setIDError = 0;
int errnoAtOpen = 0;
const char *modeAtOpen = "";
int entropyReads = 0;

std::vector<std::string> &SetIDCalls() {
    static std::vector<std::string> calls;
    return calls;
}

int SetID(const char *name, unsigned int real, unsigned int effective, unsigned int saved,
          std::optional<unsigned int> &id) {
    const auto text = [](unsigned int value) { return std::to_string(static_cast<int>(value)); };
    SetIDCalls().push_back(std::string(name) + "(" + text(real) + ", " + text(effective) + ", " + text(saved) + ")");
    if (--setIDsUntilFailure == 0) {
        errno = setIDError;
        return -1;
    }
    id = effective;
    return 0;
}

}  // namespace

void SetEffectiveIDs(uid_t uid, gid_t gid) {
    effectiveUID = uid;
    effectiveGID = gid;
}

uid_t EffectiveUID() { return *effectiveUID; }
gid_t EffectiveGID() { return *effectiveGID; }

void FailSetID(int n, int error) {
    setIDsUntilFailure = n;
    setIDError = error;
}

std::vector<std::string> TakeSetIDCalls() {
    std::vector<std::string> taken;
    taken.swap(SetIDCalls());
    return taken;
}

void SetClock(std::time_t now) { clockTime = now; }

int ErrnoAtOpen() { return errnoAtOpen; }
std::string ModeAtOpen() { return modeAtOpen; }

int EntropyReads() { return entropyReads; }

void FailCalloc(std::size_t size) { failingCalloc = size; }

void RestoreProcess() {
    effectiveUID.reset();
    effectiveGID.reset();
    clockTime.reset();
    failingCalloc = 0;
    setIDsUntilFailure = 0;
    TakeSetIDCalls();
}

}  // namespace Test

extern "C" {

uid_t geteuid() noexcept { return Test::effectiveUID ? *Test::effectiveUID : Test::Next(geteuid, "geteuid")(); }
gid_t getegid() noexcept { return Test::effectiveGID ? *Test::effectiveGID : Test::Next(getegid, "getegid")(); }

int setresuid(uid_t real, uid_t effective, uid_t saved) noexcept {
    return Test::SetID("setresuid", real, effective, saved, Test::effectiveUID);
}

int setresgid(gid_t real, gid_t effective, gid_t saved) noexcept {
    return Test::SetID("setresgid", real, effective, saved, Test::effectiveGID);
}

FILE *fopen(const char *path, const char *mode) {
    Test::errnoAtOpen = errno;
    Test::modeAtOpen = mode;
    return Test::Next(fopen, "fopen")(path, mode);
}

ssize_t getrandom(void *bytes, size_t length, unsigned int flags) {
    ++Test::entropyReads;
    return Test::Next(getrandom, "getrandom")(bytes, length, flags);
}

time_t time(time_t *result) noexcept {
    const time_t now = Test::clockTime ? *Test::clockTime : Test::Next(time, "time")(nullptr);
    if (result != nullptr) {
        *result = now;
    }
    return now;
}

void *calloc(size_t count, size_t size) noexcept {
    static void *(*next)(size_t, size_t) = nullptr;
    static bool looking = false;
    if (count * size == Test::failingCalloc && count * size != 0) {
        Test::failingCalloc = 0;
        errno = ENOMEM;
        return nullptr;
    }
    if (next == nullptr) {
        if (looking) {
            return nullptr;  // dlsym itself asks for memory, and does without
        }
        looking = true;
        next = reinterpret_cast<void *(*)(size_t, size_t)>(dlsym(RTLD_NEXT, "calloc"));
    }
    return next(count, size);
}

}  // extern "C"
