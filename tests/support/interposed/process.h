#ifndef TAVOSSO_TESTS_SUPPORT_INTERPOSED_PROCESS_H
#define TAVOSSO_TESTS_SUPPORT_INTERPOSED_PROCESS_H

#include <sys/types.h>

#include <cerrno>
#include <string>
#include <vector>

// Simulates effective ids and records uses of files and entropy.
namespace Test {

/// Sets the effective ids, which the process may change, until RestoreProcess.
void SetEffectiveIDs(uid_t uid, gid_t gid);
uid_t EffectiveUID();
gid_t EffectiveGID();

/// Makes the n-th setresuid or setresgid fail with this error.
void FailSetID(int n, int error = EPERM);

/// The setresuid and setresgid calls since the last call: "setresgid(-1, 0, -1)".
std::vector<std::string> TakeSetIDCalls();

/// errno and the mode at the last fopen.
int ErrnoAtOpen();
std::string ModeAtOpen();

/// The number of getrandom calls.
int EntropyReads();

/// Restores the real ids.
void RestoreProcess();

}  // namespace Test

#endif
