// Loads and unloads the built library in a program that is not linked with it.
#include <dlfcn.h>
#include <gmock/gmock.h>
#include <malloc.h>
#include <sys/wait.h>
#include <syslog.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include "tests/support/emulation.h"
#include "tests/support/refused_calls.h"

namespace {

constexpr char kLibrary[] = TAVOSSO_LIBRARY;

/// A loaded library; false if loading fails.
class Loaded {
  public:
    Loaded() : handle(dlopen(kLibrary, RTLD_NOW | RTLD_LOCAL)) {}
    ~Loaded() {
        if (handle != nullptr) {
            dlclose(handle);
        }
    }
    Loaded(const Loaded &) = delete;
    Loaded &operator=(const Loaded &) = delete;

    explicit operator bool() const { return handle != nullptr; }
    template <typename Function>
    Function *Find(const char *mangled) const {
        return reinterpret_cast<Function *>(dlsym(handle, mangled));
    }

  private:
    void *handle;
};

bool IsStillLoaded() { return dlopen(kLibrary, RTLD_NOW | RTLD_NOLOAD) != nullptr; }

/// Calls the library, so that symbols are bound and one-time initialisation is done.
std::string Digest(const Loaded &library) {
    auto *digest = library.Find<std::string(std::string)>(
        "_ZN4TAVO3SSO9MD5DigestENSt7__cxx1112basic_stringIcSt11char_traitsIcESaIcEEE");
    return digest != nullptr ? digest("") : "MD5Digest not found";
}

constexpr char kDigestOfNothing[] = "d41d8cd98f00b204e9800998ecf8427e";

void LoadAndUse(int times) {
    for (int i = 0; i < times; ++i) {
        ASSERT_EQ(Digest(Loaded()), kDigestOfNothing);
        ASSERT_FALSE(IsStillLoaded());
    }
}

std::ptrdiff_t CountFiles() {
    const std::filesystem::directory_iterator descriptors("/proc/self/fd");
    return std::distance(begin(descriptors), end(descriptors));
}

std::size_t HeapInUse() { return mallinfo2().uordblks; }

TEST(Loading, LeaksNothingInThousandRounds) {
    // libcurl leaks 50 bytes each time it is unloaded, so it stays loaded.
    ASSERT_NE(dlopen("libcurl.so.4", RTLD_NOW), nullptr);
    // Lets the tables of the dynamic loader grow to their final size.
    LoadAndUse(10);
    const auto files = CountFiles();
    const auto heap = HeapInUse();
    constexpr int kTimes = 1000;
    LoadAndUse(kTimes);
    EXPECT_EQ(CountFiles(), files);
    // Freed blocks may count as in use while the allocator caches them. A leak is at least 24 bytes for each round.
    EXPECT_LT(HeapInUse(), heap + kTimes);
}

/// The exit status of a child that loads the library and calls `then`. A write kills it.
int StatusOfLoadingWithoutWriting(void (*then)()) {
    const pid_t child = fork();
    if (child == 0) {
        Test::ForbidWriting();
        const bool isLoaded = static_cast<bool>(Loaded());
        then();
        _exit(isLoaded ? EXIT_SUCCESS : EXIT_FAILURE);
    }
    int status = 0;
    waitpid(child, &status, 0);
    return status;
}

TEST(Loading, WritesNothing) {
    if (::Test::IsEmulated()) {
        GTEST_SKIP() << "qemu-user has no system call filters";
    }
    const int status = StatusOfLoadingWithoutWriting([] {});
    EXPECT_TRUE(WIFEXITED(status)) << "killed by signal " << WTERMSIG(status);
    EXPECT_EQ(WEXITSTATUS(status), EXIT_SUCCESS);
}

TEST(Loading, IsKilledOnWrite) {
    if (::Test::IsEmulated()) {
        GTEST_SKIP() << "qemu-user has no system call filters";
    }
    for (auto *write : {
             +[] { std::ofstream("/tmp/file") << "text" << std::flush; },
             +[] { std::ofstream("/dev/null", std::ios::app); },
             +[] { std::filesystem::create_directory("/tmp/folder"); },
             +[] { std::filesystem::rename("/tmp/missing", "/tmp/file"); },
             +[] { std::filesystem::remove("/tmp/missing"); },
             +[] { syslog(LOG_ERR, "line"); },
             +[] { [[maybe_unused]] const ssize_t count = ::write(STDOUT_FILENO, "", 0); },
         }) {
        const int status = StatusOfLoadingWithoutWriting(write);
        EXPECT_TRUE(WIFSIGNALED(status));
        EXPECT_EQ(WTERMSIG(status), SIGSYS);
    }
}

}  // namespace
