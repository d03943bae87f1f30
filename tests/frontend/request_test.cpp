#include <gmock/gmock.h>

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

TEST(Html, ShowsEveryCharacterAsText) { EXPECT_EQ(EscapeHtml("<a b='\"&\">"), "&lt;a b=&#39;&quot;&amp;&quot;&gt;"); }

}  // namespace
