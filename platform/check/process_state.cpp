#include "platform/check/process_state.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <climits>
#include <clocale>
#include <csignal>
#include <cstdio>
#include <filesystem>
#include <iostream>
#include <iterator>
#include <locale>
#include <sstream>
#include <vector>

namespace PlatformCheck {

namespace {

constexpr int kDescriptors = 1024;     // the system uses the lowest free number
constexpr int kRestorer = 0x04000000;  // SA_RESTORER of the kernel; the C library sets it whenever an action is set

template <typename... Values>
std::string Joined(const Values &...values) {
    std::ostringstream text;
    ((text << values << ' '), ...);
    return text.str();
}

std::string TargetOf(int descriptor) {
    std::array<char, PATH_MAX> target = {};
    const std::string link = "/proc/self/fd/" + std::to_string(descriptor);
    return readlink(link.c_str(), target.data(), target.size() - 1) < 0 ? "?" : target.data();
}

void CaptureDescriptors(ProcessState &state) {
    for (int descriptor = 0; descriptor < kDescriptors; ++descriptor) {
        const int flags = fcntl(descriptor, F_GETFD);
        if (flags >= 0) {
            state["descriptor " + std::to_string(descriptor) + " (" + TargetOf(descriptor) + ")"] =
                Joined(flags, fcntl(descriptor, F_GETFL));
        }
    }
}

void CaptureOutput(ProcessState &state) {
    std::fflush(nullptr);
    std::cout.flush();
    for (const auto &[descriptor, name] :
         {std::pair(STDOUT_FILENO, "standard output"), std::pair(STDERR_FILENO, "standard error")}) {
        struct stat status = {};
        fstat(descriptor, &status);
        state[name] = std::to_string(status.st_size);
    }
}

std::string Members(const sigset_t &signals) {
    std::string members;
    for (int signal = 1; signal < NSIG; ++signal) {
        members += sigismember(&signals, signal) == 1 ? '1' : '0';
    }
    return members;
}

void CaptureSignals(ProcessState &state) {
    for (int signal = 1; signal < NSIG; ++signal) {
        struct sigaction action = {};
        if (sigaction(signal, nullptr, &action) == 0) {
            state["the handling of signal " + std::to_string(signal)] =
                Joined(reinterpret_cast<const void *>(action.sa_handler), action.sa_flags & ~kRestorer,
                       Members(action.sa_mask));
        }
    }
    sigset_t blocked = {};
    sigprocmask(SIG_SETMASK, nullptr, &blocked);
    state["the set of blocked signals"] = Members(blocked);
}

void CaptureTimers(ProcessState &state) {
    for (const auto &[timer, name] : {std::pair(ITIMER_REAL, "the alarm"), std::pair(ITIMER_VIRTUAL, "the CPU timer"),
                                      std::pair(ITIMER_PROF, "the profiling timer")}) {
        itimerval value = {};
        getitimer(timer, &value);
        state[name] = value.it_value.tv_sec == 0 && value.it_value.tv_usec == 0 ? "not set" : "set";
    }
}

void CaptureEnvironment(ProcessState &state) {
    for (char **variable = environ; variable != nullptr && *variable != nullptr; ++variable) {
        const std::string text = *variable;
        const std::size_t end = text.find('=');
        state["the environment variable " + text.substr(0, end)] = text.substr(end == std::string::npos ? 0 : end);
    }
}

void CaptureIds(ProcessState &state) {
    uid_t user[3] = {};
    gid_t group[3] = {};
    getresuid(&user[0], &user[1], &user[2]);
    getresgid(&group[0], &group[1], &group[2]);
    state["the user ids"] = Joined(user[0], user[1], user[2]);
    state["the group ids"] = Joined(group[0], group[1], group[2]);
    std::vector<gid_t> groups(NGROUPS_MAX);
    const int count = getgroups(static_cast<int>(groups.size()), groups.data());
    for (int i = 0; i < count; ++i) {
        state["the supplementary groups"] += Joined(groups[static_cast<std::size_t>(i)]);
    }
}

void CaptureLocale(ProcessState &state) {
    state["the locale"] = Joined(std::setlocale(LC_ALL, nullptr), uselocale(nullptr), std::locale().name());
}

void CaptureFolders(ProcessState &state) {
    const mode_t mask = umask(0);
    umask(mask);
    state["the umask"] = std::to_string(mask);
    state["the working directory"] = std::filesystem::current_path();
}

void CaptureThreads(ProcessState &state) {
    state["the number of threads"] =
        std::to_string(std::distance(std::filesystem::directory_iterator("/proc/self/task"), {}));
}

void CaptureChildren(ProcessState &state) {
    siginfo_t child = {};
    if (waitid(P_ALL, 0, &child, WEXITED | WNOHANG | WNOWAIT) == 0) {
        state[child.si_pid == 0 ? "a running child process" : "a child process that was not waited for"] = "";
    }
}

}  // namespace

ProcessState CaptureProcessState() {
    ProcessState state;
    CaptureDescriptors(state);
    CaptureOutput(state);
    CaptureSignals(state);
    CaptureTimers(state);
    CaptureEnvironment(state);
    CaptureIds(state);
    CaptureLocale(state);
    CaptureFolders(state);
    CaptureThreads(state);
    CaptureChildren(state);
    return state;
}

std::string FirstDifference(const ProcessState &before, const ProcessState &after) {
    for (const auto &[name, value] : after) {
        const auto old = before.find(name);
        if (old == before.end()) {
            return "new: " + name;
        }
        if (old->second != value) {
            return "changed: " + name;
        }
    }
    for (const auto &[name, value] : before) {
        if (after.count(name) == 0) {
            return "gone: " + name;
        }
    }
    return "";
}

}  // namespace PlatformCheck
