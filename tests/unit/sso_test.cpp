// The base client: accessors, the two requests, the steps of a login.
#include "sso/sso.h"

#include <new>

#include "tests/support/interposed/calls.h"
#include "tests/support/interposed/memory.h"
#include "tests/support/interposed/transport.h"
#include "tests/support/token.h"
#include "tests/unit/fixture.h"

namespace Test {

namespace {

using namespace TAVO::SSO;
using testing::ElementsAre;

struct Client : SSOClient {
    using SSOClient::authEndpoint;
    using SSOClient::clientID;
    using SSOClient::clientSecret;
    using SSOClient::code;
    using SSOClient::enable;
    using SSOClient::logoutEndpoint;
    using SSOClient::redirectURI;
    using SSOClient::token;
    using SSOClient::tokenEndpoint;
    using SSOClient::wellknownEndpoint;
};

constexpr char kWellknown[] = "https://provider.example/wellknown";
constexpr char kToken[] = "https://provider.example/token";

class ClientBase : public Library {
  protected:
    ClientBase() {
        client.wellknownEndpoint = kWellknown;
        client.tokenEndpoint = kToken;
    }

    Client client;
    Json::Value out;
    std::string response;
};

/// Records the steps. Throws in step `failingStep`.
struct SteppingClient : SSOClient {
    void SetCode(std::string authorizationCode) override { Step("SetCode " + authorizationCode); }
    std::string GetIDTokenReqParams() override {
        Step("GetIDTokenReqParams");
        return "the body";
    }
    void RequestTokenEndpoint(std::string &answer, const std::string &body) override {
        Step("RequestTokenEndpoint '" + answer + "' " + body);
        answer = "the answer";
    }
    void ProcessTokenResponse(std::string answer) override { Step("ProcessTokenResponse " + answer); }
    void VerifyIDToken() override { Step("VerifyIDToken"); }
    void GetUserName(std::string &userName) override {
        Step("GetUserName " + userName);
        userName = "the user";
    }

    void Step(const std::string &step) {
        steps.push_back(step);
        if (steps.size() == failingStep) {
            throw std::domain_error(step);
        }
    }

    std::vector<std::string> steps;
    std::size_t failingStep = 0;
};

TEST_F(ClientBase, StartsDisabledAndEmpty) {
    Client fresh;
    EXPECT_FALSE(fresh.isEnable());
    for (const std::string &text : {fresh.GetClientID(), fresh.GetClientSecret(), fresh.GetRedirectURI(),
                                    fresh.GetToken(), fresh.GetAuthEndpoint(), fresh.GetTokenEndpoint(),
                                    fresh.GetWellknownEndpoint(), fresh.GetLogoutEndpoint(), fresh.code}) {
        EXPECT_EQ(text, "");
    }
}

TEST_F(ClientBase, ReturnsEachFieldFromItsGetter) {
    client.enable = true;
    client.clientID = "id";
    client.clientSecret = "made-up";
    client.redirectURI = "redirect";
    client.token = "t";
    client.authEndpoint = "auth";
    client.tokenEndpoint = "token";
    client.wellknownEndpoint = "wellknown";
    client.logoutEndpoint = "logout";
    EXPECT_TRUE(client.isEnable());
    EXPECT_EQ(client.GetClientID(), "id");
    EXPECT_EQ(client.GetClientSecret(), "made-up");
    EXPECT_EQ(client.GetRedirectURI(), "redirect");
    EXPECT_EQ(client.GetToken(), "t");
    EXPECT_EQ(client.GetAuthEndpoint(), "auth");
    EXPECT_EQ(client.GetTokenEndpoint(), "token");
    EXPECT_EQ(client.GetWellknownEndpoint(), "wellknown");
    EXPECT_EQ(client.GetLogoutEndpoint(), "logout");
}

TEST_F(ClientBase, StoresValuesOfSetters) {
    client.SetRedirectURI("elsewhere");
    client.SetCode("abc");
    EXPECT_EQ(client.GetRedirectURI(), "elsewhere");
    EXPECT_EQ(client.code, "abc");
}

TEST_F(ClientBase, FetchesAndParsesDiscoveryDocument) {
    CurrentTransport().answers[kWellknown] = {CURLE_OK, {R"({"jwks_uri":)", R"( "keys" /* a comment */})"}};
    client.RequestWellknownInfo(out);
    EXPECT_EQ(out["jwks_uri"].asString(), "keys");
    EXPECT_TRUE(out["jwks_uri"].hasComment(Json::commentAfterOnSameLine)) << "comments are collected";
    for (const std::string &call : CurrentTransport().calls) {
        EXPECT_THAT(call, testing::Not(testing::HasSubstr("VERIFY"))) << "libcurl's checks must stay enabled";
    }
}

TEST_F(ClientBase, ReturnsNullIfDiscoveryIsUnreachable) {
    client.wellknownEndpoint = "https://unreachable.example/";
    client.RequestWellknownInfo(out);
    EXPECT_TRUE(out.isNull());
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("sso:N " + ::Test::kNotConnected)));
}

