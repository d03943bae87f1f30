// Starts a login: sends the browser to the provider.
#include "frontend/cgi_program.h"
#include "frontend/environment.h"
#include "frontend/folders.h"
#include "web/request.h"
#include "web/text.h"

namespace Web = TAVO::Web;

namespace {

void GoToProvider(Web::Response &response) {
    if (Frontend::IsHeadRequest()) {
        response.Redirect("/index.cgi");
        return;
    }
    const Web::Request request = Frontend::ReceivedRequest();
    const std::string origin = Web::OnlyValue(Web::ParseQuery(request.query), "origin").value_or("");
    Web::FolderLoginStore logins = Frontend::OpenLogins();
    const Web::StartedLogin started = StartLogin(request, logins, origin);
    response = started.response;
    if (started.failure) {
        Frontend::Fail(response, started.failure->reason, Web::SafeOrigin(origin));
    }
}

}  // namespace

int main() { return Frontend::Serve("GET, HEAD", GoToProvider); }
