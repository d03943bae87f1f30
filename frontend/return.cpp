// The redirect URI: finishes a login.
#include <sso/sso.h>
#include <syslog.h>

#include "frontend/cgi_program.h"
#include "frontend/environment.h"
#include "frontend/folders.h"
#include "frontend/session.h"
#include "web/text.h"

namespace Web = TAVO::Web;

namespace {

void CompleteLogin(Web::Response &response) {
    if (Frontend::IsHeadRequest()) {
        response.Redirect("/index.cgi");
        return;
    }
    const Web::Request request = Frontend::ReceivedRequest();
    Web::FolderLoginStore logins = Frontend::OpenLogins();
    const Web::FinishedLogin finished = FinishLogin(request, logins, {Frontend::AcceptsUnverifiedEmail()});
    response = finished.response;
    if (!finished.user) {
        Frontend::Fail(response, finished.failure->reason, finished.origin);
        return;
    }
    Frontend::StartSession(response, request.cookies,
                           {finished.user->name, finished.user->displayName, finished.user->profile});
    syslog(LOG_AUTH | LOG_INFO, "frontend: signed in: %s", Web::OneLine(finished.user->name).c_str());
    response.Redirect("/webman/" + TAVO::SSO::GetSSORelayURL(true, finished.state, ""));
}

}  // namespace

int main() { return Frontend::Serve("GET, HEAD", CompleteLogin); }
