#ifndef TAVOSSO_WEB_CLAIMS_H
#define TAVOSSO_WEB_CLAIMS_H

#include <json/json.h>

#include <string>

// What the front end checks in the claims of an ID token that the library has verified.
namespace TAVO::Web {

/**
 * Throws `Refusal` unless the claim that names the user can be trusted: "unique_name" under the profile azure, "sub"
 * under another. It must be a printable string, since the platform reads a name up to its first NUL. "email", which the
 * library takes where "unique_name" is missing, is often the user's own choice: it counts only if "email_verified" is
 * true, or with `acceptsUnverifiedEmail`.
 */
void RequireTrustworthyName(const Json::Value &claims, const std::string &profile, bool acceptsUnverifiedEmail);

/// The name to show for the user: the claim "name". Empty if it is missing or not printable.
std::string DisplayName(const Json::Value &claims);

}  // namespace TAVO::Web

#endif
