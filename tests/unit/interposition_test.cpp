// This program puts exported functions of its own in front of the library's: the library's calls to each other must
// find them, whatever compiler built it and however it optimised.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "sso/sso.h"

namespace TAVO::SSO {

std::string URLEncode(const std::string &value) { return "<" + value + ">"; }

std::string MD5Digest(std::string /*data*/) { return "digest"; }

void httpGet(const std::string & /*url*/, std::string &response, bool /*verifySSL*/,
             std::size_t (* /*writeCallback*/)(char *, std::size_t, std::size_t, void *)) {
    response = R"({"from": "httpGet"})";
}

void httpPost(const std::string & /*url*/, const std::string & /*body*/, std::string &response, bool /*verifySSL*/,
              std::size_t (* /*writeCallback*/)(char *, std::size_t, std::size_t, void *)) {
    response = R"({"id_token": "from httpPost"})";
}

std::string SSOClient::GetLogoutEndpoint() { return "logout"; }

}  // namespace TAVO::SSO

namespace {

using namespace TAVO::SSO;

TEST(Interposition, URLEncodeIsFoundByTheFunctionsThatUseIt) {
    EXPECT_EQ(WebSphereSSOClient().GetIDTokenReqParams(),
              "client_id=<>&client_secret=<>&code=<>&grant_type=<authorization_code>&redirect_uri=<>");
}

TEST(Interposition, MD5DigestIsFoundByTheAuthorizationRequest) {
    // {"nonce":"digest"} and a line feed
    EXPECT_THAT(AzureSSOClient().GetAccessTokenReqURI(Json::Value()),
                testing::HasSubstr("state=<eyJub25jZSI6ImRpZ2VzdCJ9Cg==>"));
}

TEST(Interposition, HttpGetIsFoundByDiscoveryAndKeySet) {
    AzureSSOClient client;
    Json::Value wellknown;
    client.RequestWellknownInfo(wellknown);
    EXPECT_EQ(wellknown["from"], "httpGet");
}

TEST(Interposition, HttpPostIsFoundByTheTokenRequest) {
    AzureSSOClient client;
    std::string response;
    client.RequestTokenEndpoint(response, "");
    client.ProcessTokenResponse(response);
    EXPECT_EQ(client.GetToken(), "from httpPost");
}

TEST(Interposition, AGetterIsFoundByTheLogoutURL) { EXPECT_EQ(GetAzureSSOLogoutURL(""), "logout"); }

}  // namespace
