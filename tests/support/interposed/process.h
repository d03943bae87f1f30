#ifndef TAVOSSO_TESTS_SUPPORT_INTERPOSED_PROCESS_H
#define TAVOSSO_TESTS_SUPPORT_INTERPOSED_PROCESS_H

#include <sys/types.h>

#include <cerrno>
#include <string>
#include <vector>

// The process that the library under test sees: its effective ids, its files, its entropy.
namespace Test {

/// From now on the process has these effective ids, and may change them, until RestoreProcess.
void SetEffectiveIDs(uid_t uid, gid_t gid);
uid_t EffectiveUID();
gid_t EffectiveGID();

/// The n-th setresuid or setresgid from now on fails with this error.
void FailSetID(int n, int error = EPERM);

/// Every setresuid and setresgid since the last call: "setresgid(-1, 0, -1)".
std::vector<std::string> TakeSetIDCalls();

/// What errno was when a file was last opened, and the mode it was opened with.
int ErrnoAtOpen();
std::string ModeAtOpen();

/// How often the system's entropy source has been read.
int EntropyReads();

/// The ids are the real ones again.
void RestoreProcess();

}  // namespace Test

#endif
