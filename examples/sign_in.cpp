// sso.cgi: starts a login, and is the redirect URI that finishes it.
#include <syslog.h>
#include <tavosso/sso.h>
#include <tavosso/web.h>

#include <cstdlib>
#include <iostream>

namespace Web = TAVO::Web;

std::string Variable(const char *name) {
    const char *value = std::getenv(name);
    return value != nullptr ? value : "";
}

void Write(const Web::Response &response) {
    std::cout << "Status: " << response.status << "\n";
    for (const auto &[name, value] : response.headers) {
        std::cout << name << ": " << value << "\n";
    }
    std::cout << "\n" << response.body;
}

void Fail(Web::Response &response, const Web::FailedLogin &failed) {
    syslog(LOG_AUTH | LOG_WARNING, "sign-in failed (%s): %s", NameOf(failed.failure).c_str(), failed.reason.c_str());
    const std::string reason = TAVO::SSO::URLEncode(failed.reason);
    response.Redirect("/webman/" + TAVO::SSO::GetSSORelayURL(false, "", reason));
}

int main() {
    const Web::Request request{Variable("REQUEST_METHOD"), Variable("QUERY_STRING"), Variable("HTTP_COOKIE")};
    Web::FolderLoginStore logins("/usr/tavo/var/sso");
    if (!IsReturn(request)) {
        Web::StartedLogin started = StartLogin(request, logins);
        if (started.failure) {
            Fail(started.response, *started.failure);
        }
        Write(started.response);
        return 0;
    }
    Web::FinishedLogin finished = FinishLogin(request, logins);
    if (finished.user) {
        syslog(LOG_AUTH | LOG_INFO, "signed in: %s", finished.user->name.c_str());  // Open your session here.
        finished.response.Redirect("/webman/" + TAVO::SSO::GetSSORelayURL(true, finished.state, ""));
    } else {
        Fail(finished.response, *finished.failure);
    }
    Write(finished.response);
}
