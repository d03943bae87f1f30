#include "frontend/pending_login.h"

#include <gmock/gmock.h>
#include <sso/sso.h>
#include <utime.h>

#include <filesystem>

#include "frontend/cgi.h"
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

// As the clients do, with a nonce of its own.
std::string MakeAddress(Json::Value state) {
    state["nonce"] = "digest";
    return "https://provider.example/auth?scope=openid&state=" + TAVO::SSO::URLEncode(Encode(WriteCompact(state)));
}

class PendingLogin : public testing::Test {
  protected:
    PendingLogin() {
        std::filesystem::create_directory("/usr/tavo/var");
        answer.origin = "/files";
        const std::string address = StartLogin(answer, MakeAddress);
        state = OnlyValue(ParseQuery(address.substr(address.find('?') + 1)), "state").value();
    }
    ~PendingLogin() override { std::filesystem::remove_all("/usr/tavo/var"); }

    std::string Name() { return DecodeState(state)["csrf"].asString(); }
    std::string Cookie() { return "__Host-login-" + Name().substr(0, 8) + "=" + Name(); }

    std::string Refusal(const std::string &cookies, const std::string &returned) {
        try {
            ConcludeLogin(answer, cookies, returned);
        } catch (const Frontend::Refusal &refusal) {
            return refusal.what();
        }
        return "";
    }

    Answer answer;
    std::string state;
};

TEST_F(PendingLogin, IsConcludedOnceByTheBrowserThatStartedIt) {
    EXPECT_EQ(Refusal(Cookie(), state), "");
    EXPECT_EQ(Refusal(Cookie(), state), "This sign-in took too long, or was already completed.");
}

TEST_F(PendingLogin, GivesWhatTheStateHolds) {
    const Json::Value object = ConcludeLogin(answer, Cookie(), state);
    EXPECT_EQ(object["origin"].asString(), "/files");
    EXPECT_EQ(object["nonce"].asString(), "digest");
}

TEST_F(PendingLogin, IsRefusedToAnotherBrowserAndStaysPending) {
    const std::string reason = "This sign-in was not started in this browser.";
    EXPECT_EQ(Refusal("", state), reason);
    EXPECT_EQ(Refusal("__Host-login-" + Name().substr(0, 8) + "=" + std::string(32, '0'), state), reason);
    EXPECT_EQ(Refusal(Cookie() + "; " + Cookie(), state), reason);
    EXPECT_EQ(Refusal(Cookie(), state), "");
}

TEST_F(PendingLogin, IsRefusedWhenItTookTooLong) {
    const utimbuf past{std::time(nullptr) - 601, std::time(nullptr) - 601};
    ASSERT_EQ(utime(("/usr/tavo/var/frontend/logins/" + Name()).c_str(), &past), 0);
    EXPECT_EQ(Refusal(Cookie(), state), "This sign-in took too long, or was already completed.");
}

TEST_F(PendingLogin, IsRefusedWithAnotherOriginThanItWasStartedWith) {
    Json::Value changed = DecodeState(state);
    changed["origin"] = "/elsewhere";
    EXPECT_EQ(Refusal(Cookie(), Encode(WriteCompact(changed))), "This sign-in was changed on its way.");
}

TEST_F(PendingLogin, IsRefusedWithTheNonceOfAnotherLogin) {
    Json::Value changed = DecodeState(state);
    changed["nonce"] = "another digest";
    EXPECT_EQ(Refusal(Cookie(), Encode(WriteCompact(changed))), "This sign-in was changed on its way.");
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
