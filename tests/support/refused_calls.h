#ifndef TAVOSSO_TESTS_SUPPORT_REFUSED_CALLS_H
#define TAVOSSO_TESTS_SUPPORT_REFUSED_CALLS_H

#include <vector>

// Calls that the kernel itself refuses, also to a process that may make them.
namespace Test {

/// A change of the effective id alone: `setresuid(-1, id, -1)`, or `setresgid`.
struct IdChange {
    long call;  // SYS_setresuid or SYS_setresgid
    unsigned int id;
};

/// From now on, and for good, this process is refused these changes with EPERM; any other goes on as before. Throws
/// std::runtime_error when the kernel knows no filters.
void RefuseIdChanges(const std::vector<IdChange> &changes);

/// From now on, and for good, this process is ended by SIGSYS at its first call that writes, to a file or to a socket,
/// or that makes or removes a file. Throws as above.
void ForbidWriting();

}  // namespace Test

#endif
