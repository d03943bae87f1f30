#include "frontend/answer.h"

#include <gmock/gmock.h>

#include <stdexcept>

using namespace Frontend;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

namespace {

/// What `write` writes to standard output.
template <typename Write>
std::string Output(Write write) {
    testing::internal::CaptureStdout();
    Answer answer;
    write(answer);
    return testing::internal::GetCapturedStdout();
}

void ExpectProtection(const std::string &output) {
    const std::string head = output.substr(0, output.find("\n\n") + 1);
    EXPECT_THAT(head, HasSubstr("Cache-Control: no-store\n"));
    EXPECT_THAT(head, HasSubstr("Referrer-Policy: same-origin\n"));
    EXPECT_THAT(head, HasSubstr("X-Content-Type-Options: nosniff\n"));
    EXPECT_THAT(head, HasSubstr("Content-Security-Policy: default-src 'none'; "));
    EXPECT_THAT(head, HasSubstr("; frame-ancestors 'none'\n"));
    EXPECT_THAT(head, Not(HasSubstr("unsafe-inline")));
}

TEST(Answer, ProtectsAPageAndARedirectAlike) {
    ExpectProtection(Output([](Answer &answer) { answer.Page("200 OK", "Title", "<p>Content</p>\n"); }));
    ExpectProtection(Output([](Answer &answer) { answer.Redirect("/index.cgi"); }));
}

TEST(Answer, TellsWhereARedirectGoesAfterItsOtherHeaders) {
    const std::string output = Output([](Answer &answer) {
        answer.SetCookie("__Host-a", "b");
        answer.Redirect("/index.cgi");
    });
    EXPECT_THAT(output, StartsWith("Status: 302 Found\n"));
    EXPECT_THAT(output, HasSubstr("Set-Cookie: __Host-a=b; Path=/; Secure; HttpOnly; SameSite=Lax\n"));
    EXPECT_THAT(output, testing::EndsWith("Location: /index.cgi\n\n"));
}

TEST(Answer, RefusesAHeaderThatWouldBecomeTwo) {
    Answer answer;
    for (const char *address : {"/a\nSet-Cookie: b=c", "/a\rSet-Cookie: b=c", "/a\r\n\r\n<script>"}) {
        EXPECT_THROW(answer.Redirect(address), std::invalid_argument);
        EXPECT_THROW(answer.SetCookie("name", address), std::invalid_argument);
        EXPECT_THROW(answer.AddHeader("Refresh", address), std::invalid_argument);
    }
}

TEST(Answer, ShowsATitleAsText) {
    const std::string output = Output([](Answer &answer) { answer.Page("200 OK", "</title><script>", ""); });
    EXPECT_THAT(output, HasSubstr("<title>&lt;/title&gt;&lt;script&gt;</title>"));
}

}  // namespace
