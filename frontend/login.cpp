// Starts a login: sends the browser to the provider.
#include <sso/supported_profiles.h>

#include "frontend/cgi_program.h"
#include "frontend/environment.h"
#include "web/configured_profile.h"
#include "web/pending_login.h"
#include "web/refusal.h"
#include "web/request.h"
#include "web/text.h"

namespace Web = TAVO::Web;

namespace {

void GoToProvider(Web::Response &response) {
    if (Frontend::IsHeadRequest()) {
        response.Redirect("/index.cgi");
        return;
    }
    const Web::Parameters parameters = Web::ParseQuery(Frontend::Variable("QUERY_STRING"));
    response.origin = Web::SafeOrigin(Web::OnlyValue(parameters, "origin").value_or(""));
    const std::string profile = Web::ProfileInForce();
    if (Web::HowFarSetUp() != Web::SetUp::kComplete) {
        throw Web::Refusal("Single sign-on is not completely set up on this device.");
    }
    // Not `RedirectAuthEndpoint`, which writes the URL at once: its state must be remembered first.
    const auto makeAddress = [&](const Json::Value &state) {
        return TAVO::SSO::WithClient(profile, [&](auto &client) { return client.GetAccessTokenReqURI(state); });
    };
    response.Redirect(Web::StartLogin(response, Frontend::Variable("HTTP_COOKIE"), profile,
                                      Frontend::MostPendingLogins(), makeAddress));
}

}  // namespace

int main() { return Frontend::Serve("GET, HEAD", GoToProvider); }