TEST_F(ClientBase, ReturnsNullIfDiscoveryIsNotJSON) {
    CurrentTransport().answers[kWellknown] = Whole("<html>not found</html>");
    out["jwks_uri"] = "earlier";
    client.RequestWellknownInfo(out);
    EXPECT_TRUE(out.isNull());
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("sso:N bad wellknown json format.")));
}

TEST_F(ClientBase, ReturnsNullIfDiscoveryIsTruncated) {
    CurrentTransport().answers[kWellknown] = Whole(R"({"jwks_uri": "https://provider.example/keys", "iss)");
    client.RequestWellknownInfo(out);
    EXPECT_TRUE(out.isNull());
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("sso:N bad wellknown json format.")));
}

TEST_F(ClientBase, ReturnsNullIfDiscoveryIsNestedTooDeeply) {
    CurrentTransport().answers[kWellknown] = Whole(std::string(100000, '['));
    client.RequestWellknownInfo(out);
    EXPECT_TRUE(out.isNull());
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("sso:N bad wellknown json format.")));
}

TEST_F(ClientBase, LogsOneLineForDiscoveryWithoutTransferHandle) {
    CurrentTransport().noHandle = true;
    client.RequestWellknownInfo(out);
    EXPECT_TRUE(out.isNull());
    const auto log = TakeSystemLog();
    ASSERT_EQ(log.size(), 1u);
    EXPECT_EQ(log[0].priority, LOG_ERR);
    EXPECT_THAT(log[0].text, testing::StartsWith("sso:N bad_alloc. "));
}

TEST_F(ClientBase, KeepsNoPartialDiscoveryIfMemoryRunsOut) {
    const std::string document = R"({"a": {"b": [1, 2]}, "jwks_uri": "https://provider.example/keys", "z": true})";
    CurrentTransport().answers[kWellknown] = Whole(document);
    const Json::Value whole = Parse(document);
    int failed = 0;
    for (bool happened = true; happened;) {
        out = Json::Value();
        FailingAllocation failing(failed + 1);
        client.RequestWellknownInfo(out);
        happened = failing.Happened();
        failed += happened ? 1 : 0;
        ASSERT_TRUE(out == whole || (happened && out.isNull())) << failed;
    }
    EXPECT_GT(failed, 5);
    EXPECT_THAT(TakeSystemLog(), testing::Each(testing::Field(&LogLine::text, testing::StartsWith("sso:N "))));
}

TEST_F(ClientBase, OverwritesRequestBodyAfterLogin) {
    struct SecretClient : SteppingClient {
        std::string GetIDTokenReqParams() override { return "client_secret=a+secret+that+is+long+enough"; }
    } stepping;
    std::string userName;
    TakeCleansed();
    stepping.OpenIDConnectLogin("abc", userName);
    EXPECT_THAT(TakeCleansed(), testing::Contains("client_secret=a+secret+that+is+long+enough"));
}

TEST_F(ClientBase, OverwritesEarlierCode) {
    client.SetCode("the first of two codes");
    TakeCleansed();
    client.SetCode("the second of two codes");
    EXPECT_THAT(TakeCleansed(), testing::Contains("the first of two codes"));
}

