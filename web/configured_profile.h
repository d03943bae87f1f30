#ifndef TAVOSSO_WEB_CONFIGURED_PROFILE_H
#define TAVOSSO_WEB_CONFIGURED_PROFILE_H

#include <sso/sso.h>

#include <string>

// The configured profile and its client.
namespace TAVO::Web {

enum class SetUp { kOff, kIncomplete, kComplete };

/// Whether users can sign in, for pages that offer it.
SetUp HowFarSetUp();

/// Returns the settings that must not change during a login: "profile", "client_id" and "token_endpoint".
///
/// Throws what `OIDCLogin` throws for a profile that is off or unknown, and `Refusal` if the program may not read a
/// file or a setting is missing.
Json::Value RequireSettings();

/// Whether single sign-on is on and this is its profile.
bool IsInForce(const std::string &profile);

}  // namespace TAVO::Web

#endif
