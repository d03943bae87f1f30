#include <cjose/header.h>
#include <cjose/jwk.h>
#include <cjose/jws.h>
#include <jansson.h>
#include <jwt.h>
#include <scitokens/scitokens.h>

#include <cstdlib>

#include "bench/verification/verifiers.h"

namespace Bench {

namespace {

const std::uint8_t *Bytes(const std::string &text) { return reinterpret_cast<const std::uint8_t *>(text.data()); }

}  // namespace

bool VerifyByCjose(const SignedToken &token) {
    cjose_jwk_t *key = token.algorithm == Algorithm::kRS256
                           ? cjose_jwk_import(token.jwk.data(), token.jwk.size(), nullptr)
                           : cjose_jwk_create_oct_spec(Bytes(token.key), token.key.size(), nullptr);
    cjose_jws_t *jws = cjose_jws_import(token.compact.data(), token.compact.size(), nullptr);
    const bool verified = cjose_jws_verify(jws, key, nullptr);
    // cjose has parsed the header; its callers parse the claims.
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

bool VerifyByLibjwt(const SignedToken &token) {
    const jwt_alg_t expected = token.algorithm == Algorithm::kRS256 ? JWT_ALG_RS256 : JWT_ALG_HS256;
    jwt_t *jwt = nullptr;
    const bool verified =
        jwt_decode(&jwt, token.compact.c_str(), Bytes(token.key), static_cast<int>(token.key.size())) == 0 &&
        jwt_get_alg(jwt) == expected;
    jwt_free(jwt);
    return verified;
}

bool VerifyBySciTokens(const SignedToken &token) {
    SciToken verified = nullptr;
    char *error = nullptr;
    const bool succeeded = scitoken_deserialize(token.compact.c_str(), &verified, nullptr, &error) == 0;
    std::free(error);
    scitoken_destroy(verified);
    return succeeded;
}

}  // namespace Bench
