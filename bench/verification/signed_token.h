#ifndef TAVOSSO_BENCH_VERIFICATION_SIGNED_TOKEN_H
#define TAVOSSO_BENCH_VERIFICATION_SIGNED_TOKEN_H

#include <json/json.h>

#include <cstddef>
#include <string>

namespace Bench {

enum class Algorithm { kRS256, kHS256 };

/// An ID token and its key, in each form that a verifier takes.
struct SignedToken {
    Algorithm algorithm;
    std::string compact;
    std::string jwk;             // RS256: the public key as a JSON Web Key (RFC 7517)
    std::string key;             // RS256: the public key in PEM; HS256: the secret's bytes
    mutable std::string secret;  // HS256: base64; the library takes a reference to a string that is not const
};

/// A token whose claims are about that many bytes of JSON.
SignedToken MakeToken(Algorithm algorithm, std::size_t claimsSize,
                      const std::string &issuer = "https://idp.example/v2.0");

/// The RSA key of 2048 bits that RS256 tokens are signed with, as a JSON Web Key.
Json::Value PublicKey();

}  // namespace Bench

#endif
