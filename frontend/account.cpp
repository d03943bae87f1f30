// An example of a page for signed-in users. Other users sign in first and return to it.
#include <sso/sso.h>

#include "frontend/cgi_program.h"
#include "frontend/environment.h"
#include "frontend/page.h"
#include "frontend/session.h"
#include "web/text.h"

namespace Web = TAVO::Web;

namespace {

void GoAndSignIn(Web::Response &response) {
    const std::string origin = Web::SafeOrigin(Frontend::Variable("REQUEST_URI"));
    response.Redirect("/index.cgi?origin=" + TAVO::SSO::URLEncode(origin));
}

std::string Entry(const std::string &term, const std::string &text) {
    return text.empty() ? "" : "<dt>" + term + "</dt>\n<dd><bdi>" + Web::EscapeHtml(text) + "</bdi></dd>\n";
}

void ShowAccount(Web::Response &response) {
    const auto session = Frontend::FindSession(response, Frontend::Variable("HTTP_COOKIE"));
    if (!session) {
        GoAndSignIn(response);
        return;
    }
    const Frontend::Messages messages(Frontend::Variable("HTTP_ACCEPT_LANGUAGE"));
    Frontend::ShowPage(response, "200 OK", messages, "account.title",
                       "<dl>\n" + Entry(messages["account.name"], session->displayName) +
                           Entry(messages["account.user"], session->user) +
                           Entry(messages["account.profile"], session->profile) + "</dl>\n<p><a href=\"/index.cgi\">" +
                           messages["account.back"] + "</a></p>\n");
}

}  // namespace

int main() { return Frontend::Serve("GET, HEAD", ShowAccount); }
