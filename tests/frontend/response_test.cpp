#include <gmock/gmock.h>

#include <stdexcept>

#include "frontend/page.h"
#include "tests/frontend/set_cookie.h"
#include "web/web.h"

using namespace Frontend;
using namespace TAVO::Web;
using testing::Contains;
using testing::HasSubstr;
using testing::Not;
using testing::Pair;

namespace {

void ExpectProtection(const Response &response) {
    EXPECT_THAT(response.headers, Contains(Pair("Cache-Control", "no-store")));
    EXPECT_THAT(response.headers, Contains(Pair("Referrer-Policy", "same-origin")));
    EXPECT_THAT(response.headers, Contains(Pair("X-Content-Type-Options", "nosniff")));
    EXPECT_THAT(response.headers,
                Contains(Pair("Content-Security-Policy",
                              AllOf(testing::StartsWith("default-src 'none'; "), HasSubstr("; frame-ancestors 'none'"),
                                    Not(HasSubstr("unsafe-inline"))))));
}

TEST(Response, ProtectsPagesAndRedirects) {
    Response page;
    Frontend::ShowPage(page, "200 OK", Messages("en"), "start.title", "<p>Content</p>\n");
    ExpectProtection(page);
    Response redirect;
    redirect.Redirect("/index.cgi");
    ExpectProtection(redirect);
}

TEST(Response, KeepsOtherHeadersInRedirect) {
    Response response;
    response.SetCookie("__Host-a", "b");
    response.Redirect("/index.cgi");
    EXPECT_EQ(response.status, "302 Found");
    EXPECT_EQ(LastSetCookie(response), "__Host-a=b; Path=/; Secure; HttpOnly; SameSite=Lax");
    EXPECT_THAT(response.headers.back(), Pair("Location", "/index.cgi"));
    EXPECT_EQ(response.body, "");
}

TEST(Response, RejectsLineBreaksInHeaders) {
    Response response;
    for (const char *address : {"/a\nSet-Cookie: b=c", "/a\rSet-Cookie: b=c", "/a\r\n\r\n<script>"}) {
        EXPECT_THROW(response.Redirect(address), std::invalid_argument);
        EXPECT_THROW(response.SetCookie("name", address), std::invalid_argument);
        EXPECT_THROW(response.AddHeader("Refresh", address), std::invalid_argument);
    }
}

TEST(Response, RejectsSeparatorsInNamesAndCookies) {
    Response response;
    EXPECT_THROW(response.AddHeader("A: b\nC", "d"), std::invalid_argument);
    EXPECT_THROW(response.AddHeader("", "d"), std::invalid_argument);
    EXPECT_THROW(response.SetCookie("__Host-a", "b; Domain=example.com"), std::invalid_argument);
    EXPECT_THROW(response.SetCookie("__Host-a=b;", "c"), std::invalid_argument);
}

TEST(Response, RedirectsToLastAddress) {
    Response response;
    response.Redirect("/first");
    response.Redirect("/last");
    EXPECT_THAT(response.headers, Contains(Pair("Location", "/last")));
    EXPECT_THAT(response.headers, Not(Contains(Pair("Location", "/first"))));
}

}  // namespace
