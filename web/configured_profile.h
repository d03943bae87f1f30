#ifndef TAVOSSO_WEB_CONFIGURED_PROFILE_H
#define TAVOSSO_WEB_CONFIGURED_PROFILE_H

#include <sso/sso.h>

#include <string>

// The configured profile and its client.
namespace TAVO::Web {

enum class SetUp { kOff, kIncomplete, kComplete };

/// Returns whether users can sign in.
SetUp HowFarSetUp();

/// Returns the settings that must not change during a login: "profile", "client_id" and "token_endpoint".
///
/// Throws as `OIDCLogin` if the profile is off or unknown, and `Refusal` if a file is not readable or a setting
/// missing.
Json::Value RequireSettings();

/// Returns whether single sign-on is on and this is the configured profile.
bool IsInForce(const std::string &profile);

}  // namespace TAVO::Web

#endif
