// The start page: who is signed in, or the way to sign in.
#include <sso/sso.h>

#include "frontend/cgi.h"
#include "frontend/profile.h"
#include "frontend/program.h"
#include "frontend/session.h"
#include "frontend/text.h"

namespace {

void ShowUser(Frontend::Answer &answer, const Frontend::Session &session) {
    answer.Page("200 OK", "Signed in",
                "<h1>Welcome</h1>\n<p>You are signed in as <strong>" + Frontend::EscapeHtml(session.user) +
                    "</strong>.</p>\n<p><a href=\"/account.cgi\">Your account</a></p>\n"
                    "<form method=\"post\" action=\"/webman/sso/logout.cgi\">\n"
                    "<button type=\"submit\">Sign out</button>\n</form>\n");
}

void ShowSignIn(Frontend::Answer &answer, const std::string &origin) {
    answer.Page("200 OK", "Sign in",
                "<h1>Sign in</h1>\n<p><a class=\"action\" href=\"/webman/sso/login.cgi?origin=" +
                    Frontend::EscapeHtml(TAVO::SSO::URLEncode(origin)) +
                    "\">Sign in with your organisation account</a></p>\n");
}

void ShowThatSignInIsUnavailable(Frontend::Answer &answer, const std::string &why) {
    answer.Page("200 OK", "Sign in", "<h1>Sign in</h1>\n<p>" + why + "</p>\n<p>Contact your administrator.</p>\n");
}

void ShowWayToSignIn(Frontend::Answer &answer) {
    const Frontend::Parameters parameters = Frontend::ParseQuery(Frontend::Variable("QUERY_STRING"));
    switch (Frontend::HowFarSetUp()) {
        case Frontend::SetUp::kComplete:
            ShowSignIn(answer, Frontend::SafeOrigin(Frontend::OnlyValue(parameters, "origin").value_or("")));
            break;
        case Frontend::SetUp::kIncomplete:
            ShowThatSignInIsUnavailable(answer, "Single sign-on is not completely set up on this device.");
            break;
        case Frontend::SetUp::kOff:
            ShowThatSignInIsUnavailable(answer, "Single sign-on is switched off on this device.");
            break;
    }
}

void ShowStartPage(Frontend::Answer &answer) {
    if (const auto session = Frontend::FindSession(answer, Frontend::Variable("HTTP_COOKIE"))) {
        ShowUser(answer, *session);
    } else {
        ShowWayToSignIn(answer);
    }
}

}  // namespace

int main() { return Frontend::Serve("GET, HEAD", ShowStartPage); }
