#ifndef TAVOSSO_BENCH_VERIFICATION_SIGNED_TOKEN_H
#define TAVOSSO_BENCH_VERIFICATION_SIGNED_TOKEN_H

#include <json/json.h>

#include <cstddef>
#include <string>

namespace Bench {

enum class Algorithm { kRS256, kHS256 };

/// An ID token and its key, in the forms that the verifiers need.
struct SignedToken {
    Algorithm algorithm;
    std::string compact;
    std::string jwk;             // RS256: the public key as a JSON Web Key (RFC 7517)
    std::string key;             // RS256: the public key in PEM; HS256: the secret's bytes
    mutable std::string secret;  // HS256: base64; mutable, because the library takes a non-const reference
};

/// Returns a token with about that many bytes of claims.
SignedToken MakeToken(Algorithm algorithm, std::size_t claimsSize,
                      const std::string &issuer = "https://idp.example/v2.0");

/// Returns the 2048-bit RSA key that signs RS256 tokens, as a JSON Web Key.
Json::Value PublicKey();

}  // namespace Bench

#endif
