#ifndef TAVOSSO_WEB_NONCE_H
#define TAVOSSO_WEB_NONCE_H

#include <json/json.h>

namespace TAVO::Web {

/**
 * Throws `Refusal` unless the ID token was issued for the login that `state`, the state's object, belongs to (OpenID
 * Connect Core 1.0, section 3.1.3.7, number 11). A code or a token that was stolen from another login has that login's
 * nonce, of which the state has the digest.
 */
void RequireNonce(const Json::Value &claims, const Json::Value &state);

}  // namespace TAVO::Web

#endif
