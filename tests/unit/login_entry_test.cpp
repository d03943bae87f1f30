// OIDCLogin up to the steps of the client, and GetSSORelayURL.

#include "sso/sso.h"
#include "tests/support/encoding.h"
#include "tests/support/interposed/platform_calls.h"
#include "tests/support/interposed/process.h"
#include "tests/support/interposed/transport.h"
#include "tests/support/token.h"
#include "tests/unit/fixture.h"

namespace Test {

namespace {

using namespace TAVO::SSO;

class LoginEntry : public Library {
  protected:
    Failure LoginWith(const std::string &profile) {
        WriteFile(kProfileFile, profile);
        return Login();
    }

    Failure Login() {
        return FailureOf([this] { OIDCLogin("abc", userName); });
    }

    std::string userName = "before";
};

TEST_F(LoginEntry, FailsWithoutProfileFile) {
    EXPECT_EQ(Login(), Fails<sso_op_failed>("read profile file failed."));
    EXPECT_EQ(userName, "before");
}

TEST_F(LoginEntry, FailsIfProfileFileIsNotJSON) {
    EXPECT_EQ(LoginWith("sso_enable=yes"), Fails<sso_op_failed>("read profile file failed."));
    EXPECT_EQ(LoginWith(""), Fails<sso_op_failed>("read profile file failed."));
}

TEST_F(LoginEntry, RequiresEnableAsBooleanTrue) {
    const auto notEnabled = Fails<sso_op_failed>("sso does not enable.");
    EXPECT_EQ(LoginWith(R"({"sso_profile": "azure"})"), notEnabled);
    EXPECT_EQ(LoginWith(R"({"sso_enable": false, "sso_profile": "azure"})"), notEnabled);
    EXPECT_EQ(LoginWith(R"({"sso_enable": "true", "sso_profile": "azure"})"), notEnabled);
    EXPECT_EQ(LoginWith(R"({"sso_enable": 1, "sso_profile": "azure"})"), notEnabled);
    EXPECT_EQ(LoginWith(R"([true])"), notEnabled) << "a list has no members";
}

TEST_F(LoginEntry, RequiresProfileAsString) {
    const auto notSpecified = Fails<sso_op_failed>("not specify sso profile");
    EXPECT_EQ(LoginWith(R"({"sso_enable": true})"), notSpecified);
    EXPECT_EQ(LoginWith(R"({"sso_enable": true, "sso_profile": 5})"), notSpecified);
    EXPECT_EQ(LoginWith(R"({"sso_enable": true, "sso_profile": null})"), notSpecified);
}

TEST_F(LoginEntry, ThrowsPlainSSOExceptionForUnknownProfile) {
    const auto notSupported = Fails<sso_exception>("profile not support.");
    EXPECT_EQ(LoginWith(R"({"sso_enable": true, "sso_profile": "Azure"})"), notSupported);
    EXPECT_EQ(LoginWith(R"({"sso_enable": true, "sso_profile": ""})"), notSupported);
    EXPECT_EQ(LoginWith(R"({"sso_enable": true, "sso_profile": "azure "})"), notSupported);
    EXPECT_EQ(LoginWith(R"({"sso_enable": true, "sso_profile": "azure\u0000"})"), notSupported);
}

TEST_F(LoginEntry, ReadsProfileWithoutRaisingIds) {
    SetEffectiveIDs(1024, 100);
    EXPECT_EQ(Login(), Fails<sso_op_failed>("read profile file failed."));
    EXPECT_THAT(TakeSetIDCalls(), testing::IsEmpty());
}

TEST_F(LoginEntry, SelectsClientByProfile) {
    WriteFile(kAzureFile, R"({"azure_token_endpoint": "https://azure.example/token"})");
    WriteFile(kWebSphereFile, R"({"websphere_token_endpoint": "https://websphere.example/token"})");
    const auto noAnswer = Fails<std::invalid_argument>("parse json falied");

    EXPECT_EQ(LoginWith(R"({"sso_enable": true, "sso_profile": "azure"})"), noAnswer);
    EXPECT_EQ(LoginWith(R"({"sso_enable": true, "sso_profile": "websphere"})"), noAnswer);

    EXPECT_THAT(CurrentTransport().urls,
                testing::ElementsAre("https://azure.example/token", "https://websphere.example/token"));
    const auto unreachable = Error("sso:N request token uri " + ::Test::kNotConnected + ".");
    EXPECT_THAT(TakeSystemLog(), testing::ElementsAre(unreachable, unreachable));
    EXPECT_EQ(userName, "before");
}

TEST_F(LoginEntry, SendsCodeToTokenEndpoint) {
    LoginWith(R"({"sso_enable": true, "sso_profile": "azure"})");
    EXPECT_EQ(CurrentTransport().form,
              "client_id=&client_secret=&code=abc&grant_type=authorization_code&redirect_uri=");
    TakeSystemLog();
}

class RelayURL : public Library {};

constexpr char kPlainSuccess[] = "ssoclient/relay.html#success=true";

TEST_F(RelayURL, ReportsSuccessWithoutStateAndReason) { EXPECT_EQ(GetSSORelayURL(true, "", ""), kPlainSuccess); }

TEST_F(RelayURL, OmitsReasonOnSuccess) { EXPECT_EQ(GetSSORelayURL(true, "", "reason"), kPlainSuccess); }

TEST_F(RelayURL, EncodesOriginOnSuccess) {
    EXPECT_EQ(GetSSORelayURL(true, Base64(R"({"origin": "/a page?b=c&d"})"), ""),
              "ssoclient/relay.html#origin=%2Fa%20page%3Fb%3Dc%26d&success=true");
}

TEST_F(RelayURL, IncludesEmptyOrigin) {
    EXPECT_EQ(GetSSORelayURL(true, Base64(R"({"origin": ""})"), ""), "ssoclient/relay.html#origin=&success=true");
}

TEST_F(RelayURL, OmitsNonStringOrigin) {
    for (const char *state : {R"({"origin": null})", R"({"origin": 5})", R"({"origin": ["/"]})", R"({})"}) {
        EXPECT_EQ(GetSSORelayURL(true, Base64(state), ""), kPlainSuccess) << state;
    }
}

TEST_F(RelayURL, IgnoresStateUnlessJSONObject) {
    for (const char *state : {"not JSON", "[]", "5", "\"text\"", R"({"origin": "/", )", "[[[[["}) {
        EXPECT_EQ(GetSSORelayURL(true, Base64(state), ""), kPlainSuccess) << state;
    }
}

TEST_F(RelayURL, IgnoresStateUnlessBase64) {
    EXPECT_EQ(GetSSORelayURL(true, "{\"origin\": \"/\"}", ""), kPlainSuccess);
    EXPECT_EQ(GetSSORelayURL(true, "!!!!", ""), kPlainSuccess);
}

TEST_F(RelayURL, IgnoresStateLargerThanBuffer) {
    EXPECT_EQ(GetSSORelayURL(true, Base64(R"({"origin": "/"})" + std::string(1010, ' ')), ""), kPlainSuccess);
}

TEST_F(RelayURL, ReadsStateThatFillsBuffer) {
    const std::string state = R"({"origin": "/"})";
    EXPECT_EQ(GetSSORelayURL(true, Base64(state + std::string(1024 - state.size(), ' ')), ""),
              "ssoclient/relay.html#origin=%2F&success=true");
}

TEST_F(RelayURL, ReadsStateUpToFirstNUL) {
    EXPECT_EQ(GetSSORelayURL(true, Base64(std::string("{\"origin\": \"/\"}\0no JSON", 23)), ""),
              "ssoclient/relay.html#origin=%2F&success=true");
}

TEST_F(RelayURL, PassesZeroedBufferToDecoder) {
    Platform platform;
    platform.decode = [](const std::string &src, char *dst, std::size_t *length) {
        EXPECT_EQ(src, "the state");
        EXPECT_EQ(*length, 1024u);
        EXPECT_EQ(std::string(dst, *length), std::string(1024, '\0'));
        const std::string text = R"({"origin": "/here"})";
        text.copy(dst, text.size());
        *length = 0;  // ignored by the library
        return -1;    // every value except 0 is success
    };
    ReplacePlatform(platform);
    EXPECT_EQ(GetSSORelayURL(true, "the state", ""), "ssoclient/relay.html#origin=%2Fhere&success=true");
}

TEST_F(RelayURL, IgnoresStateOnFailure) {
    EXPECT_EQ(GetSSORelayURL(false, "", ""), "ssoclient/relay.html#success=false");
    EXPECT_EQ(GetSSORelayURL(false, Base64(R"({"origin": "/"})"), ""), "ssoclient/relay.html#success=false");
}

TEST_F(RelayURL, DoesNotDecodeStateOnFailure) {
    Platform platform;
    platform.decode = [](const std::string &, char *, std::size_t *) {
        ADD_FAILURE() << "decoded";
        return 0;
    };
    ReplacePlatform(platform);
    GetSSORelayURL(false, "c3RhdGU=", "reason");
}

TEST_F(RelayURL, CopiesReasonVerbatim) {
    EXPECT_EQ(GetSSORelayURL(false, "", "a & b # c%20d"), "ssoclient/relay.html#reason=a & b # c%20d&success=false");
}

}  // namespace

}  // namespace Test
