#include "tests/support/refused_calls.h"

#include <fcntl.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sys/prctl.h>
#include <sys/syscall.h>

#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <stdexcept>
#include <string>

namespace Test {

namespace {

using Filter = std::vector<sock_filter>;

// Arguments have 64 bits, ids and filter loads 32.
constexpr std::size_t kLowerHalf = __BYTE_ORDER__ == __ORDER_BIG_ENDIAN__ ? 4 : 0;

constexpr std::size_t OffsetOfArgument(std::size_t n) {
    return offsetof(seccomp_data, args) + n * sizeof(std::uint64_t) + kLowerHalf;
}

void Return(Filter &filter, std::uint32_t verdict) { filter.push_back(BPF_STMT(BPF_RET | BPF_K, verdict)); }

/// Continues if the value at `offset` equals `wanted`, else skips `skipped` statements.
void Require(Filter &filter, std::size_t offset, std::uint32_t wanted, std::uint8_t skipped) {
    filter.push_back(BPF_STMT(BPF_LD | BPF_W | BPF_ABS, static_cast<std::uint32_t>(offset)));
    filter.push_back(BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, wanted, 0, skipped));
}

void Refuse(Filter &filter, const IdChange &change) {
    constexpr auto kUnchanged = static_cast<std::uint32_t>(-1);
    Require(filter, offsetof(seccomp_data, nr), static_cast<std::uint32_t>(change.call), 7);
    Require(filter, OffsetOfArgument(0), kUnchanged, 5);
    Require(filter, OffsetOfArgument(1), change.id, 3);
    Require(filter, OffsetOfArgument(2), kUnchanged, 1);
    Return(filter, SECCOMP_RET_ERRNO | EPERM);
}

/// Calls that write, or that create, move or remove a file. Some architectures lack the older ones.
constexpr long kWriting[] = {
    SYS_write,    SYS_writev,   SYS_pwrite64, SYS_pwritev,  SYS_pwritev2,  SYS_sendto,    SYS_sendmsg,
    SYS_sendmmsg, SYS_socket,   SYS_sendfile, SYS_splice,   SYS_truncate,  SYS_ftruncate, SYS_fallocate,
    SYS_mkdirat,  SYS_mknodat,  SYS_unlinkat, SYS_renameat, SYS_renameat2, SYS_linkat,    SYS_symlinkat,
    SYS_fchmod,   SYS_fchmodat, SYS_fchown,   SYS_fchownat, SYS_utimensat, SYS_setxattr,
#ifdef SYS_mkdir
    SYS_mkdir,    SYS_mknod,    SYS_rmdir,    SYS_unlink,   SYS_rename,    SYS_link,      SYS_symlink,
    SYS_creat,    SYS_chmod,    SYS_chown,
#endif
};

/// Kills the process if the call opens a file for writing. `flags` is the index of its argument.
void RefuseOpeningToWrite(Filter &filter, long call, std::size_t flags) {
    Require(filter, offsetof(seccomp_data, nr), static_cast<std::uint32_t>(call), 3);
    filter.push_back(BPF_STMT(BPF_LD | BPF_W | BPF_ABS, static_cast<std::uint32_t>(OffsetOfArgument(flags))));
    filter.push_back(BPF_JUMP(BPF_JMP | BPF_JSET | BPF_K, O_WRONLY | O_RDWR | O_CREAT | O_TRUNC, 0, 1));
    Return(filter, SECCOMP_RET_KILL_PROCESS);
}

void Install(const Filter &filter) {
    const sock_fprog program{static_cast<unsigned short>(filter.size()), const_cast<sock_filter *>(filter.data())};
    // Required for a filter without CAP_SYS_ADMIN.
    if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0 || prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) != 0) {
        throw std::runtime_error(std::string("cannot install a system call filter: ") + std::strerror(errno));
    }
}

}  // namespace

void RefuseIdChanges(const std::vector<IdChange> &changes) {
    Filter filter;
    for (const IdChange &change : changes) {
        Refuse(filter, change);
    }
    Return(filter, SECCOMP_RET_ALLOW);
    Install(filter);
}

void ForbidWriting() {
    Filter filter;
    for (const long call : kWriting) {
        Require(filter, offsetof(seccomp_data, nr), static_cast<std::uint32_t>(call), 1);
        Return(filter, SECCOMP_RET_KILL_PROCESS);
    }
    RefuseOpeningToWrite(filter, SYS_openat, 2);
#ifdef SYS_open
    RefuseOpeningToWrite(filter, SYS_open, 1);
#endif
    Return(filter, SECCOMP_RET_ALLOW);
    Install(filter);
}

}  // namespace Test
