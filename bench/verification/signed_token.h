#ifndef TAVOSSO_BENCH_VERIFICATION_SIGNED_TOKEN_H
#define TAVOSSO_BENCH_VERIFICATION_SIGNED_TOKEN_H

#include <json/json.h>
#include <openssl/evp.h>

#include <cstddef>
#include <string>

namespace Bench {

enum class Kind { kRSA, kHMAC };

/// An "alg" (RFC 7518, section 3.1), and the size of the RSA keys that it is measured with.
struct Algorithm {
    const char *name;
    Kind kind;
    const EVP_MD *(*digest)();
    unsigned int bits;
};

/// An ID token, and what it is verified with, in each form that a subject asks for.
struct SignedToken {
    Algorithm algorithm;
    std::string compact;
    std::string jwk;             // the public key, or the secret, as a JSON Web Key (RFC 7517)
    mutable std::string secret;  // in base64; the library takes it by reference to a string that is not const
    std::string key;             // the public key in PEM, or the secret's bytes, for those who know no JWK
};

/// A token whose claims have about that many bytes of JSON.
SignedToken MakeToken(const Algorithm &algorithm, std::size_t claimsSize,
                      const std::string &issuer = "https://idp.example/v2.0");

/// The public key that tokens of RSA keys of this size are signed with, as a JSON Web Key.
Json::Value PublicKey(unsigned int bits);

}  // namespace Bench

#endif
