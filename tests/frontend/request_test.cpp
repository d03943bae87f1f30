#include "web/request.h"

#include <gmock/gmock.h>

#include "web/text.h"

using namespace TAVO::Web;

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

TEST(Line, IsPrintable) {
    const std::string bidirectional = "a\u202eb\u2066c\u200fd";
    EXPECT_EQ(OneLine(bidirectional), "a b c d");
    EXPECT_EQ(OneLine("a\u0085b\u009bc\u2028d\u2029e\ufefff\u200bg"), "a b c d e f g");
    EXPECT_EQ(OneLine("a\xff"
                      "b\xc3"),
              "a\ufffd"
              "b\ufffd");
    EXPECT_EQ(OneLine("zoë \u05d0 \U0001f600"), "zoë \u05d0 \U0001f600");
    EXPECT_TRUE(IsPrintable("zoë \u05d0 \U0001f600"));
    for (const char *text :
         {"\n", "\x7f", "\u0085", "\u061c", "\u200e", "\u202a", "\u2069", "\ufeff", "\xff", "\xc3"}) {
        EXPECT_FALSE(IsPrintable(text)) << text;
    }
}

TEST(Html, ShowsEveryCharacterAsText) { EXPECT_EQ(EscapeHtml("<a b='\"&\">"), "&lt;a b=&#39;&quot;&amp;&quot;&gt;"); }

}  // namespace
