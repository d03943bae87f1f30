#ifndef TAVOSSO_WEB_NONCE_H
#define TAVOSSO_WEB_NONCE_H

#include <json/json.h>

namespace TAVO::Web {

/**
 * Throws `Refusal` unless the digest of the token's nonce is in the state (OpenID Connect Core 1.0, section 3.1.3.7,
 * number 11). The nonce of a stolen code or token belongs to another login.
 */
void RequireNonce(const Json::Value &claims, const Json::Value &state);

}  // namespace TAVO::Web

#endif
