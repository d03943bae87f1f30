// The redirect URI: the browser is back from the provider, with a code or with an error.
#include <jwt/jwt.h>
#include <sso/sso.h>
#include <sso/supported_profiles.h>
#include <syslog.h>

#include "frontend/cgi_program.h"
#include "frontend/environment.h"
#include "frontend/session.h"
#include "web/azure_client.h"
#include "web/claims.h"
#include "web/nonce.h"
#include "web/pending_login.h"
#include "web/refusal.h"
#include "web/request.h"
#include "web/text.h"

namespace Web = TAVO::Web;

namespace {

std::string RequireOnly(const Web::Parameters &parameters, const char *name) {
    const std::optional<std::string> value = Web::OnlyValue(parameters, name);
    if (!value || value->empty()) {
        throw Web::Refusal(std::string("The provider's answer has no single ") + name + ".");
    }
    return *value;
}

void RefuseProviderError(const Web::Parameters &parameters) {
    if (parameters.count("error") != 0) {
        throw Web::Refusal(Web::ProviderError(Web::OnlyValue(parameters, "error").value_or(""),
                                              Web::OnlyValue(parameters, "error_description").value_or("")));
    }
}

// What `OIDCLogin` does, and then the checks of the claims that the library leaves to its callers.
Frontend::Session SignIn(const std::string &profile, const std::string &code, const Json::Value &state) {
    return TAVO::SSO::WithClient<Web::AzureClient>(profile, [&](TAVO::SSO::SSOClient &client) {
        std::string user;
        client.OpenIDConnectLogin(code, user);
        const Json::Value claims = TAVO::JWT::Jwt(client.GetToken()).GetBody();
        Web::RequireNonce(claims, state);
        Web::RequireTrustworthyName(claims, profile, Frontend::AcceptsUnverifiedEmail());
        if (user.empty() || !Web::IsPrintable(user)) {
            throw Web::Refusal("The provider's name for this user cannot be used.");
        }
        return Frontend::Session{user, Web::DisplayName(claims), profile};
    });
}

void CompleteLogin(Web::Response &response) {
    if (Frontend::IsHeadRequest()) {
        response.Redirect("/index.cgi");
        return;
    }
    const std::string cookies = Frontend::Variable("HTTP_COOKIE");
    const Web::Parameters parameters = Web::ParseQuery(Frontend::Variable("QUERY_STRING"));
    const std::string stateText = RequireOnly(parameters, "state");
    // Before anything of the answer is believed, and above all before the code is used.
    const Web::ConcludedLogin login = Web::ConcludeLogin(response, cookies, stateText);
    RefuseProviderError(parameters);
    const std::string code = RequireOnly(parameters, "code");
    const Frontend::Session session = SignIn(login.profile, code, login.state);
    Frontend::StartSession(response, cookies, session);
    syslog(LOG_AUTH | LOG_INFO, "frontend: signed in: %s", Web::OneLine(session.user).c_str());
    response.Redirect("/webman/" + TAVO::SSO::GetSSORelayURL(true, stateText, ""));
}

}  // namespace

int main() { return Frontend::Serve("GET, HEAD", CompleteLogin); }
