// How the stand-in asks winbindd. This program defines the calls, to simulate failures that a real winbindd does not
// show. tests/e2e/directory uses a real one.
#include <dlfcn.h>
#include <fcntl.h>
#include <gmock/gmock.h>
#include <pthread.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <filesystem>
#include <iterator>
#include <string>

#include "platform/platform.h"
#include "tests/support/files.h"
#include "tests/support/one_letter_locale.h"
#include "tests/support/system_log.h"

extern "C" {
#include <wbclient.h>
}

namespace Test {

namespace {

int pipeError = 0;
int forkError = 0;
int forks = 0;

/// The answer of winbindd. Called in the child process.
wbcErr (*answer)(const char *domain, struct wbcDomainInfo &information) = nullptr;

char dnsName[1000];
char shortName[1000];

wbcErr AnswerACME(const char * /*domain*/, struct wbcDomainInfo &information) {
    std::strcpy(dnsName, "corp.example.net");
    std::strcpy(shortName, "ACME");
    information.dns_name = dnsName;
    information.short_name = shortName;
    return WBC_ERR_SUCCESS;
}

[[noreturn]] void WaitForever() {
    for (;;) {
        pause();
    }
}

void Ignore(int /*signal*/) {}

std::ptrdiff_t OpenDescriptors() { return std::distance(std::filesystem::directory_iterator("/proc/self/fd"), {}); }

/// Descriptors that a program started by this process inherits.
std::ptrdiff_t DescriptorsForPrograms() {
    return std::count_if(std::filesystem::directory_iterator("/proc/self/fd"), {}, [](const auto &entry) {
        const int flags = fcntl(std::atoi(entry.path().filename().c_str()), F_GETFD);
        return flags >= 0 && (flags & FD_CLOEXEC) == 0;
    });
}

/// Reaps children. Returns ECHILD if there are none.
int ErrorOfWaiting() {
    errno = 0;
    return waitpid(-1, nullptr, WNOHANG) < 0 ? errno : 0;
}

/// Sets the handler of a signal for the lifetime of the object.
class Disposition {
  public:
    Disposition(int signal, void (*handler)(int), int flags = 0) : signal_(signal) {
        struct sigaction action = {};
        action.sa_handler = handler;
        action.sa_flags = flags;
        sigaction(signal, &action, &before_);
    }
    ~Disposition() { sigaction(signal_, &before_, nullptr); }
    Disposition(const Disposition &) = delete;
    Disposition &operator=(const Disposition &) = delete;

  private:
    int signal_;
    struct sigaction before_ = {};
};

/// Ends the program if a test hangs. A timer, because tests use the alarm of this process; children do not inherit it.
class Deadline {
  public:
    Deadline() {
        sigevent event = {};
        event.sigev_notify = SIGEV_SIGNAL;
        event.sigev_signo = SIGABRT;
        itimerspec limit = {};
        limit.it_value.tv_sec = 60;
        isSet_ = timer_create(CLOCK_MONOTONIC, &event, &timer_) == 0 && timer_settime(timer_, 0, &limit, nullptr) == 0;
        EXPECT_TRUE(isSet_);
    }
    ~Deadline() {
        if (isSet_) {
            timer_delete(timer_);
        }
    }
    Deadline(const Deadline &) = delete;
    Deadline &operator=(const Deadline &) = delete;

  private:
    timer_t timer_ = {};
    bool isSet_ = false;
};

class WinbindLookup : public testing::Test {
  protected:
    void SetUp() override {
        RemoveFiles();
        TakeSystemLog();
        answer = AnswerACME;
        pipeError = forkError = forks = 0;
        descriptors_ = OpenDescriptors();
    }
    void TearDown() override {
        EXPECT_EQ(OpenDescriptors(), descriptors_);
        EXPECT_EQ(ErrorOfWaiting(), ECHILD) << "a child is left";
    }

    /// The converted name, or the end of the line that was logged.
    static std::string Convert(const std::string &domain = "CORP.EXAMPLE.NET") {
        char buffer[1024] = "untouched";
        const int result = TAVOWinsUserNameFqdn2Netbios((domain + "\\alice").c_str(), buffer, sizeof buffer - 1);
        const std::vector<LogLine> log = TakeSystemLog();
        if (result == 0) {
            EXPECT_THAT(log, testing::IsEmpty());
            return buffer;
        }
        EXPECT_STREQ(buffer, "untouched");
        EXPECT_LT(result, 0);
        EXPECT_THAT(log, testing::SizeIs(1));
        const std::string beginning = "platform:N domain '" + domain + "' is not in domains.conf, and winbindd ";
        EXPECT_EQ(log[0].text.substr(0, beginning.size()), beginning);
        return log[0].text.substr(beginning.size());
    }

