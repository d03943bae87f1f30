#include <jwt/jwt.h>
#include <sso/supported_profiles.h>

#include "web/azure_client.h"
#include "web/claims.h"
#include "web/configured_profile.h"
#include "web/nonce.h"
#include "web/pending_login.h"
#include "web/probe.h"
#include "web/refusal.h"
#include "web/request.h"
#include "web/text.h"

namespace TAVO::Web {

namespace {

void RequireGet(const Request &request) {
    if (request.method != "GET") {
        throw Refusal("This request cannot start or complete a sign-in.");
    }
}

std::string RequireOnly(const Parameters &parameters, const char *name) {
    const std::optional<std::string> value = OnlyValue(parameters, name);
    if (!value || value->empty()) {
        throw Refusal(std::string("The provider's answer has no single ") + name + ".");
    }
    return *value;
}

void RefuseProviderError(const Parameters &parameters) {
    if (parameters.count("error") != 0) {
        throw ProviderRefusal(OnlyValue(parameters, "error").value_or(""),
                              OnlyValue(parameters, "error_description").value_or(""));
    }
}

/// Logs in as `OIDCLogin`, then checks the claims that the library does not check.
User SignIn(const PendingLogin &login, const std::string &code, const FinishOptions &options) {
    return SSO::WithClient<AzureClient>(login.profile, [&](SSO::SSOClient &client) {
        std::string name;
        client.OpenIDConnectLogin(code, name);
        const Json::Value claims = JWT::Jwt(client.GetToken()).GetBody();
        RequireNonce(claims, login.state);
        RequireTrustworthyName(claims, login.profile, options.acceptUnverifiedEmail);
        if (name.empty() || !IsPrintable(name)) {
            throw Refusal("The provider's name for this user cannot be used.");
        }
        return User{name, DisplayName(claims), login.profile, claims};
    });
}

}  // namespace

StartedLogin StartLogin(const Request &request, LoginStore &store, const std::string &startPage) {
    StartedLogin started;
    try {
        started.origin = SafeOrigin(OnlyValue(ParseQuery(request.query), "origin").value_or(""), startPage);
        RequireGet(request);
        const Json::Value settings = RequireSettings();
        // Not `RedirectAuthEndpoint`, which would redirect the browser before the state is stored.
        const auto makeAddress = [&](const Json::Value &state) {
            return SSO::WithClient(settings["profile"].asString(),
                                   [&](auto &client) { return client.GetAccessTokenReqURI(state); });
        };
        started.response.Redirect(BeginLogin(started.response, request, store, settings, started.origin, makeAddress));
    } catch (const std::exception &error) {
        started.failure = FailedLoginOf(error);
    }
    return started;
}

bool IsReturn(const Request &request) {
    const Parameters parameters = ParseQuery(request.query);
    return parameters.count("state") != 0 || parameters.count("error") != 0;
}

FinishedLogin FinishLogin(const Request &request, LoginStore &store, const FinishOptions &options) {
    FinishedLogin finished;
    try {
        RequireGet(request);
        const Parameters parameters = ParseQuery(request.query);
        finished.state = RequireOnly(parameters, "state");
        // Before any other parameter is used, above all the code.
        const PendingLogin login = EndLogin(finished.response, finished.origin, request, store, finished.state);
        RefuseProviderError(parameters);
        finished.user = SignIn(login, RequireOnly(parameters, "code"), options);
    } catch (const std::exception &error) {
        finished.failure = FindCause(FailedLoginOf(error));
    }
    return finished;
}

}  // namespace TAVO::Web
