#include <jwt.h>

#include "bench/verification/subjects.h"

namespace Bench {

bool VerifyByLibjwt(const SignedToken &token) {
    jwt_t *jwt = nullptr;
    const bool verified =
        jwt_decode(&jwt, token.compact.c_str(), reinterpret_cast<const unsigned char *>(token.key.data()),
                   static_cast<int>(token.key.size())) == 0 &&
        jwt_get_alg(jwt) == jwt_str_alg(token.algorithm.name);
    jwt_free(jwt);
    return verified;
}

}  // namespace Bench
