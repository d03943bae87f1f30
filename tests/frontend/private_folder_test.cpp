#include "frontend/private_folder.h"

#include <gmock/gmock.h>
#include <sys/stat.h>
#include <utime.h>

#include <filesystem>
#include <system_error>

using namespace Frontend;

namespace {

constexpr char kFolder[] = "/usr/tavo/var/frontend/things/";
constexpr std::time_t kLifetime = 60;

class PrivateFolderTest : public testing::Test {
  protected:
    PrivateFolderTest() { std::filesystem::create_directory("/usr/tavo/var"); }
    ~PrivateFolderTest() override { std::filesystem::remove_all("/usr/tavo/var"); }

    static std::string Keep(PrivateFolder &folder, const std::string &text) {
        std::string name = PrivateFolder::NewName();
        folder.Keep(name, text);
        return name;
    }

    static void MakeOld(const std::string &name) {
        const utimbuf past{std::time(nullptr) - kLifetime - 1, std::time(nullptr) - kLifetime - 1};
        ASSERT_EQ(utime((kFolder + name).c_str(), &past), 0);
    }

    static unsigned Mode(const std::string &path) {
        struct stat status {};
        EXPECT_EQ(stat(path.c_str(), &status), 0);
        return status.st_mode & 0777;
    }
};

TEST_F(PrivateFolderTest, KeepsATextUnderARandomNameForThisUserAlone) {
    PrivateFolder things("things", kLifetime);
    const std::string name = Keep(things, "text");
    EXPECT_THAT(name, testing::MatchesRegex("[0-9a-f]{32}"));
    EXPECT_NE(Keep(things, "text"), name);
    EXPECT_EQ(things.Read(name), "text");
    EXPECT_THROW(things.Keep(name, "another text"), std::system_error);
    EXPECT_EQ(Mode(kFolder + name), 0600U);
    EXPECT_EQ(Mode(kFolder), 0700U);
}

TEST_F(PrivateFolderTest, GivesATextToOneTakerOnly) {
    PrivateFolder things("things", kLifetime);
    const std::string name = Keep(things, "text");
    EXPECT_EQ(things.Take(name), "text");
    EXPECT_EQ(things.Take(name), std::nullopt);
}

TEST_F(PrivateFolderTest, ForgetsATextThatIsTooOld) {
    PrivateFolder things("things", kLifetime);
    const std::string name = Keep(things, "text");
    MakeOld(name);
    EXPECT_EQ(things.Read(name), std::nullopt);
    Keep(things, "another");
    EXPECT_FALSE(std::filesystem::exists(kFolder + name));
}

TEST_F(PrivateFolderTest, ReadsNothingButItsOwnFiles) {
    PrivateFolder things("things", kLifetime);
    for (const char *name : {"", ".", "../things", "/etc/passwd", "0123456789abcdef0123456789abcdeF"}) {
        EXPECT_EQ(things.Read(name), std::nullopt);
    }
    const std::string link(32, 'a');
    std::filesystem::create_symlink("/etc/passwd", kFolder + link);
    EXPECT_THROW(things.Read(link), std::system_error);
}

TEST_F(PrivateFolderTest, RefusesAFolderThatOthersMayLookInto) {
    PrivateFolder("things", kLifetime);
    ASSERT_EQ(chmod(kFolder, 0755), 0);
    EXPECT_THROW(PrivateFolder("things", kLifetime), std::system_error);
}

}  // namespace
