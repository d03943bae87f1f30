#ifndef TAVOSSO_WEB_CONFIGURED_PROFILE_H
#define TAVOSSO_WEB_CONFIGURED_PROFILE_H

#include <sso/sso.h>

#include <string>

// The profile in force, for logins that need the client itself.
namespace TAVO::Web {

enum class SetUp { kOff, kIncomplete, kComplete };

/// Whether users can sign in, for pages that offer it.
SetUp HowFarSetUp();

/// The profile's name. Refuses where `OIDCLogin` does: "sso does not enable." for a profile that is off or cannot be
/// read, "profile not support." for one that is missing or unknown.
std::string ProfileInForce();

/// Whether single sign-on is on and this is its profile.
bool IsInForce(const std::string &profile);

}  // namespace TAVO::Web

#endif