  private:
    const Deadline deadline_;
    std::ptrdiff_t descriptors_ = 0;
};

TEST_F(WinbindLookup, ReturnsNameInSpellingOfDirectory) {
    EXPECT_EQ(Convert(), "ACME\\alice");
    EXPECT_EQ(Convert("Corp.Example.Net"), "ACME\\alice");
    EXPECT_EQ(forks, 2);
}

TEST_F(WinbindLookup, SkipsDomainsInTableAndEmptyDomain) {
    WriteFile(kDomainTable, R"({"corp.example.net": "TABLE"})");
    EXPECT_EQ(Convert(), "TABLE\\alice");
    EXPECT_EQ(Convert(""), "does not know it");
    EXPECT_EQ(forks, 0);
}

TEST_F(WinbindLookup, RequiresAnswerForRequestedDNSName) {
    EXPECT_EQ(Convert("ACME"), "does not know it");
    EXPECT_EQ(Convert("CORP"), "does not know it");
    answer = [](const char *domain, struct wbcDomainInfo &information) {
        AnswerACME(domain, information);
        dnsName[0] = '\0';  // as for BUILTIN and the machine's own domain
        return WBC_ERR_SUCCESS;
    };
    EXPECT_EQ(Convert("BUILTIN"), "does not know it");
    answer = [](const char *domain, struct wbcDomainInfo &information) {
        AnswerACME(domain, information);
        information.dns_name = nullptr;
        return WBC_ERR_SUCCESS;
    };
    EXPECT_EQ(Convert(), "does not know it");
}

TEST_F(WinbindLookup, IgnoresLocaleOfProcess) {
    const OneLetterLocale locale;
    EXPECT_EQ(Convert("KORP.EXAMPLE.NET"), "does not know it");
    EXPECT_EQ(Convert(), "ACME\\alice");
}

TEST_F(WinbindLookup, RejectsAnswerWithEmptyOrOverlongName) {
    answer = [](const char *domain, struct wbcDomainInfo &information) {
        AnswerACME(domain, information);
        shortName[0] = '\0';
        return WBC_ERR_SUCCESS;
    };
    EXPECT_EQ(Convert(), "does not know it");
    answer = [](const char *domain, struct wbcDomainInfo &information) {
        AnswerACME(domain, information);
        std::memset(shortName, 'A', sizeof shortName - 1);
        return WBC_ERR_SUCCESS;
    };
    EXPECT_EQ(Convert(), "does not know it");
    answer = [](const char *domain, struct wbcDomainInfo &information) {
        AnswerACME(domain, information);
        std::memset(dnsName, 'a', sizeof dnsName - 1);
        return WBC_ERR_SUCCESS;
    };
    EXPECT_EQ(Convert(std::string(255, 'a')), "does not know it");
}

TEST_F(WinbindLookup, LogsEachFailureOfLibwbclient) {
    answer = [](const char *, struct wbcDomainInfo &) { return WBC_ERR_DOMAIN_NOT_FOUND; };
    EXPECT_EQ(Convert(), "does not know it");
    answer = [](const char *, struct wbcDomainInfo &) { return WBC_ERR_WINBIND_NOT_AVAILABLE; };
    EXPECT_EQ(Convert(), "is not available");
    answer = [](const char *, struct wbcDomainInfo &) { return WBC_ERR_NO_MEMORY; };
    EXPECT_EQ(Convert(), "cannot be asked: WBC_ERR_NO_MEMORY");
}

TEST_F(WinbindLookup, LogsFailureOfPipeAndFork) {
    pipeError = EMFILE;
    EXPECT_EQ(Convert(), "cannot be asked: Too many open files");
    EXPECT_EQ(forks, 0);
    pipeError = 0;
    forkError = EAGAIN;
    EXPECT_EQ(Convert(), "cannot be asked: Resource temporarily unavailable");
}

TEST_F(WinbindLookup, FailsIfChildCrashes) {
    answer = [](const char *, struct wbcDomainInfo &) -> wbcErr { _exit(0); };
    EXPECT_EQ(Convert(), "does not answer");
    answer = [](const char *, struct wbcDomainInfo &) -> wbcErr {
        raise(SIGKILL);
        return WBC_ERR_SUCCESS;
    };
    EXPECT_EQ(Convert(), "does not answer");
}

// These tests measure no time. Without the alarm, the child would wait forever and the deadline would end the program.

TEST_F(WinbindLookup, FailsAfterAlarmOfChild) {
    answer = [](const char *, struct wbcDomainInfo &) -> wbcErr { WaitForever(); };
    EXPECT_EQ(Convert(), "does not answer");
}

TEST_F(WinbindLookup, FailsAfterAlarmEvenIfHostBlocksSignal) {
    const Disposition caught(SIGALRM, Ignore);
    sigset_t alarms;
    sigset_t before;
    sigemptyset(&alarms);
    sigaddset(&alarms, SIGALRM);
    pthread_sigmask(SIG_BLOCK, &alarms, &before);
    answer = [](const char *, struct wbcDomainInfo &) -> wbcErr { WaitForever(); };
    EXPECT_EQ(Convert(), "does not answer");
    pthread_sigmask(SIG_SETMASK, &before, nullptr);
}

TEST_F(WinbindLookup, KeepsAlarmOfHost) {
    alarm(1000);
    EXPECT_EQ(Convert(), "ACME\\alice");
    EXPECT_GT(alarm(0), 0U);
}

TEST_F(WinbindLookup, SucceedsIfHostReapsChildren) {
    {
        const Disposition ignored(SIGCHLD, SIG_IGN);
        EXPECT_EQ(Convert(), "ACME\\alice");
    }
    const Disposition collected(SIGCHLD, [](int) {
        while (waitpid(-1, nullptr, WNOHANG) > 0) {
        }
    });
    for (int i = 0; i < 20; ++i) {
        EXPECT_EQ(Convert(), "ACME\\alice");
    }
}

TEST_F(WinbindLookup, SucceedsIfSignalsInterruptHost) {
    const Disposition caught(SIGUSR1, Ignore);
    answer = [](const char *domain, struct wbcDomainInfo &information) {
        for (int i = 0; i < 20; ++i) {
            kill(getppid(), SIGUSR1);
        }
        return AnswerACME(domain, information);
    };
    EXPECT_EQ(Convert(), "ACME\\alice");
}

TEST_F(WinbindLookup, IgnoresEnvironment) {
    setenv("_NO_WINBINDD", "1", 1);
    answer = [](const char *domain, struct wbcDomainInfo &information) {
        return std::getenv("_NO_WINBINDD") == nullptr && std::getenv("PATH") == nullptr
                   ? AnswerACME(domain, information)
                   : WBC_ERR_DOMAIN_NOT_FOUND;
    };
    EXPECT_EQ(Convert(), "ACME\\alice");
    EXPECT_STREQ(std::getenv("_NO_WINBINDD"), "1") << "the environment of the host";
    unsetenv("_NO_WINBINDD");
}

TEST_F(WinbindLookup, LeaksNoDescriptorToProgramsOfHost) {
    static std::ptrdiff_t before;
    before = DescriptorsForPrograms();
    answer = [](const char *domain, struct wbcDomainInfo &information) {
        return DescriptorsForPrograms() == before ? AnswerACME(domain, information) : WBC_ERR_DOMAIN_NOT_FOUND;
    };
    EXPECT_EQ(Convert(), "ACME\\alice");
}

TEST_F(WinbindLookup, RunsNoExitHandlersInChild) {
    static pid_t host;
    host = getpid();
    std::atexit([] {
        if (getpid() != host) {
            kill(host, SIGKILL);
        }
    });
    EXPECT_EQ(Convert(), "ACME\\alice");
}

}  // namespace

template <typename Function>
Function *Next(const char *name) {
    return reinterpret_cast<Function *>(dlsym(RTLD_NEXT, name));
}

}  // namespace Test

extern "C" {

int pipe2(int ends[2], int flags) noexcept {
    if (Test::pipeError != 0) {
        errno = Test::pipeError;
        return -1;
    }
    return Test::Next<int(int *, int)>("pipe2")(ends, flags);
}

pid_t fork() noexcept {
    if (Test::forkError != 0) {
        errno = Test::forkError;
        return -1;
    }
    ++Test::forks;
    return Test::Next<pid_t()>("fork")();
}

wbcErr wbcDomainInfo(const char *domain, struct wbcDomainInfo **information) {
    *information = new struct wbcDomainInfo();
    return Test::answer(domain, **information);
}

void wbcFreeMemory(void *memory) { delete static_cast<struct wbcDomainInfo *>(memory); }

}  // extern "C"
