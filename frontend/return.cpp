// The redirect URI: the browser is back from the provider, with a code or with an error.
#include <jwt/jwt.h>
#include <sso/sso.h>
#include <sso/supported_profiles.h>
#include <syslog.h>

#include "frontend/azure_client.h"
#include "frontend/cgi.h"
#include "frontend/failure.h"
#include "frontend/id_token.h"
#include "frontend/pending_login.h"
#include "frontend/profile.h"
#include "frontend/program.h"
#include "frontend/session.h"
#include "frontend/text.h"

namespace {

std::string RequireOnly(const Frontend::Parameters &parameters, const char *name) {
    const std::optional<std::string> value = Frontend::OnlyValue(parameters, name);
    if (!value || value->empty()) {
        throw Frontend::Refusal(std::string("The provider's answer has no single ") + name + ".");
    }
    return *value;
}

void RefuseProviderError(const Frontend::Parameters &parameters) {
    if (parameters.count("error") != 0) {
        throw Frontend::Refusal(
            Frontend::ProviderError(Frontend::OnlyValue(parameters, "error").value_or(""),
                                    Frontend::OnlyValue(parameters, "error_description").value_or("")));
    }
}

// What `OIDCLogin` does, and then the checks of the claims that the library leaves to its callers.
Frontend::Session SignIn(const std::string &profile, const std::string &code, const Json::Value &state) {
    return TAVO::SSO::WithClient<Frontend::AzureClient>(profile, [&](TAVO::SSO::SSOClient &client) {
        std::string user;
        client.OpenIDConnectLogin(code, user);
        const Json::Value claims = TAVO::JWT::Jwt(client.GetToken()).GetBody();
        Frontend::RequireNonce(claims, state);
        Frontend::RequireTrustworthyName(claims, profile);
        if (user.empty() || !Frontend::IsPrintable(user)) {
            throw Frontend::Refusal("The provider's name for this user cannot be used.");
        }
        return Frontend::Session{user, Frontend::DisplayName(claims), profile};
    });
}

void CompleteLogin(Frontend::Answer &answer) {
    if (Frontend::IsHeadRequest()) {
        answer.Redirect("/index.cgi");
        return;
    }
    const std::string cookies = Frontend::Variable("HTTP_COOKIE");
    const Frontend::Parameters parameters = Frontend::ParseQuery(Frontend::Variable("QUERY_STRING"));
    const std::string stateText = RequireOnly(parameters, "state");
    // Before anything of the answer is believed, and above all before the code is used.
    const Frontend::ConcludedLogin login = Frontend::ConcludeLogin(answer, cookies, stateText);
    RefuseProviderError(parameters);
    const std::string code = RequireOnly(parameters, "code");
    const Frontend::Session session = SignIn(login.profile, code, login.state);
    Frontend::StartSession(answer, cookies, session);
    syslog(LOG_AUTH | LOG_INFO, "frontend: signed in: %s", Frontend::OneLine(session.user).c_str());
    answer.Redirect("/webman/" + TAVO::SSO::GetSSORelayURL(true, stateText, ""));
}

}  // namespace

int main() { return Frontend::Serve("GET, HEAD", CompleteLogin); }
