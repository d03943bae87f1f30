#include "web/configured_profile.h"

#include <fcntl.h>
#include <openssl/crypto.h>
#include <sso/supported_profiles.h>
#include <unistd.h>

#include <cerrno>

#include "web/refusal.h"

namespace TAVO::Web {

namespace {

constexpr char kSettings[] = "/usr/tavo/etc/ssoclient/";

bool IsUnreadable(const std::string &file) {
    return faccessat(AT_FDCWD, (kSettings + file).c_str(), R_OK, AT_EACCESS) != 0 && errno == EACCES;
}

/// Returns whether the library can raise root's ids to read a client's file.
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

bool HasSecret(SSO::SSOClient &client) {
    std::string secret = client.GetClientSecret();
    const bool isSet = !secret.empty();
    OPENSSL_cleanse(secret.data(), secret.size());
    return isSet;
}

// Without one of these a login fails, often after the user has entered a password. The client does not return the
// tenant id.
bool HasAllSettings(const std::string &profile, SSO::SSOClient &client) {
    return !client.GetClientID().empty() && HasSecret(client) && !client.GetRedirectURI().empty() &&
           !client.GetAuthEndpoint().empty() && !client.GetTokenEndpoint().empty() &&
           (profile != SSO::kAzureProfile || !client.GetWellknownEndpoint().empty());
}

}  // namespace

SetUp HowFarSetUp() {
    SSO::SSOProfile profile;
    if (!profile.SSOIsEnable()) {
        return SetUp::kOff;
    }
    // The client of an unsupported profile has no settings.
    return HasAllSettings(profile.GetSSOProfile(), *profile.GetSSOClient()) ? SetUp::kComplete : SetUp::kIncomplete;
}

Json::Value RequireSettings() {
    RequirePermission("profile.conf");
    SSO::SSOProfile profile;
    if (!profile.SSOIsEnable()) {
        throw SSO::sso_op_failed("sso does not enable.");
    }
    const std::string name = profile.GetSSOProfile();
    if (!SSO::IsSupported(name)) {
        throw SSO::sso_exception("profile not support.");
    }
    RequirePermission(name + ".conf");
    SSO::SSOClient &client = *profile.GetSSOClient();
    if (!HasAllSettings(name, client)) {
        throw Refusal("Single sign-on is not completely set up on this device.");
    }
    Json::Value settings;
    settings["profile"] = name;
    settings["client_id"] = client.GetClientID();
    settings["token_endpoint"] = client.GetTokenEndpoint();
    return settings;
}

bool IsInForce(const std::string &profile) {
    SSO::SSOProfile configured;
    return configured.SSOIsEnable() && configured.GetSSOProfile() == profile;
}

}  // namespace TAVO::Web
