#include "frontend/session.h"

#include <gmock/gmock.h>
#include <sys/stat.h>
#include <utime.h>

#include <filesystem>
#include <fstream>
#include <iterator>

#include "tests/frontend/set_cookie.h"

using namespace Frontend;
using namespace TAVO::Web;

namespace {

constexpr char kFolder[] = "/usr/tavo/var/frontend/sessions";

class SessionTest : public testing::Test {
  protected:
    SessionTest() {
        std::filesystem::create_directory("/usr/tavo/var");
        UseProfile(R"({"sso_enable": true, "sso_profile": "azure"})");
    }
    ~SessionTest() override {
        std::filesystem::remove_all("/usr/tavo/var");
        std::filesystem::remove_all("/usr/tavo/etc");
    }

    static void UseProfile(const char *profile) {
        std::filesystem::create_directories("/usr/tavo/etc/ssoclient");
        std::ofstream("/usr/tavo/etc/ssoclient/profile.conf") << profile;
    }

    static std::optional<Session> Find(const std::string &cookies) {
        Response response;
        return FindSession(response, cookies);
    }

    /// Replaces the content of this cookie's session file.
    static void Overwrite(const std::string &cookie, const std::string &text) {
        const std::string file = kFolder + std::string("/") + cookie.substr(cookie.find('=') + 1);
        std::ofstream(file) << text;
        ASSERT_EQ(chmod(file.c_str(), 0600), 0);
    }

    /// The cookie of a session that starts in a browser with `cookies`.
    static std::string Start(const std::string &cookies, const std::string &user) {
        Response response;
        StartSession(response, cookies, {user, "Alice Example", "azure"});
        return LastSetCookie(response);
    }

    static std::string CookieOf(const std::string &header) { return header.substr(0, header.find(';')); }
};

TEST_F(SessionTest, IsFoundByCookieUntilItEnds) {
    const std::string cookie = CookieOf(Start("", "ACME\\alice"));
    const auto session = Find("other=1; " + cookie);
    ASSERT_TRUE(session);
    EXPECT_EQ(session->user, "ACME\\alice");
    EXPECT_EQ(session->displayName, "Alice Example");
    EXPECT_EQ(session->profile, "azure");
    Response response;
    ASSERT_TRUE(EndSession(response, cookie));
    EXPECT_FALSE(Find(cookie));
    EXPECT_FALSE(EndSession(response, cookie));
}

TEST_F(SessionTest, SetsSecureHostCookie) {
    EXPECT_THAT(Start("", "alice"),
                testing::MatchesRegex("__Host-session=[0-9a-f]{32}; Path=/; Secure; HttpOnly; SameSite=Lax"));
}

TEST_F(SessionTest, ReplacesPlantedSession) {
    const std::string planted = CookieOf(Start("", "attacker"));
    const std::string victim = CookieOf(Start(planted, "victim"));
    EXPECT_NE(victim, planted);
    EXPECT_FALSE(Find(planted));
    const std::string invented = "__Host-session=" + std::string(32, '0');
    EXPECT_NE(CookieOf(Start(invented, "victim")), invented);
    EXPECT_FALSE(Find(invented));
}

TEST_F(SessionTest, RejectsMalformedSessionFile) {
    const std::string cookie = CookieOf(Start("", "alice"));
    for (const char *text :
         {"", "{}", R"({"user": "alice", "profile": "azure"})", R"({"format": "session 1", "profile": "azure"})",
          R"({"format": "session 1", "user": "", "profile": "azure"})",
          R"({"format": "session 1", "user": "a\u0000b", "profile": "azure"})",
          R"({"format": "session 1", "user": 1, "profile": "azure"})", R"({"format": "session 1", "user": "alice"})",
          R"({"format": "login 1", "user": "alice", "profile": "azure"})",
          R"({"format": "session 1", "user": "alice", "profile": "azure")"}) {
        Overwrite(cookie, text);
        EXPECT_FALSE(Find(cookie)) << text;
    }
    Overwrite(cookie, R"({"format": "session 1", "user": "alice", "profile": "azure"})");
    EXPECT_TRUE(Find(cookie));
}

TEST_F(SessionTest, EndsWhenProfileChanges) {
    for (const char *profile : {R"({"sso_enable": true, "sso_profile": "websphere"})",
                                R"({"sso_enable": false, "sso_profile": "azure"})", "{}"}) {
        UseProfile(R"({"sso_enable": true, "sso_profile": "azure"})");
        const std::string cookie = CookieOf(Start("", "alice"));
        EXPECT_TRUE(Find(cookie));
        UseProfile(profile);
        EXPECT_FALSE(Find(cookie)) << profile;
        UseProfile(R"({"sso_enable": true, "sso_profile": "azure"})");
        EXPECT_FALSE(Find(cookie)) << profile;
    }
}

TEST_F(SessionTest, EndsAfterEightHours) {
    const std::string cookie = CookieOf(Start("", "alice"));
    const std::string file = kFolder + std::string("/") + cookie.substr(cookie.find('=') + 1);
    for (const auto &[age, isAlive] : {std::pair(8 * 3600 - 2, true), {8 * 3600 + 2, false}, {-60, false}}) {
        const utimbuf past{std::time(nullptr) - age, std::time(nullptr) - age};
        ASSERT_EQ(utime(file.c_str(), &past), 0);
        EXPECT_EQ(Find(cookie).has_value(), isAlive) << age;
    }
}

TEST_F(SessionTest, IsReadableOnlyByOwner) {
    Start("", "alice");
    struct stat status = {};
    ASSERT_EQ(stat(kFolder, &status), 0);
    EXPECT_EQ(status.st_mode & 0777, 0700U);
    const std::filesystem::directory_iterator files(kFolder);
    ASSERT_NE(files, std::filesystem::directory_iterator());
    ASSERT_EQ(stat(files->path().c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777, 0600U);
}

}  // namespace
