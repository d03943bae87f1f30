// The start page: shows the signed-in user, or a link to sign in.
#include <sso/sso.h>

#include <boost/algorithm/string/replace.hpp>

#include "frontend/cgi_program.h"
#include "frontend/environment.h"
#include "frontend/page.h"
#include "frontend/session.h"
#include "web/configured_profile.h"
#include "web/request.h"
#include "web/text.h"

namespace Web = TAVO::Web;
using Frontend::Messages;

namespace {

void ShowUser(Web::Response &response, const Messages &messages, const Frontend::Session &session) {
    const std::string user = "<strong><bdi>" + Web::EscapeHtml(session.user) + "</bdi></strong>";
    Frontend::ShowPage(response, "200 OK", messages, "signed_in.title",
                       "<p>" + boost::replace_first_copy(messages["signed_in.user"], "{user}", user) +
                           "</p>\n<p><a href=\"/account.cgi\">" + messages["signed_in.account"] +
                           "</a></p>\n<form method=\"post\" action=\"/webman/sso/logout.cgi\">\n"
                           "<button type=\"submit\">" +
                           messages["signed_in.sign_out"] + "</button>\n</form>\n");
}

void ShowSignIn(Web::Response &response, const Messages &messages, const std::string &origin) {
    Frontend::ShowPage(response, "200 OK", messages, "start.title",
                       R"(<p><a class="action" href="/webman/sso/login.cgi?origin=)" +
                           Web::EscapeHtml(TAVO::SSO::URLEncode(origin)) + "\">" + messages["start.action"] +
                           "</a></p>\n");
}

void ShowThatSignInIsUnavailable(Web::Response &response, const Messages &messages, const char *why) {
    Frontend::ShowPage(response, "200 OK", messages, "start.title",
                       "<p>" + messages[why] + "</p>\n<p>" + messages["start.ask"] + "</p>\n");
}

void ShowWayToSignIn(Web::Response &response, const Messages &messages) {
    const Web::Parameters parameters = Web::ParseQuery(Frontend::Variable("QUERY_STRING"));
    switch (Web::HowFarSetUp()) {
        case Web::SetUp::kComplete:
            ShowSignIn(response, messages, Web::SafeOrigin(Web::OnlyValue(parameters, "origin").value_or("")));
            break;
        case Web::SetUp::kIncomplete:
            ShowThatSignInIsUnavailable(response, messages, "start.not_set_up");
            break;
        case Web::SetUp::kOff:
            ShowThatSignInIsUnavailable(response, messages, "start.switched_off");
            break;
    }
}

void ShowStartPage(Web::Response &response) {
    const Messages messages(Frontend::Variable("HTTP_ACCEPT_LANGUAGE"));
    if (const auto session = Frontend::FindSession(response, Frontend::Variable("HTTP_COOKIE"))) {
        ShowUser(response, messages, *session);
    } else {
        ShowWayToSignIn(response, messages);
    }
}

}  // namespace

int main() { return Frontend::Serve("GET, HEAD", ShowStartPage); }
