// Starts a login and redirects the browser to the provider.
#include "frontend/cgi_program.h"
#include "frontend/environment.h"
#include "frontend/folders.h"
#include "web/web.h"

namespace Web = TAVO::Web;

namespace {

void GoToProvider(Web::Response &response) {
    if (Frontend::IsHeadRequest()) {
        response.Redirect("/index.cgi");
        return;
    }
    Web::FolderLoginStore logins = Frontend::OpenLogins();
    const Web::StartedLogin started = StartLogin(Frontend::ReceivedRequest(), logins);
    response = started.response;
    if (started.failure) {
        Frontend::Fail(response, started.failure->reason, started.origin);
    }
}

}  // namespace

int main() { return Frontend::Serve("GET, HEAD", GoToProvider); }
