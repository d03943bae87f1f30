#include "web/private_folder.h"

#include <gmock/gmock.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>
#include <utime.h>

#include <array>
#include <cerrno>
#include <csignal>
#include <filesystem>
#include <fstream>
#include <system_error>
#include <thread>

#include "tests/support/failure.h"

using namespace TAVO::Web;

namespace {

using ::Test::FailureOf;

const std::string kSystemError = typeid(std::system_error).name();

int unlinkError = 0;  // errno of the next calls of unlinkat

}  // namespace

extern "C" int unlinkat(int folder, const char *name, int flags) noexcept {
    if (unlinkError != 0) {
        errno = unlinkError;
        return -1;
    }
    return static_cast<int>(syscall(SYS_unlinkat, folder, name, flags));
}

namespace {

constexpr char kFolder[] = "/usr/tavo/var/frontend/things/";
constexpr std::time_t kLifetime = 60;

PrivateFolder OpenThings(std::size_t most = PrivateFolder::kUnlimited) {
    const PrivateFolder parent("/usr/tavo/var/frontend", kLifetime);
    return {"/usr/tavo/var/frontend/things", kLifetime, most};
}

class PrivateFolderTest : public testing::Test {
  protected:
    PrivateFolderTest() { std::filesystem::create_directory("/usr/tavo/var"); }
    ~PrivateFolderTest() override { std::filesystem::remove_all("/usr/tavo/var"); }

    static std::string Keep(PrivateFolder &folder, const std::string &text) {
        std::string name = PrivateFolder::NewName();
        EXPECT_TRUE(folder.Keep(name, text));
        return name;
    }

    static void MakeOld(const std::string &name) {
        const utimbuf past{std::time(nullptr) - kLifetime - 1, std::time(nullptr) - kLifetime - 1};
        ASSERT_EQ(utime((kFolder + name).c_str(), &past), 0);
    }

