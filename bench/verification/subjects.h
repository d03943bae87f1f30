#ifndef TAVOSSO_BENCH_VERIFICATION_SUBJECTS_H
#define TAVOSSO_BENCH_VERIFICATION_SUBJECTS_H

#include "bench/verification/signed_token.h"

// Each verifies one ID token from its text and its key, in the form that a relying party has it, parses header and
// claims, and returns the verdict.
namespace Bench {

bool VerifyByLibrary(const SignedToken &token);
bool VerifyByFloor(const SignedToken &token);
bool VerifyByCjose(const SignedToken &token);
bool VerifyByLibjwt(const SignedToken &token);
bool VerifyByLibjwt3(const SignedToken &token);

/// With the key that the token's issuer has published, which is fetched once and then kept in a file.
bool VerifyBySciTokens(const SignedToken &token);

}  // namespace Bench

#endif
