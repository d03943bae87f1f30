#include <gmock/gmock.h>
#include <sso/sso.h>

#include "frontend/cgi.h"
#include "frontend/text.h"

using namespace Frontend;

namespace {

TEST(Query, IsPercentDecodedAndCountsAParameterOnlyWhenItIsThereOnce) {
    const Parameters parameters = ParseQuery("a=%2Fx+y%3d&b&c=1&c=2&&d=%zz%4");
    EXPECT_EQ(OnlyValue(parameters, "a"), "/x y=");
    EXPECT_EQ(OnlyValue(parameters, "b"), "");
    EXPECT_EQ(OnlyValue(parameters, "c"), std::nullopt);
    EXPECT_EQ(OnlyValue(parameters, "d"), "%zz%4");
    EXPECT_EQ(OnlyValue(parameters, "e"), std::nullopt);
}

TEST(Cookie, IsFoundByItsWholeNameAndOnlyWhenItIsThereOnce) {
    const std::string header = "other=1; __Host-session=abc=; x__Host-session=2; twice=1; twice=2";
    EXPECT_EQ(FindCookie(header, "__Host-session"), "abc=");
    EXPECT_EQ(FindCookie(header, "twice"), std::nullopt);
    EXPECT_EQ(FindCookie("", "__Host-session"), std::nullopt);
}

TEST(Origin, IsKeptWhereItIsAPathOnThisSite) {
    for (const char *path : {"/", "/index.cgi", "/files/a?b=c&d=%22#e", "/a//b", "/:x@y"}) {
        EXPECT_EQ(SafeOrigin(path), path);
    }
}

TEST(Origin, IsTheStartPageWhereABrowserCouldLeaveThisSite) {
    for (const char *elsewhere :
         {"", "index.cgi", "//evil.example", "///evil.example", "/\\evil.example", "\\\\evil.example", "/a\\b",
          "https://evil.example", "https:evil.example", "javascript:alert(1)", "/\t/evil.example", "/\n/evil.example",
          "\t//evil.example", " //evil.example", "/ /x", "/a\x7f", "/\xc3\xa4", "/a\"b"}) {
        EXPECT_EQ(SafeOrigin(elsewhere), "/index.cgi") << elsewhere;
    }
    EXPECT_EQ(SafeOrigin(std::string("/a\0b", 4)), "/index.cgi");
}

TEST(Origin, FitsIntoTheStateHoweverLongItIs) {
    const std::string longest = "/" + std::string(511, 'a');
    EXPECT_EQ(SafeOrigin(longest), longest);
    EXPECT_EQ(SafeOrigin(longest + "a"), "/index.cgi");
    Json::Value state;
    state["origin"] = longest;
    state["csrf"] = std::string(32, 'f');
    EXPECT_NO_THROW(TAVO::SSO::AzureSSOClient().GetAccessTokenReqURI(state));
}

TEST(Html, ShowsEveryCharacterAsText) { EXPECT_EQ(EscapeHtml("<a b='\"&\">"), "&lt;a b=&#39;&quot;&amp;&quot;&gt;"); }

}  // namespace