TEST_F(ClientBase, PostsTokenRequestAndAppendsAnswer) {
    CurrentTransport().answers[kToken] = {CURLE_OK, {"one ", "two"}};
    response = "earlier ";
    client.RequestTokenEndpoint(response, "a=b");
    EXPECT_EQ(response, "earlier one two");
    EXPECT_EQ(CurrentTransport().form, "a=b");
}

TEST_F(ClientBase, LogsFailedTokenRequestAndKeepsPartialAnswer) {
    CurrentTransport().answers[kToken] = {CURLE_PARTIAL_FILE, {"half an ans"}};
    client.RequestTokenEndpoint(response, "a=b");
    EXPECT_EQ(response, "half an ans");
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("sso:N request token uri Transferred a partial file.")));
}

TEST_F(ClientBase, ReturnsEmptyResponseIfTokenEndpointIsUnreachable) {
    client.tokenEndpoint = "https://unreachable.example/";
    client.RequestTokenEndpoint(response, "a=b");
    EXPECT_EQ(response, "");
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("sso:N request token uri " + ::Test::kNotConnected + ".")));
}

TEST_F(ClientBase, LogsOneLineForTokenRequestWithoutHandle) {
    CurrentTransport().noHandle = true;
    client.RequestTokenEndpoint(response, "a=b");
    const auto log = TakeSystemLog();
    ASSERT_EQ(log.size(), 1u);
    EXPECT_EQ(log[0].priority, LOG_ERR);
    EXPECT_THAT(log[0].text, testing::StartsWith("sso:N bad_alloc. "));
}

TEST_F(ClientBase, CutsEachChunkAtFirstNUL) {
    CurrentTransport().answers[kToken] = {CURLE_OK, {std::string("ab\0cd", 5), "ef", std::string("\0gh", 3), "i"}};
    client.RequestTokenEndpoint(response, "a=b");
    EXPECT_EQ(response, "abefi");
}

TEST_F(ClientBase, ThrowsNotImplementedFromBaseSteps) {
    std::string userName = "before";
    EXPECT_EQ(FailureOf([&] { client.VerifyIDToken(); }), Fails<sso_not_implemented>("VerifyIDToken not implemented"));
    EXPECT_EQ(FailureOf([&] { client.GetIDTokenReqParams(); }),
              Fails<sso_not_implemented>("GetIDTokenReqParams not implemented"));
    EXPECT_EQ(FailureOf([&] { client.GetUserName(userName); }),
              Fails<sso_not_implemented>("GetUserName not implemented"));
    EXPECT_EQ(FailureOf([&] { client.ProcessTokenResponse(""); }),
              Fails<sso_not_implemented>("ProcessTokenResponse not implemented"));
    EXPECT_EQ(userName, "before");
}

TEST_F(ClientBase, FailsLoginAfterStoringCode) {
    std::string userName = "before";
    EXPECT_EQ(FailureOf([&] { client.OpenIDConnectLogin("abc", userName); }),
              Fails<sso_not_implemented>("GetIDTokenReqParams not implemented"));
    EXPECT_EQ(client.code, "abc");
    EXPECT_EQ(userName, "before");
    EXPECT_THAT(CurrentTransport().calls, testing::IsEmpty());
}

TEST_F(ClientBase, RunsSixStepsOfLoginInOrder) {
    SteppingClient stepping;
    std::string userName = "before";
    stepping.OpenIDConnectLogin("abc", userName);
    EXPECT_THAT(stepping.steps, ElementsAre("SetCode abc", "GetIDTokenReqParams", "RequestTokenEndpoint '' the body",
                                            "ProcessTokenResponse the answer", "VerifyIDToken", "GetUserName before"));
    EXPECT_EQ(userName, "the user");
}

TEST_F(ClientBase, KeepsUserNameIfStepThrows) {
    for (std::size_t failing = 1; failing <= 6; ++failing) {
        SteppingClient stepping;
        stepping.failingStep = failing;
        std::string userName = "before";
        EXPECT_THROW(stepping.OpenIDConnectLogin("abc", userName), std::domain_error);
        EXPECT_EQ(stepping.steps.size(), failing);
        EXPECT_EQ(userName, "before");
    }
}

}  // namespace

}  // namespace Test
