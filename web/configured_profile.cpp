#include "web/configured_profile.h"

#include <sso/supported_profiles.h>

namespace TAVO::Web {

namespace {

// Without any of these a login is certain to fail, some only after the user has typed a password. The tenant, of which
// the same is true, is not told by the client.
bool HasAllSettings(const std::string &profile, TAVO::SSO::SSOClient &client) {
    return !client.GetClientID().empty() && !client.GetClientSecret().empty() && !client.GetRedirectURI().empty() &&
           !client.GetAuthEndpoint().empty() && !client.GetTokenEndpoint().empty() &&
           (profile != TAVO::SSO::kAzureProfile || !client.GetWellknownEndpoint().empty());
}

}  // namespace

SetUp HowFarSetUp() {
    TAVO::SSO::SSOProfile profile;
    if (!profile.SSOIsEnable()) {
        return SetUp::kOff;
    }
    // The client of an unsupported profile has no settings.
    return HasAllSettings(profile.GetSSOProfile(), *profile.GetSSOClient()) ? SetUp::kComplete : SetUp::kIncomplete;
}

std::string ProfileInForce() {
    TAVO::SSO::SSOProfile profile;
    if (!profile.SSOIsEnable()) {
        throw TAVO::SSO::sso_op_failed("sso does not enable.");
    }
    std::string name = profile.GetSSOProfile();
    if (!TAVO::SSO::IsSupported(name)) {
        throw TAVO::SSO::sso_exception("profile not support.");
    }
    return name;
}

bool IsInForce(const std::string &profile) {
    TAVO::SSO::SSOProfile profileInForce;
    return profileInForce.SSOIsEnable() && profileInForce.GetSSOProfile() == profile;
}

}  // namespace TAVO::Web
