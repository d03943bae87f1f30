#ifndef TAVOSSO_BENCH_VERIFICATION_VERIFIERS_H
#define TAVOSSO_BENCH_VERIFICATION_VERIFIERS_H

#include "bench/verification/signed_token.h"

// Each function verifies an ID token with its key, parses header and claims, and returns whether the token is valid.
namespace Bench {

bool VerifyByLibrary(const SignedToken &token);
bool VerifyByFloor(const SignedToken &token);
bool VerifyByCjose(const SignedToken &token);
bool VerifyByLibjwt(const SignedToken &token);

/// RS256 only. Fetches the issuer's key once and caches it in a file.
bool VerifyBySciTokens(const SignedToken &token);

}  // namespace Bench

#endif
