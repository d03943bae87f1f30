#ifndef TAVOSSO_TESTS_SUPPORT_EMULATION_H
#define TAVOSSO_TESTS_SUPPORT_EMULATION_H

#include <linux/seccomp.h>
#include <sys/prctl.h>

#include <cerrno>

namespace Test {

/// Whether qemu-user runs this program. It supports neither system call filters nor user namespaces, and ignores limits
/// on the address space. The kernel would report the null pointer.
inline bool IsEmulated() {
    const int result = prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, nullptr);
    return result == -1 && errno == EINVAL;
}

}  // namespace Test

#endif
