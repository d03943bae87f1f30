#ifndef TAVOSSO_SSO_ID_TOKEN_H
#define TAVOSSO_SSO_ID_TOKEN_H

#include <json/json.h>
#include <openssl/types.h>

#include <string>

#include "jwt/jwt.h"

// What both clients check and read of an ID token (OpenID Connect Core 1.0, section 2).
namespace TAVO::SSO {

/// The token to verify. Throws std::invalid_argument "token cannot be empty", "bad jwt format!".
JWT::Jwt SplitIDToken(const std::string &token);

/// Throws std::invalid_argument "id_token expired." once the clock has passed "exp".
void CheckExpiry(const Json::Value &claims);

/// Throws std::invalid_argument "client ID invalid" unless "aud" is this client. A list of audiences is refused.
void CheckAudience(const Json::Value &claims, const std::string &clientID);

/// A signature algorithm of RFC 7518, section 3.1, by its name in the header, and its digest.
struct Algorithm {
    const char *name;
    const EVP_MD *(*digest)();
};

/// The digest of the header's "alg", which must be one of the three that the client supports. Throws jwt_not_support.
const EVP_MD *ChooseDigest(const Json::Value &header, const Algorithm (&supported)[3]);

/// All claims, unverified. Throws std::invalid_argument "please request a id_token first."; as the token's format
/// demands.
Json::Value ReadClaims(const std::string &token);

}  // namespace TAVO::SSO

#endif
