#include "frontend/language.h"

#include <gmock/gmock.h>

#include "frontend/messages.h"
#include "frontend/page.h"

using namespace Frontend;
using testing::Contains;
using testing::HasSubstr;
using testing::Pair;
using testing::StartsWith;

namespace {

TEST(Language, IsThePreferredOneWithCatalogue) {
    const std::pair<const char *, const char *> languages[] = {
        {"de", "de"},
        {"fr-CH, fr;q=0.9, en;q=0.8", "fr"},
        {"en;q=0.5, ja;q=0.7, es;q=0.6", "ja"},
        {"nl, it;q=0.9, es;q=0.1", "es"},
        {"zh-Hans-CN,zh;q=0.9", "zh"},
        {"DE-AT ; Q=0.4 , en ;q=0.3", "de"},
        {"de;q=0, en;q=0.1", "en"},
        {"de, fr", "de"},
    };
    for (const auto &[header, language] : languages) {
        EXPECT_EQ(PreferredLanguage(header), language) << header;
    }
}

TEST(Language, IsEnglishForUnusableHeader) {
    for (const char *header : {"", "*", "nl", ",", ";", "de;q=", "de;q=nan", "de;q=inf", "de;q=2", "de;q=-1", "de;r=1",
                               "../../de", "\xff\xfe"}) {
        EXPECT_EQ(PreferredLanguage(header), "en") << header;
    }
}

TEST(Messages, AreTextsOfPreferredLanguage) {
    EXPECT_EQ(Messages("de")["start.title"], "Anmelden");
    EXPECT_EQ(Messages("nl")["start.title"], "Sign in");
}

TEST(Messages, AreHTML) { EXPECT_THAT(Messages("en")["reason.not_reached"], HasSubstr("organisation&#39;s")); }

TEST(Page, StatesItsLanguage) {
    TAVO::Web::Response response;
    ShowPage(response, "200 OK", Messages("zh-CN"), "start.title", "<p>Content</p>\n");
    EXPECT_THAT(response.body, StartsWith("<!DOCTYPE html>\n<html lang=\"zh-Hans\" dir=\"ltr\">\n"));
    EXPECT_THAT(response.body, HasSubstr("<h1>登录</h1>\n<p>Content</p>"));
    EXPECT_THAT(response.headers, Contains(Pair("Content-Type", "text/html; charset=utf-8")));
    EXPECT_THAT(response.headers, Contains(Pair("Content-Language", "zh-Hans")));
    EXPECT_THAT(response.headers, Contains(Pair("Vary", "Accept-Language")));
}

}  // namespace
