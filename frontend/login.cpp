// Starts a login: sends the browser to the provider.
#include <sso/sso.h>

#include "frontend/cgi.h"
#include "frontend/failure.h"
#include "frontend/pending_login.h"

namespace {

template <typename Client>
void GoToProvider(Frontend::Answer &answer, Client &client) {
    const Frontend::Parameters parameters = Frontend::ParseQuery(Frontend::Variable("QUERY_STRING"));
    const std::string origin = Frontend::OnlyValue(parameters, "origin").value_or("");
    const Json::Value state = Frontend::StartLogin(answer, origin);
    // The library ends the head of the answer: whatever else belongs in it comes first.
    answer.BeginRedirect();
    client.RedirectAuthEndpoint(state);
}

void StartLogin(Frontend::Answer &answer) {
    TAVO::SSO::SSOProfile profile;
    const std::string name = profile.GetSSOProfile();
    if (!profile.SSOIsEnable() || profile.GetSSOClient()->GetAuthEndpoint().empty()) {
        throw Frontend::Refusal("Single sign-on is not set up on this device.");
    }
    if (name == "azure") {
        TAVO::SSO::AzureSSOClient client;
        GoToProvider(answer, client);
    } else {
        TAVO::SSO::WebSphereSSOClient client;
        GoToProvider(answer, client);
    }
}

}  // namespace

int main() { return Frontend::Serve(StartLogin); }
