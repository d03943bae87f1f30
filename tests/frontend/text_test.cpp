#include "web/text.h"

#include <gmock/gmock.h>

using namespace TAVO::Web;

namespace {

TEST(Line, ReplacesUnprintableCharacters) {
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

TEST(Html, EscapesMarkup) { EXPECT_EQ(EscapeHtml("<a b='\"&\">"), "&lt;a b=&#39;&quot;&amp;&quot;&gt;"); }

}  // namespace
