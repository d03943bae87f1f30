// With _FORTIFY_SOURCE, the headers would define `fread`.
#undef _FORTIFY_SOURCE

#include "tests/support/interposed/process.h"

#include <sys/random.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <optional>
#include <random>
#include <stdexcept>

#include "tests/support/interposed/calls.h"

namespace Test {

namespace {

std::optional<uid_t> effectiveUID;
std::optional<gid_t> effectiveGID;
int setIDsUntilFailure = 0;
int setIDError = 0;
int errnoAtOpen = 0;
const char *modeAtOpen = "";
int entropyReads = 0;
FILE *failedFile = nullptr;

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

bool FailsToRead(FILE *file, const void *caller) {
    if (!ShouldFail("fread", caller)) {
        return false;
    }
    failedFile = file;
    errno = EIO;
    return true;
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

int ErrnoAtOpen() { return errnoAtOpen; }
std::string ModeAtOpen() { return modeAtOpen; }

int EntropyReads() { return entropyReads; }

void RestoreProcess() {
    effectiveUID.reset();
    effectiveGID.reset();
    setIDsUntilFailure = 0;
    TakeSetIDCalls();
}

}  // namespace Test

extern "C" {

uid_t geteuid() noexcept { return Test::effectiveUID ? *Test::effectiveUID : Test::Next(geteuid, "geteuid")(); }
gid_t getegid() noexcept { return Test::effectiveGID ? *Test::effectiveGID : Test::Next(getegid, "getegid")(); }

int setresuid(uid_t real, uid_t effective, uid_t saved) noexcept {
    if (Test::ShouldFail("setresuid", CALLER)) {
        errno = EPERM;
        return -1;
    }
    return Test::SetID("setresuid", real, effective, saved, Test::effectiveUID);
}

int setresgid(gid_t real, gid_t effective, gid_t saved) noexcept {
    if (Test::ShouldFail("setresgid", CALLER)) {
        errno = EPERM;
        return -1;
    }
    return Test::SetID("setresgid", real, effective, saved, Test::effectiveGID);
}

FILE *fopen(const char *path, const char *mode) {
    Test::errnoAtOpen = errno;
    Test::modeAtOpen = mode;
    if (Test::ShouldFail("fopen", CALLER)) {
        errno = EMFILE;
        return nullptr;
    }
    return Test::Next(fopen, "fopen")(path, mode);
}

size_t fread(void *bytes, size_t size, size_t count, FILE *file) {
    return Test::FailsToRead(file, CALLER) ? 0 : Test::Next(fread, "fread")(bytes, size, count, file);
}

/// Called by libraries built with _FORTIFY_SOURCE.
size_t __fread_chk(void *bytes, size_t room, size_t size, size_t count, FILE *file) {
    return Test::FailsToRead(file, CALLER) ? 0 : Test::Next(__fread_chk, "__fread_chk")(bytes, room, size, count, file);
}

void explicit_bzero(void *memory, size_t size) noexcept {
    Test::NoteCleansed(memory, size, CALLER);
    Test::Next(explicit_bzero, "explicit_bzero")(memory, size);
}

/// The same, built with _FORTIFY_SOURCE.
void __explicit_bzero_chk(void *memory, size_t size, size_t room) noexcept {
    Test::NoteCleansed(memory, size, CALLER);
    Test::Next(__explicit_bzero_chk, "__explicit_bzero_chk")(memory, size, room);
}

int ferror(FILE *file) noexcept {
    if (Test::ShouldFail("ferror", CALLER) || file == Test::failedFile) {
        return 1;
    }
    return Test::Next(ferror, "ferror")(file);
}

int fclose(FILE *file) {
    if (file == Test::failedFile) {
        Test::failedFile = nullptr;  // the pointer may be reused
    }
    const bool fails = Test::ShouldFail("fclose", CALLER);
    const int result = Test::Next(fclose, "fclose")(file);
    return fails ? EOF : result;
}

ssize_t getrandom(void *bytes, size_t length, unsigned int flags) {
    ++Test::entropyReads;
    if (Test::ShouldFail("getrandom", CALLER)) {
        errno = EIO;
        return -1;
    }
    return Test::Next(getrandom, "getrandom")(bytes, length, flags);
}

}  // extern "C"

// Boost 1.86 and later read random numbers by this class, which may use an instruction instead of a system call.
std::random_device::result_type std::random_device::_M_getval() {
    ++Test::entropyReads;
    result_type value = 0;
    if (Test::ShouldFail("getrandom", CALLER) ||
        Test::Next(::getrandom, "getrandom")(&value, sizeof value, 0) != sizeof value) {
        throw std::runtime_error("getrandom");
    }
    return value;
}
