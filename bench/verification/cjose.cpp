#include <cjose/header.h>
#include <cjose/jwk.h>
#include <cjose/jws.h>
#include <jansson.h>

#include "bench/verification/subjects.h"

namespace Bench {

namespace {

/// A provider's key comes as a JWK, the client secret as bytes.
cjose_jwk_t *MakeKey(const SignedToken &token) {
    return token.algorithm.kind == Kind::kRSA
               ? cjose_jwk_import(token.jwk.data(), token.jwk.size(), nullptr)
               : cjose_jwk_create_oct_spec(reinterpret_cast<const std::uint8_t *>(token.key.data()), token.key.size(),
                                           nullptr);
}

}  // namespace

bool VerifyByCjose(const SignedToken &token) {
    cjose_jwk_t *key = MakeKey(token);
    cjose_jws_t *jws = cjose_jws_import(token.compact.data(), token.compact.size(), nullptr);
    const bool verified = cjose_jws_verify(jws, key, nullptr);
    // The header has been parsed by the import; the body is for the caller to parse.
    std::uint8_t *body = nullptr;
    std::size_t length = 0;
    cjose_jws_get_plaintext(jws, &body, &length, nullptr);
    json_t *claims = json_loadb(reinterpret_cast<const char *>(body), length, 0, nullptr);
    const bool parsed = json_is_object(claims);
    json_decref(claims);
    cjose_jws_release(jws);
    cjose_jwk_release(key);
    return verified && parsed;
}

}  // namespace Bench
