#ifndef TAVOSSO_FRONTEND_ID_TOKEN_H
#define TAVOSSO_FRONTEND_ID_TOKEN_H

#include <json/json.h>

#include <string>

namespace Frontend {

/**
 * Throws `Refusal` unless the ID token was issued for the login that `state`, the state's object, belongs to (OpenID
 * Connect Core 1.0, section 3.1.3.7, number 11). A code or a token that was stolen from another login carries that
 * one's nonce, of which the state holds the digest. Verifies nothing else: the library has, in `OpenIDConnectLogin`.
 */
void RequireNonce(const std::string &idToken, const Json::Value &state);

}  // namespace Frontend

#endif
