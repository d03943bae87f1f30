// The start page: shows the signed-in user, or a link to sign in.
#include <sso/sso.h>

#include "frontend/cgi_program.h"
#include "frontend/environment.h"
#include "frontend/page.h"
#include "frontend/session.h"
#include "web/configured_profile.h"
#include "web/request.h"
#include "web/text.h"

namespace Web = TAVO::Web;

namespace {

void ShowUser(Web::Response &response, const Frontend::Session &session) {
    Frontend::ShowPage(response, "200 OK", "Signed in",
                       "<h1>Welcome</h1>\n<p>You are signed in as <strong>" + Web::EscapeHtml(session.user) +
                           "</strong>.</p>\n<p><a href=\"/account.cgi\">Your account</a></p>\n"
                           "<form method=\"post\" action=\"/webman/sso/logout.cgi\">\n"
                           "<button type=\"submit\">Sign out</button>\n</form>\n");
}

void ShowSignIn(Web::Response &response, const std::string &origin) {
    Frontend::ShowPage(response, "200 OK", "Sign in",
                       "<h1>Sign in</h1>\n<p><a class=\"action\" href=\"/webman/sso/login.cgi?origin=" +
                           Web::EscapeHtml(TAVO::SSO::URLEncode(origin)) +
                           "\">Sign in with your organisation account</a></p>\n");
}

void ShowThatSignInIsUnavailable(Web::Response &response, const std::string &why) {
    Frontend::ShowPage(response, "200 OK", "Sign in",
                       "<h1>Sign in</h1>\n<p>" + why + "</p>\n<p>Contact your administrator.</p>\n");
}

void ShowWayToSignIn(Web::Response &response) {
    const Web::Parameters parameters = Web::ParseQuery(Frontend::Variable("QUERY_STRING"));
    switch (Web::HowFarSetUp()) {
        case Web::SetUp::kComplete:
            ShowSignIn(response, Web::SafeOrigin(Web::OnlyValue(parameters, "origin").value_or("")));
            break;
        case Web::SetUp::kIncomplete:
            ShowThatSignInIsUnavailable(response, "Single sign-on is not completely set up on this device.");
            break;
        case Web::SetUp::kOff:
            ShowThatSignInIsUnavailable(response, "Single sign-on is switched off on this device.");
            break;
    }
}

void ShowStartPage(Web::Response &response) {
    if (const auto session = Frontend::FindSession(response, Frontend::Variable("HTTP_COOKIE"))) {
        ShowUser(response, *session);
    } else {
        ShowWayToSignIn(response);
    }
}

}  // namespace

int main() { return Frontend::Serve("GET, HEAD", ShowStartPage); }
