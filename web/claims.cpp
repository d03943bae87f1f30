#include "web/claims.h"

#include <sso/sso.h>
#include <sso/supported_profiles.h>

#include "web/refusal.h"
#include "web/text.h"

namespace TAVO::Web {

namespace {

/// Returns the claim that the library converts to the user's name.
const char *NameClaim(const Json::Value &claims, const std::string &profile) {
    if (profile != TAVO::SSO::kAzureProfile) {
        return "sub";
    }
    return claims["unique_name"].isString() ? "unique_name" : "email";
}

}  // namespace

void RequireTrustworthyName(const Json::Value &claims, const std::string &profile, bool acceptsUnverifiedEmail) {
    const std::string claim = NameClaim(claims, profile);
    const std::string name = StringMember(claims, claim.c_str());
    if (name.empty() || !IsPrintable(name)) {
        throw Refusal("The provider's name for this user cannot be used.");
    }
    if (claim == "email" && !acceptsUnverifiedEmail && claims["email_verified"] != Json::Value(true)) {
        throw Refusal("The provider has not verified this user's e-mail address.");
    }
}

std::string DisplayName(const Json::Value &claims) {
    const std::string name = StringMember(claims, "name");
    return IsPrintable(name) ? OneLine(name) : "";
}

}  // namespace TAVO::Web
