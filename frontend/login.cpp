// Starts a login: sends the browser to the provider.
#include <sso/supported_profiles.h>

#include "frontend/cgi.h"
#include "frontend/failure.h"
#include "frontend/pending_login.h"
#include "frontend/profile.h"
#include "frontend/program.h"
#include "frontend/text.h"

namespace {

void GoToProvider(Frontend::Answer &answer) {
    if (Frontend::IsHeadRequest()) {
        answer.Redirect("/index.cgi");
        return;
    }
    const Frontend::Parameters parameters = Frontend::ParseQuery(Frontend::Variable("QUERY_STRING"));
    answer.origin = Frontend::SafeOrigin(Frontend::OnlyValue(parameters, "origin").value_or(""));
    const std::string profile = Frontend::ProfileInForce();
    if (Frontend::HowFarSetUp() != Frontend::SetUp::kComplete) {
        throw Frontend::Refusal("Single sign-on is not completely set up on this device.");
    }
    // Not `RedirectAuthEndpoint`, which writes the URL at once: its state must be remembered first.
    const auto makeAddress = [&](const Json::Value &state) {
        return TAVO::SSO::WithClient(profile, [&](auto &client) { return client.GetAccessTokenReqURI(state); });
    };
    answer.Redirect(Frontend::StartLogin(answer, Frontend::Variable("HTTP_COOKIE"), profile, makeAddress));
}

}  // namespace

int main() { return Frontend::Serve("GET, HEAD", GoToProvider); }
