#include <jwt/jwt.h>
#include <sso/supported_profiles.h>
#include <unistd.h>

#include <cerrno>

#include "web/azure_client.h"
#include "web/claims.h"
#include "web/configured_profile.h"
#include "web/failure.h"
#include "web/failure_lookup.h"
#include "web/nonce.h"
#include "web/pending_login.h"
#include "web/refusal.h"
#include "web/request.h"
#include "web/text.h"

namespace TAVO::Web {

namespace {

constexpr char kSettings[] = "/usr/tavo/etc/ssoclient/";

bool IsUnreadable(const std::string &file) {
    const std::string path = kSettings + file;
    return access(path.c_str(), R_OK) != 0 && errno == EACCES;
}

/// The client's file is read with root's ids, which a process has if one of its ids is root's.
bool CanBecomeRoot() {
    uid_t real = 0;
    uid_t effective = 0;
    uid_t saved = 0;
    return getresuid(&real, &effective, &saved) == 0 && (real == 0 || effective == 0 || saved == 0);
}

void RequirePermission(const std::string &file) {
    if (!CanBecomeRoot() && IsUnreadable(file)) {
        throw Refusal("This program may not read the configuration of single sign-on.");
    }
}

std::string RequireProfile() {
    RequirePermission("profile.conf");
    std::string profile = ProfileInForce();
    RequirePermission(profile + ".conf");
    if (HowFarSetUp() != SetUp::kComplete) {
        throw Refusal("Single sign-on is not completely set up on this device.");
    }
    return profile;
}

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
        throw Refusal(ProviderError(OnlyValue(parameters, "error").value_or(""),
                                    OnlyValue(parameters, "error_description").value_or("")));
    }
}

/// What `OIDCLogin` does, and then the checks of the claims that the library leaves to its callers.
User SignIn(const PendingLogin &login, const std::string &code, const FinishOptions &options) {
    return TAVO::SSO::WithClient<AzureClient>(login.profile, [&](TAVO::SSO::SSOClient &client) {
        std::string name;
        client.OpenIDConnectLogin(code, name);
        const Json::Value claims = TAVO::JWT::Jwt(client.GetToken()).GetBody();
        RequireNonce(claims, login.state);
        RequireTrustworthyName(claims, login.profile, options.acceptUnverifiedEmail);
        if (name.empty() || !IsPrintable(name)) {
            throw Refusal("The provider's name for this user cannot be used.");
        }
        return User{name, DisplayName(claims), login.profile, claims};
    });
}

std::size_t AppendChunk(char *data, std::size_t size, std::size_t count, void *document) noexcept {
    try {
        static_cast<std::string *>(document)->append(data, size * count);
    } catch (...) {
        return 0;  // an exception must not cross libcurl's frames
    }
    return size * count;
}

/// Asks an address for a document, to find out why a login could not.
CURLcode Probe(const std::string &address, std::string &document) {
    try {
        TAVO::SSO::httpGet(address, document, true, AppendChunk);
        return CURLE_OK;
    } catch (const TAVO::SSO::sso_err_resp &error) {
        return FindTransferText(error.what());
    }
}

/// The library reports a failed transfer by what is missing after it.
CURLcode ProbeProvider(Failure failure) {
    SSO::SSOProfile profile;
    std::string document;
    if (failure == Failure::kInvalidResponse) {
        return Probe(profile.GetSSOClient()->GetTokenEndpoint(), document);
    }
    if (failure != Failure::kUnknownKey) {
        return CURLE_OK;
    }
    const CURLcode result = Probe(profile.GetSSOClient()->GetWellknownEndpoint(), document);
    const std::string keys = StringMember(ParseObject(document), "jwks_uri");
    return result == CURLE_OK && keys.rfind("https://", 0) == 0 ? Probe(keys, document) : result;
}

FailedLogin Diagnose(const std::exception &error) {
    FailedLogin failed = FailedLoginOf(error);
    const CURLcode result = ProbeProvider(failed.failure);
    return result == CURLE_OK ? failed : FailedTransfer(failed, result);
}

}  // namespace

StartedLogin StartLogin(const Request &request, LoginStore &store, const std::string &origin) {
    StartedLogin started;
    try {
        RequireGet(request);
        const std::string profile = RequireProfile();
        // Not `RedirectAuthEndpoint`, which writes the URL at once: its state must be remembered first.
        const auto makeAddress = [&](const Json::Value &state) {
            return TAVO::SSO::WithClient(profile, [&](auto &client) { return client.GetAccessTokenReqURI(state); });
        };
        started.response.Redirect(BeginLogin(started.response, request, store, profile, origin, makeAddress));
    } catch (const std::exception &error) {
        started.failure = FailedLoginOf(error);
    }
    return started;
}

FinishedLogin FinishLogin(const Request &request, LoginStore &store, const FinishOptions &options) {
    FinishedLogin finished;
    try {
        RequireGet(request);
        const Parameters parameters = ParseQuery(request.query);
        finished.state = RequireOnly(parameters, "state");
        // Before anything of the answer is believed, and above all before the code is used.
        const PendingLogin login = EndLogin(finished.response, finished.origin, request, store, finished.state);
        RefuseProviderError(parameters);
        finished.user = SignIn(login, RequireOnly(parameters, "code"), options);
    } catch (const std::exception &error) {
        finished.failure = Diagnose(error);
    }
    return finished;
}

}  // namespace TAVO::Web
