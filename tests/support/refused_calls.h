#ifndef TAVOSSO_TESTS_SUPPORT_REFUSED_CALLS_H
#define TAVOSSO_TESTS_SUPPORT_REFUSED_CALLS_H

#include <vector>

// System call filters that refuse calls which the process is otherwise permitted to make.
namespace Test {

/// A change of only the effective id: `setresuid(-1, id, -1)` or `setresgid`.
struct IdChange {
    long call;  // SYS_setresuid or SYS_setresgid
    unsigned int id;
};

/// Makes these changes fail with EPERM permanently. Throws std::runtime_error if the kernel has no filters.
void RefuseIdChanges(const std::vector<IdChange> &changes);

/// Kills the process with SIGSYS at its next call that writes, or that creates or removes a file. Throws as above.
void ForbidWriting();

}  // namespace Test

#endif
