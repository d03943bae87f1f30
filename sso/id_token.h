#ifndef TAVOSSO_SSO_ID_TOKEN_H
#define TAVOSSO_SSO_ID_TOKEN_H

#include <json/json.h>
#include <openssl/types.h>

#include <string>

#include "jwt/jwt.h"

// Checks and claims of the ID token (OpenID Connect Core 1.0, section 2) that both clients share.
namespace TAVO::SSO {

/// Splits the token. Throws std::invalid_argument "token cannot be empty" or "bad jwt format!".
JWT::Jwt SplitIDToken(const std::string &token);

/// Throws std::invalid_argument "id_token expired." if "exp" is in the past.
void CheckExpiry(const Json::Value &claims);

/// Throws std::invalid_argument "client ID invalid" unless "aud" is this client. A list of audiences is rejected.
void CheckAudience(const Json::Value &claims, const std::string &clientID);

/// A signature algorithm by its "alg" name (RFC 7518, section 3.1), and its digest.
struct Algorithm {
    const char *name;
    const EVP_MD *(*digest)();
};

/// Returns the digest of the header's "alg". Throws jwt_not_support unless it is supported.
const EVP_MD *ChooseDigest(const Json::Value &header, const Algorithm (&supported)[3]);

/// Returns all claims, unverified. Throws std::invalid_argument "please request a id_token first.", and as Jwt.
Json::Value ReadClaims(const std::string &token);

}  // namespace TAVO::SSO

#endif
