#include "frontend/cgi_program.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <iostream>

#include "tests/support/emulation.h"

using namespace Frontend;
using namespace TAVO::Web;
using testing::ExitedWithCode;
using testing::HasSubstr;
using testing::StartsWith;

namespace {

/// Each program runs in a child process, because it sets process limits.
class Program : public testing::Test {
  protected:
    Program() { setenv("REQUEST_METHOD", "GET", 1); }
    ~Program() override { unsetenv("REQUEST_METHOD"); }

    /// The output of a program that accepts `methods`, for a request.
    static std::string AnswerTo(const char *method, const char *methods) {
        setenv("REQUEST_METHOD", method, 1);
        int ends[2];
        EXPECT_EQ(pipe(ends), 0);
        if (fork() == 0) {
            dup2(ends[1], STDOUT_FILENO);
            _exit(Serve(methods, [](Response &response) { response.Redirect("/served"); }));
        }
        close(ends[1]);
        std::string output;
        char chunk[4096];
        for (ssize_t count; (count = read(ends[0], chunk, sizeof chunk)) > 0;) {
            output.append(chunk, static_cast<std::size_t>(count));
        }
        close(ends[0]);
        return output;
    }
};

rlim_t LimitOf(decltype(RLIMIT_CORE) resource) {
    rlimit limit{};
    getrlimit(resource, &limit);
    return limit.rlim_max;
}

TEST_F(Program, IsKilledByAlarmAfterTimeLimit) {
    const auto runTooLong = [](Response &) {
        const unsigned int seconds = alarm(0);
        if (seconds == kLongestRun) {
            raise(SIGALRM);
        }
    };
    EXPECT_EXIT(Serve("GET", runTooLong), testing::KilledBySignal(SIGALRM), "");
}

TEST_F(Program, DisablesCoreFilesAndTracing) {
    const auto examine = [](Response &) { _exit(LimitOf(RLIMIT_CORE) == 0 && prctl(PR_GET_DUMPABLE) == 0 ? 42 : 1); };
    EXPECT_EXIT(Serve("GET", examine), ExitedWithCode(42), "");
}

#ifndef __SANITIZE_ADDRESS__
TEST_F(Program, LimitsAddressSpaceToOneGigabyte) {
    if (::Test::IsEmulated()) {
        GTEST_SKIP() << "qemu-user ignores the limit";
    }
    const auto examine = [](Response &) { _exit(LimitOf(RLIMIT_AS) == rlim_t{1} << 30 ? 42 : 1); };
    EXPECT_EXIT(Serve("GET", examine), ExitedWithCode(42), "");
}
#endif

TEST_F(Program, RemovesEnvironmentVariablesThatAffectTrust) {
    setenv("SSLKEYLOGFILE", "/tmp/keys", 1);
    setenv("OPENSSL_CONF", "/tmp/openssl.cnf", 1);
    setenv("https_proxy", "http://127.0.0.1:1", 1);
    setenv("FRONTEND_KEEP_ENVIRONMENT", "all_proxy https_proxy", 1);
    const auto examine = [](Response &) {
        const bool isRemoved = std::getenv("SSLKEYLOGFILE") == nullptr && std::getenv("OPENSSL_CONF") == nullptr;
        _exit(isRemoved && std::getenv("https_proxy") != nullptr ? 42 : 1);
    };
    EXPECT_EXIT(Serve("GET", examine), ExitedWithCode(42), "");
    for (const char *name : {"SSLKEYLOGFILE", "OPENSSL_CONF", "https_proxy", "FRONTEND_KEEP_ENVIRONMENT"}) {
        unsetenv(name);
    }
}

TEST_F(Program, RejectsOtherMethods) {
    EXPECT_THAT(AnswerTo("GET", "GET, HEAD"), HasSubstr("Location: /served\n"));
    EXPECT_THAT(AnswerTo("HEAD", "GET, HEAD"), HasSubstr("Location: /served\n"));
    for (const char *method : {"POST", "PUT", "get", "GET,", "", "OPTIONS"}) {
        const std::string answer = AnswerTo(method, "GET, HEAD");
        EXPECT_THAT(answer, StartsWith("Status: 405 Method Not Allowed\n")) << method;
        EXPECT_THAT(answer, HasSubstr("\nAllow: GET, HEAD\n")) << method;
    }
}

TEST_F(Program, FailsIfResponseCannotBeWritten) {
    const auto answer = [](Response &out) { out.Redirect("/"); };
    const auto run = [&] {
        dup2(open("/dev/full", O_WRONLY), STDOUT_FILENO);
        _exit(Serve("GET", answer));
    };
    EXPECT_EXIT(run(), ExitedWithCode(1), "");
}

}  // namespace
