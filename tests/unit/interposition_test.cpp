// Defines functions that the library exports. The library's own calls must use these definitions, with every compiler
// and optimisation level.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <syslog.h>

#include <functional>

#include "sso/sso.h"
#include "tests/support/system_log.h"

namespace TAVO::SSO {

std::string URLEncode(const std::string &value) { return "<" + value + ">"; }

std::string MD5Digest(std::string /*data*/) { return "digest"; }

std::function<void(std::string &response)> transfer;

void httpGet(const std::string & /*url*/, std::string &response, bool /*verifySSL*/,
             std::size_t (* /*writeCallback*/)(char *, std::size_t, std::size_t, void *)) {
    transfer(response);
}

void httpPost(const std::string & /*url*/, const std::string & /*body*/, std::string &response, bool /*verifySSL*/,
              std::size_t (* /*writeCallback*/)(char *, std::size_t, std::size_t, void *)) {
    transfer(response);
}

std::string SSOClient::GetLogoutEndpoint() { return "logout"; }

}  // namespace TAVO::SSO

namespace {

using namespace TAVO::SSO;
using ::Test::LogLine;
using ::Test::TakeSystemLog;
using ::Test::TakeSystemLogWithOwnTexts;

TEST(Interposition, ReplacesURLEncode) {
    EXPECT_EQ(WebSphereSSOClient().GetIDTokenReqParams(),
              "client_id=<>&client_secret=<>&code=<>&grant_type=<authorization_code>&redirect_uri=<>");
}

TEST(Interposition, ReplacesMD5Digest) {
    // {"nonce":"digest"} and a line feed
    EXPECT_THAT(AzureSSOClient().GetAccessTokenReqURI(Json::Value()),
                testing::HasSubstr("state=<eyJub25jZSI6ImRpZ2VzdCJ9Cg==>"));
}

TEST(Interposition, ReplacesHttpGet) {
    transfer = [](std::string &response) { response = R"({"keys": "from httpGet"})"; };
    AzureSSOClient client;
    Json::Value wellknown;
    client.RequestWellknownInfo(wellknown);
    EXPECT_EQ(wellknown["keys"], "from httpGet");
    Json::Value keys;
    client.RequestKeysInfo("", keys);
    EXPECT_EQ(keys["keys"], "from httpGet");
}

TEST(Interposition, ReplacesHttpPost) {
    transfer = [](std::string &response) { response = R"({"id_token": "from httpPost"})"; };
    AzureSSOClient client;
    std::string response;
    client.RequestTokenEndpoint(response, "");
    client.ProcessTokenResponse(response);
    EXPECT_EQ(client.GetToken(), "from httpPost");
}

/// A request to the provider, and the source that logs its failure.
struct Exchange {
    const char *name;
    const char *source;
    void (*run)(AzureSSOClient &client);
};

constexpr Exchange kExchanges[] = {
    {"Discovery", "sso",
     [](AzureSSOClient &client) {
         Json::Value out;
         client.RequestWellknownInfo(out);
     }},
    {"KeySet", "azuresso",
     [](AzureSSOClient &client) {
         Json::Value keys;
         client.RequestKeysInfo("", keys);
     }},
    {"TokenRequest", "sso",
     [](AzureSSOClient &client) {
         std::string response;
         client.RequestTokenEndpoint(response, "");
     }},
};

class FailingExchange : public testing::TestWithParam<Exchange> {
  protected:
    AzureSSOClient client;
};

TEST_P(FailingExchange, CatchesAndLogsInvalidArgument) {
    transfer = [](std::string &) { throw std::invalid_argument("the reason"); };
    GetParam().run(client);
    EXPECT_THAT(TakeSystemLogWithOwnTexts(),
                testing::ElementsAre(LogLine{LOG_ERR, std::string(GetParam().source) + ":N the reason"}));
}

TEST_P(FailingExchange, PropagatesOtherExceptionsUnlogged) {
    transfer = [](std::string &) { throw std::domain_error("the reason"); };
    EXPECT_THROW(GetParam().run(client), std::domain_error);
    transfer = [](std::string &) { throw std::runtime_error("the reason"); };
    EXPECT_THROW(GetParam().run(client), std::runtime_error);
    transfer = [](std::string &) { throw sso_op_failed("the reason"); };
    EXPECT_THROW(GetParam().run(client), sso_op_failed);
    EXPECT_THAT(TakeSystemLog(), testing::IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(, FailingExchange, testing::ValuesIn(kExchanges),
                         [](const auto &exchange) { return exchange.param.name; });

TEST(Interposition, ReplacesGetter) { EXPECT_EQ(GetAzureSSOLogoutURL(""), "logout"); }

}  // namespace
