#include <scitokens/scitokens.h>

#include <cstdlib>

#include "bench/verification/subjects.h"

namespace Bench {

bool VerifyBySciTokens(const SignedToken &token) {
    SciToken verified = nullptr;
    char *error = nullptr;
    const bool good = scitoken_deserialize(token.compact.c_str(), &verified, nullptr, &error) == 0;
    std::free(error);
    scitoken_destroy(verified);
    return good;
}

}  // namespace Bench
