#include "platform/check/child_process.h"

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <csignal>
#include <cstring>
#include <ctime>
#include <new>
#include <stdexcept>
#include <system_error>

namespace PlatformCheck {

namespace {

using Clock = std::chrono::steady_clock;

void Require(bool condition, const char *what) {
    if (!condition) {
        throw std::system_error(errno, std::generic_category(), what);
    }
}

/// Memory that parent and child share.
struct Report {
    enum class End { kNone, kReturned, kThrew };
    std::atomic<End> end;
    std::atomic<Clock::rep> begin;  // of the call, or of the process
    char call[500];
    char reason[500];
    char fault[100];
};

Report *report = nullptr;

template <std::size_t size>
void Copy(const std::string &text, char (&field)[size]) {
    field[text.copy(field, size - 1)] = '\0';
}

class SharedReport {
  public:
    SharedReport() {
        void *memory = mmap(nullptr, sizeof(Report), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
        Require(memory != MAP_FAILED, "mmap");
        report = new (memory) Report{};
        report->begin = Clock::now().time_since_epoch().count();
    }
    ~SharedReport() {
        munmap(report, sizeof(Report));
        report = nullptr;
    }
    SharedReport(const SharedReport &) = delete;
    SharedReport &operator=(const SharedReport &) = delete;
};

/// Blocks SIGCHLD, to wait for it with a time limit.
class BlockedSignal {
  public:
    BlockedSignal() {
        // The program may have been started with the signal ignored. Children are then not reported.
        std::signal(SIGCHLD, SIG_DFL);
        sigemptyset(&signals_);
        sigaddset(&signals_, SIGCHLD);
        sigprocmask(SIG_BLOCK, &signals_, &before_);
    }
    ~BlockedSignal() { Restore(); }
    BlockedSignal(const BlockedSignal &) = delete;
    BlockedSignal &operator=(const BlockedSignal &) = delete;

    void Restore() const { sigprocmask(SIG_SETMASK, &before_, nullptr); }

    void Await(Clock::duration limit) const {
        const auto seconds = std::chrono::duration_cast<std::chrono::seconds>(limit);
        timespec time = {};
        time.tv_sec = static_cast<std::time_t>(seconds.count());
        time.tv_nsec = static_cast<long>(std::chrono::nanoseconds(limit - seconds).count());
        sigtimedwait(&signals_, nullptr, &time);
    }

  private:
    sigset_t signals_ = {};
    sigset_t before_ = {};
};

void Redirect() {
    const int in = open("/dev/null", O_RDONLY | O_CLOEXEC);
    const int out = memfd_create("standard output", MFD_CLOEXEC);
    const int error = memfd_create("standard error", MFD_CLOEXEC);
    Require(in >= 0 && out >= 0 && error >= 0 && dup2(in, STDIN_FILENO) >= 0 && dup2(out, STDOUT_FILENO) >= 0 &&
                dup2(error, STDERR_FILENO) >= 0,
            "standard streams");
    close(in);
    close(out);
    close(error);
}

[[noreturn]] void RunTask(const std::function<void()> &task) {
    try {
        setpgid(0, 0);
        prctl(PR_SET_PDEATHSIG, SIGKILL);
        // Processes that the task abandons become children of this process, which finds them.
        prctl(PR_SET_CHILD_SUBREAPER, 1);
        // A crash ends the process, also if the program was started with the signal ignored, or sanitizers handle it.
        for (const int signal : {SIGABRT, SIGBUS, SIGFPE, SIGILL, SIGSEGV}) {
            std::signal(signal, SIG_DFL);
        }
        const rlimit none = {0, 0};
        setrlimit(RLIMIT_CORE, &none);
        Redirect();
        task();
        report->end = Report::End::kReturned;
    } catch (const std::exception &exception) {
        Copy(exception.what(), report->reason);
        report->end = Report::End::kThrew;
    } catch (...) {
        Copy("an exception that is not a std::exception", report->reason);
        report->end = Report::End::kThrew;
    }
    _exit(0);
}

/// Waits until the child has ended, without reaping it. Returns false if a call takes longer than the limit.
bool AwaitEnd(pid_t child, const BlockedSignal &blocked, Clock::duration limit) {
    for (;;) {
        siginfo_t information = {};
        Require(waitid(P_PID, static_cast<id_t>(child), &information, WEXITED | WNOHANG | WNOWAIT) == 0, "waitid");
        if (information.si_pid == child) {
            return true;
        }
        const Clock::time_point begin{Clock::duration(report->begin)};
        const Clock::duration remaining = begin + limit - Clock::now();
        if (remaining <= Clock::duration::zero()) {
            return false;
        }
        blocked.Await(remaining);
    }
}

std::string NameOf(int signal) {
    const char *name = sigabbrev_np(signal);
    return name != nullptr ? "SIG" + std::string(name) : "signal " + std::to_string(signal);
}

std::string InCall() { return *report->call != '\0' ? " in " + std::string(report->call) : ""; }

Result ResultOf(bool hasEnded, int status, std::chrono::seconds limit) {
    if (!hasEnded) {
        return {false, "no answer within " + std::to_string(limit.count()) + " s" + InCall()};
    }
    switch (report->end.load()) {
        case Report::End::kReturned:
            return {true, ""};
        case Report::End::kThrew:
            return {false, report->reason};
        case Report::End::kNone:
            break;
    }
    if (*report->fault != '\0') {
        return {false, report->fault + InCall()};
    }
    return {false, (WIFSIGNALED(status) ? NameOf(WTERMSIG(status)) : "the process was ended") + InCall()};
}

}  // namespace

Result RunInChild(const std::function<void()> &task, std::chrono::seconds limit) {
    const SharedReport shared;
    const BlockedSignal blocked;
    const pid_t child = fork();
    Require(child >= 0, "fork");
    if (child == 0) {
        blocked.Restore();
        RunTask(task);
    }
    setpgid(child, child);
    const bool hasEnded = AwaitEnd(child, blocked, limit);
    // Also ends the children of the child. Its id cannot be reused before it is reaped.
    kill(-child, SIGKILL);
    kill(child, SIGKILL);  // it may have changed its process group
    int status = 0;
    Require(waitpid(child, &status, 0) == child, "waitpid");
    return ResultOf(hasEnded, status, limit);
}

void NoteCall(const std::string &call) {
    Copy(call, report->call);
    report->begin = Clock::now().time_since_epoch().count();
}

void NoteFault(const char *fault) { std::strncpy(report->fault, fault, sizeof report->fault - 1); }

}  // namespace PlatformCheck
