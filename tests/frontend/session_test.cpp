#include "frontend/session.h"

#include <gmock/gmock.h>
#include <sys/stat.h>

#include <filesystem>
#include <iterator>

using namespace Frontend;

namespace {

constexpr char kFolder[] = "/usr/tavo/var/frontend/sessions";

class SessionTest : public testing::Test {
  protected:
    SessionTest() { std::filesystem::create_directory("/usr/tavo/var"); }
    ~SessionTest() override { std::filesystem::remove_all("/usr/tavo/var"); }

    /// The header line with which a session starts in a browser that has `cookies`.
    static std::string Start(const std::string &cookies, const std::string &user) {
        testing::internal::CaptureStdout();
        Answer answer;
        StartSession(answer, cookies, {user, "azure"});
        answer.Redirect("/");
        const std::string output = testing::internal::GetCapturedStdout();
        const std::size_t begin = output.find("Set-Cookie: ");
        return output.substr(begin, output.find('\n', begin) - begin);
    }

    static std::string CookieOf(const std::string &header) {
        const std::size_t begin = header.find(' ') + 1;
        return header.substr(begin, header.find(';') - begin);
    }
};

TEST_F(SessionTest, IsFoundByItsCookieUntilItEnds) {
    const std::string cookie = CookieOf(Start("", "ACME\\alice"));
    const auto session = FindSession("other=1; " + cookie);
    ASSERT_TRUE(session);
    EXPECT_EQ(session->user, "ACME\\alice");
    EXPECT_EQ(session->profile, "azure");
    Answer answer;
    ASSERT_TRUE(EndSession(answer, cookie));
    EXPECT_FALSE(FindSession(cookie));
    EXPECT_FALSE(EndSession(answer, cookie));
}

TEST_F(SessionTest, HasACookieThatOnlyThisSiteGetsOnlyOverTls) {
    EXPECT_THAT(
        Start("", "alice"),
        testing::MatchesRegex("Set-Cookie: __Host-session=[0-9a-f]{32}; Path=/; Secure; HttpOnly; SameSite=Lax"));
}

TEST_F(SessionTest, IsNeverTheOneThatWasPlantedBeforehand) {
    const std::string planted = CookieOf(Start("", "attacker"));
    const std::string victim = CookieOf(Start(planted, "victim"));
    EXPECT_NE(victim, planted);
    EXPECT_FALSE(FindSession(planted));
    const std::string invented = "__Host-session=" + std::string(32, '0');
    EXPECT_NE(CookieOf(Start(invented, "victim")), invented);
    EXPECT_FALSE(FindSession(invented));
}

TEST_F(SessionTest, CannotBeReadByAnotherUserOfTheMachine) {
    Start("", "alice");
    struct stat status {};
    ASSERT_EQ(stat(kFolder, &status), 0);
    EXPECT_EQ(status.st_mode & 0777, 0700U);
    const std::filesystem::directory_iterator files(kFolder);
    ASSERT_NE(files, std::filesystem::directory_iterator());
    ASSERT_EQ(stat(files->path().c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777, 0600U);
}

}  // namespace
