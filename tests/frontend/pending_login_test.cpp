#include "frontend/pending_login.h"

#include <gmock/gmock.h>
#include <utime.h>

#include <filesystem>

#include "frontend/failure.h"
#include "frontend/text.h"
#include "platform/platform.h"

using namespace Frontend;

namespace {

std::string Encode(const std::string &text) {
    char buffer[4096];
    EXPECT_NE(TLIBCBase64SzEncodeFull(text.data(), text.size(), buffer, 1, sizeof buffer, 0, 1), 0);
    return buffer;
}

class PendingLogin : public testing::Test {
  protected:
    PendingLogin() {
        std::filesystem::create_directory("/usr/tavo/var");
        state = StartLogin(answer, "/files");
    }
    ~PendingLogin() override { std::filesystem::remove_all("/usr/tavo/var"); }

    std::string Name() { return state["csrf"].asString(); }
    std::string Cookie() { return "__Host-login-" + Name().substr(0, 8) + "=" + Name(); }
    std::string State() { return Encode(WriteCompact(state)); }

    std::string Refusal(const std::string &cookies, const std::string &returned) {
        try {
            ConcludeLogin(answer, cookies, returned);
        } catch (const Frontend::Refusal &refusal) {
            return refusal.what();
        }
        return "";
    }

    Answer answer;
    Json::Value state;
};

TEST_F(PendingLogin, IsConcludedOnceByTheBrowserThatStartedIt) {
    EXPECT_EQ(Refusal(Cookie(), State()), "");
    EXPECT_EQ(Refusal(Cookie(), State()), "This sign-in took too long, or was already completed.");
}

TEST_F(PendingLogin, IsRefusedToAnotherBrowserAndStaysPending) {
    const std::string reason = "This sign-in was not started in this browser.";
    EXPECT_EQ(Refusal("", State()), reason);
    EXPECT_EQ(Refusal("__Host-login-" + Name().substr(0, 8) + "=" + std::string(32, '0'), State()), reason);
    EXPECT_EQ(Refusal(Cookie() + "; " + Cookie(), State()), reason);
    EXPECT_EQ(Refusal(Cookie(), State()), "");
}

TEST_F(PendingLogin, IsRefusedWhenItTookTooLong) {
    const utimbuf past{std::time(nullptr) - 601, std::time(nullptr) - 601};
    ASSERT_EQ(utime(("/usr/tavo/var/frontend/logins/" + Name()).c_str(), &past), 0);
    EXPECT_EQ(Refusal(Cookie(), State()), "This sign-in took too long, or was already completed.");
}

TEST_F(PendingLogin, IsRefusedWithAnotherOriginThanItWasStartedWith) {
    state["origin"] = "/elsewhere";
    EXPECT_EQ(Refusal(Cookie(), State()), "This sign-in was changed on its way.");
}

TEST_F(PendingLogin, IsRefusedWithoutAStateThatCanBeRead) {
    const std::string reason = "This sign-in was not started in this browser.";
    for (const std::string &text : {std::string(), std::string("[1]"), std::string("{\"csrf\":1}"),
                                    std::string("{\"csrf\":\"../sessions\"}"), std::string("not JSON")}) {
        EXPECT_EQ(Refusal("__Host-login-=", Encode(text)), reason);
    }
    EXPECT_EQ(Refusal(Cookie(), "not base64"), reason);
}

TEST(State, MayFillItsBufferWithoutATerminatingNul) {
    const std::string full = "{\"csrf\":\"" + std::string(1013, 'a') + "\"}";
    ASSERT_EQ(full.size(), 1024U);
    EXPECT_EQ(DecodeState(Encode(full))["csrf"].asString(), std::string(1013, 'a'));
    EXPECT_TRUE(DecodeState(Encode(full + " ")).isNull());
}

}  // namespace
