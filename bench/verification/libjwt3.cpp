// libjwt 3. In a separate library, since its functions have the names of libjwt 1's.
#include <jwt.h>

#include "bench/verification/subjects.h"

namespace Bench {

__attribute__((visibility("default"))) bool VerifyByLibjwt3(const SignedToken &token) {
    jwk_set_t *keys = jwks_create(token.jwk.c_str());
    jwt_checker_t *checker = jwt_checker_new();
    const bool verified = jwt_checker_setkey(checker, jwt_str_alg(token.algorithm.name), jwks_item_get(keys, 0)) == 0 &&
                          jwt_checker_verify(checker, token.compact.c_str()) == 0;
    jwt_checker_free(checker);
    jwks_free(keys);
    return verified;
}

}  // namespace Bench
