#ifndef TAVOSSO_WEB_CLAIMS_H
#define TAVOSSO_WEB_CLAIMS_H

#include <json/json.h>

#include <string>

// Checks of the claims of a verified ID token.
namespace TAVO::Web {

/**
 * Throws `Refusal` unless the claim that names the user can be trusted: "unique_name" (azure) or "sub". It must be
 * printable, since the platform reads a name up to its first NUL. Without "unique_name" the library reads "email",
 * which users often choose themselves. It is accepted only if "email_verified" is true, or with
 * `acceptsUnverifiedEmail`.
 */
void RequireTrustworthyName(const Json::Value &claims, const std::string &profile, bool acceptsUnverifiedEmail);

/// Returns the claim "name", to show to the user. Empty if it is missing or not printable.
std::string DisplayName(const Json::Value &claims);

}  // namespace TAVO::Web

#endif
