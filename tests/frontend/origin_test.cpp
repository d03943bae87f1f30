#include <gmock/gmock.h>
#include <sso/sso.h>

#include <fstream>
#include <sstream>

#include "web/request.h"
#include "web/text.h"

using namespace TAVO::Web;

namespace {

/// The test of the relay page's script uses the same texts.
Json::Value Origins(const char *kind) {
    std::ifstream file(TAVOSSO_TEST_ORIGINS);
    std::ostringstream text;
    text << file.rdbuf();
    return ParseObject(text.str())[kind];
}

std::string OriginInQuery(const std::string &encoded) {
    return SafeOrigin(OnlyValue(ParseQuery("origin=" + encoded), "origin").value_or(""));
}

TEST(Origin, ReplacesForeignOriginWithStartPage) {
    const Json::Value foreign = Origins("foreign");
    ASSERT_GE(foreign.size(), 200U);
    for (const Json::Value &origin : foreign) {
        EXPECT_EQ(SafeOrigin(origin.asString()), "/index.cgi") << origin;
    }
}

TEST(Origin, StaysLocalAfterDecodingQuery) {
    for (const Json::Value &origin : Origins("foreign")) {
        // Decoding twice makes some of them harmless paths, and none a host.
        EXPECT_THAT(OriginInQuery(origin.asString()), testing::MatchesRegex("/|/[^/\\].*")) << origin;
    }
    for (const char *encoded :
         {"%2F%2Fevil.example", "%2f%5cevil.example", "%2f%09%2fevil.example", "/%0a/evil.example"}) {
        EXPECT_EQ(OriginInQuery(encoded), "/index.cgi") << encoded;
    }
}

TEST(Origin, KeepsLocalPath) {
    const Json::Value own = Origins("own");
    ASSERT_GE(own.size(), 10U);
    for (const Json::Value &origin : own) {
        EXPECT_EQ(SafeOrigin(origin.asString()), origin.asString());
    }
}

TEST(Origin, FitsIntoStateAtMaximumLength) {
    Json::Value state;
    state["origin"] = SafeOrigin("/" + std::string(511, 'a'));
    ASSERT_EQ(state["origin"].asString().size(), 512U);
    state["csrf"] = std::string(32, 'f');
    EXPECT_NO_THROW(TAVO::SSO::AzureSSOClient().GetAccessTokenReqURI(state));
}

}  // namespace