    static unsigned Mode(const std::string &path) {
        struct stat status = {};
        EXPECT_EQ(stat(path.c_str(), &status), 0);
        return status.st_mode & 0777;
    }
};

TEST_F(PrivateFolderTest, StoresTextUnderRandomNameForOwnerOnly) {
    PrivateFolder things = OpenThings();
    const std::string name = Keep(things, "text");
    EXPECT_THAT(name, testing::MatchesRegex("[0-9a-f]{32}"));
    EXPECT_NE(Keep(things, "text"), name);
    EXPECT_EQ(things.Read(name), "text");
    EXPECT_EQ(FailureOf([&] { static_cast<void>(things.Keep(name, "another text")); }).type, kSystemError);
    EXPECT_EQ(Mode(kFolder + name), 0600U);
    EXPECT_EQ(Mode(kFolder), 0700U);
}

TEST_F(PrivateFolderTest, TakesTextOnlyOnce) {
    PrivateFolder things = OpenThings();
    const std::string name = Keep(things, "text");
    EXPECT_EQ(things.Take(name), "text");
    EXPECT_EQ(things.Take(name), std::nullopt);
}

TEST_F(PrivateFolderTest, IgnoresExpiredText) {
    PrivateFolder things = OpenThings();
    const std::string name = Keep(things, "text");
    MakeOld(name);
    EXPECT_EQ(things.Read(name), std::nullopt);
}

TEST_F(PrivateFolderTest, RemovesExpiredTextsOncePerMinute) {
    PrivateFolder things = OpenThings();
    const std::string name = Keep(things, "text");
    std::ofstream(kFolder + std::string(32, 'a') + ".new") << "half of it";
    MakeOld(name);
    MakeOld(std::string(32, 'a') + ".new");
    Keep(things, "another");
    EXPECT_TRUE(std::filesystem::exists(kFolder + name));
    for (const char *swept : {"1", "4102444800", "\"now\""}) {  // long ago, in the future, invalid
        const std::string late = Keep(things, "text");
        MakeOld(late);
        std::ofstream(std::string(kFolder) + "counter") << "{\"count\": 1, \"swept\": " << swept << "}";
        Keep(things, "another");
        EXPECT_FALSE(std::filesystem::exists(kFolder + late)) << swept;
    }
    EXPECT_FALSE(std::filesystem::exists(kFolder + name));
    EXPECT_FALSE(std::filesystem::exists(kFolder + std::string(32, 'a') + ".new"));
}

TEST_F(PrivateFolderTest, KeepsUnrelatedFiles) {
    PrivateFolder things = OpenThings();
    for (const char *name : {"id_rsa", "0123", "id_rsa.new"}) {
        std::ofstream(std::string(kFolder) + name) << "another program's";
        MakeOld(name);
    }
    Keep(things, "text");
    for (const char *name : {"id_rsa", "0123", "id_rsa.new"}) {
        EXPECT_TRUE(std::filesystem::exists(std::string(kFolder) + name)) << name;
    }
}

TEST_F(PrivateFolderTest, RejectsOtherNamesAndRelativePaths) {
    PrivateFolder things = OpenThings();
    EXPECT_THROW(static_cast<void>(things.Keep("../escaped", "text")), std::invalid_argument);
    EXPECT_THROW(PrivateFolder("var/things", kLifetime), std::invalid_argument);
    EXPECT_THROW(PrivateFolder("", kLifetime), std::invalid_argument);
}

TEST_F(PrivateFolderTest, StoresNoMoreThanCapacity) {
    PrivateFolder things = OpenThings(2);
    Keep(things, "one");
    Keep(things, "two");
    const std::string name = PrivateFolder::NewName();
    EXPECT_FALSE(things.Keep(name, "three"));
    EXPECT_EQ(things.Read(name), std::nullopt);
}

TEST_F(PrivateFolderTest, RejectsTextAboveMaximumSize) {
    PrivateFolder things = OpenThings();
    EXPECT_EQ(things.Read(Keep(things, std::string(16384, 'x'))), std::string(16384, 'x'));
    EXPECT_EQ(
        FailureOf([&] { static_cast<void>(things.Keep(PrivateFolder::NewName(), std::string(16385, 'x'))); }).type,
        kSystemError);
}

TEST_F(PrivateFolderTest, WritesTextAtomically) {
    PrivateFolder things = OpenThings();
    const std::string name = PrivateFolder::NewName();
    const rlimit none{0, RLIM_INFINITY};
    rlimit former{};
    getrlimit(RLIMIT_FSIZE, &former);
    signal(SIGXFSZ, SIG_IGN);
    Keep(things, "makes the counter");
    setrlimit(RLIMIT_FSIZE, &none);
    EXPECT_EQ(FailureOf([&] { static_cast<void>(things.Keep(name, "text")); }).type, kSystemError);
    setrlimit(RLIMIT_FSIZE, &former);
    EXPECT_EQ(things.Read(name), std::nullopt);
}

TEST_F(PrivateFolderTest, FailsToTakeTextItCannotRemove) {
    PrivateFolder things = OpenThings();
    const std::string name = Keep(things, "text");
    unlinkError = EROFS;
    EXPECT_EQ(FailureOf([&] { things.Take(name); }).type, kSystemError);
    unlinkError = ENOENT;  // another process was faster
    EXPECT_EQ(things.Take(name), std::nullopt);
    unlinkError = 0;
    EXPECT_EQ(things.Take(name), "text");
}

TEST_F(PrivateFolderTest, LetsOneOfTwoThreadsTakeText) {
    PrivateFolder things = OpenThings();
    for (int i = 0; i < 100; ++i) {
        const std::string name = Keep(things, "text");
        std::array<bool, 2> got{};
        std::thread other([&] { got[0] = OpenThings().Take(name).has_value(); });
        got[1] = OpenThings().Take(name).has_value();
        other.join();
        EXPECT_NE(got[0], got[1]);
    }
}

TEST_F(PrivateFolderTest, ReadsOnlyItsOwnFiles) {
    PrivateFolder things = OpenThings();
    for (const char *name : {"", ".", "../things", "/etc/passwd", "0123456789abcdef0123456789abcdeF"}) {
        EXPECT_EQ(things.Read(name), std::nullopt);
    }
    const std::string link(32, 'a');
    std::filesystem::create_symlink("/etc/passwd", kFolder + link);
    EXPECT_EQ(FailureOf([&] { things.Read(link); }).type, kSystemError);
}

TEST_F(PrivateFolderTest, RejectsFileWithUnexpectedAttributes) {
    PrivateFolder things = OpenThings();
    const std::string name = Keep(things, "text");
    ASSERT_EQ(chmod((kFolder + name).c_str(), 0640), 0);
    EXPECT_EQ(FailureOf([&] { things.Read(name); }).type, kSystemError);
    const std::string pipe(32, 'b');
    ASSERT_EQ(mkfifo((kFolder + pipe).c_str(), 0600), 0);
    EXPECT_EQ(FailureOf([&] { things.Read(pipe); }).type, kSystemError);
    const std::string large(32, 'c');
    std::ofstream(kFolder + large) << std::string(20000, 'x');
    ASSERT_EQ(chmod((kFolder + large).c_str(), 0600), 0);
    EXPECT_EQ(FailureOf([&] { things.Read(large); }).type, kSystemError);
}

TEST_F(PrivateFolderTest, RejectsFolderAccessibleToOthers) {
    for (const char *folder : {"/usr/tavo/var/frontend/things", "/usr/tavo/var/frontend"}) {
        for (const mode_t mode : {0750U, 0770U, 0701U, 0755U}) {
            OpenThings();
            ASSERT_EQ(chmod(folder, mode), 0);
            EXPECT_EQ(FailureOf([&] { OpenThings(); }).type, kSystemError) << folder << std::oct << mode;
            ASSERT_EQ(chmod(folder, 0700), 0);
        }
    }
}

TEST_F(PrivateFolderTest, RejectsPathWritableByOthers) {
    for (const mode_t mode : {0775U, 0757U, 01777U}) {
        ASSERT_EQ(chmod("/usr/tavo/var", mode), 0);
        EXPECT_EQ(FailureOf([&] { OpenThings(); }).type, kSystemError) << std::oct << mode;
    }
    ASSERT_EQ(chmod("/usr/tavo/var", 0755), 0);
    OpenThings();
}

TEST_F(PrivateFolderTest, RejectsSymbolicLinkInPath) {
    for (const char *name : {"/usr/tavo/var/frontend/things", "/usr/tavo/var/frontend", "/usr/tavo/var"}) {
        OpenThings();
        std::filesystem::rename(name, "/usr/tavo/elsewhere");
        std::filesystem::create_directory_symlink("/usr/tavo/elsewhere", name);
        EXPECT_EQ(FailureOf([&] { OpenThings(); }).type, kSystemError) << name;
        std::filesystem::remove(name);
        std::filesystem::rename("/usr/tavo/elsewhere", name);
    }
}

}  // namespace
