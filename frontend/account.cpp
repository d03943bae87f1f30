// A page for users who are signed in, and an example of one: whoever is not signs in first and comes back to it.
#include <sso/sso.h>

#include "frontend/cgi.h"
#include "frontend/program.h"
#include "frontend/session.h"
#include "frontend/text.h"

namespace {

void GoAndSignIn(Frontend::Answer &answer) {
    const std::string origin = Frontend::SafeOrigin(Frontend::Variable("REQUEST_URI"));
    answer.Redirect("/index.cgi?origin=" + TAVO::SSO::URLEncode(origin));
}

std::string Entry(const std::string &term, const std::string &text) {
    return text.empty() ? "" : "<dt>" + term + "</dt>\n<dd>" + Frontend::EscapeHtml(text) + "</dd>\n";
}

void ShowAccount(Frontend::Answer &answer) {
    const auto session = Frontend::FindSession(answer, Frontend::Variable("HTTP_COOKIE"));
    if (!session) {
        GoAndSignIn(answer);
        return;
    }
    answer.Page("200 OK", "Your account",
                "<h1>Your account</h1>\n<dl>\n" + Entry("Name", session->displayName) +
                    Entry("Name on this device", session->user) + Entry("Signed in through", session->profile) +
                    "</dl>\n<p><a href=\"/index.cgi\">Back to the start page</a></p>\n");
}

}  // namespace

int main() { return Frontend::Serve("GET, HEAD", ShowAccount); }
