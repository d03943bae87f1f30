// The start page: who is signed in, or the way to sign in.
#include <sso/sso.h>

#include "frontend/cgi.h"
#include "frontend/failure.h"
#include "frontend/session.h"
#include "frontend/text.h"

namespace {

bool SignInIsPossible() {
    TAVO::SSO::SSOProfile profile;
    const std::string name = profile.GetSSOProfile();
    return profile.SSOIsEnable() && (name == "azure" || name == "websphere") &&
           !profile.GetSSOClient()->GetAuthEndpoint().empty();
}

void ShowUser(Frontend::Answer &answer, const std::string &user) {
    answer.Page("200 OK", "Signed in",
                "<h1>Signed in</h1>\n<p>You are signed in as <strong>" + Frontend::EscapeHtml(user) +
                    "</strong>.</p>\n<form method=\"post\" action=\"/webman/sso/logout.cgi\">\n"
                    "<button type=\"submit\">Sign out</button>\n</form>\n");
}

void ShowSignIn(Frontend::Answer &answer) {
    answer.Page("200 OK", "Sign in",
                "<h1>Sign in</h1>\n<p><a class=\"action\" href=\"/webman/sso/login.cgi?origin=%2Findex.cgi\">"
                "Sign in with single sign-on</a></p>\n");
}

void ShowThatSignInIsOff(Frontend::Answer &answer) {
    answer.Page("200 OK", "Sign in", "<h1>Sign in</h1>\n<p>Single sign-on is not set up on this device.</p>\n");
}

void ShowStartPage(Frontend::Answer &answer) {
    if (const auto session = Frontend::FindSession(Frontend::Variable("HTTP_COOKIE"))) {
        ShowUser(answer, session->user);
    } else if (SignInIsPossible()) {
        ShowSignIn(answer);
    } else {
        ShowThatSignInIsOff(answer);
    }
}

}  // namespace

int main() { return Frontend::Serve(ShowStartPage); }
