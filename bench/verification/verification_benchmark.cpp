// Compares how fast the library, the floor (floor.cpp) and other libraries verify an ID token with 1 KB of claims.
#include <cstdlib>

#include "bench/comparison.h"
#include "bench/verification/verifiers.h"
#include "tests/support/authority.h"
#include "tests/support/server.h"
#include "tests/support/token.h"

namespace {

using Bench::Algorithm;
using Bench::Comparison;
using Bench::SignedToken;
using Verifier = bool (*)(const SignedToken &);

constexpr std::size_t kClaimsSize = 1024;
constexpr double kLimit = 1.03;

/// Serves the documents that SciTokens fetches before its first verification.
void PublishKey(Test::Server &server) {
    Test::TrustAuthority();
    setenv("XDG_CACHE_HOME", "/tmp", 1);  // SciTokens caches the key there
    Json::Value discovery;
    discovery["issuer"] = server.URL("");
    discovery["jwks_uri"] = server.URL("/keys");
    Json::Value keys;
    keys["keys"].append(Bench::PublicKey());
    keys["keys"][0]["alg"] = "RS256";
    server.Answer(Test::HTTPAnswer(Test::Compact(discovery)));
    server.Answer(Test::HTTPAnswer(Test::Compact(keys)));
}

Comparison Compare(const std::string &name, const SignedToken &token, const std::string &comparedWith, Verifier other,
                   double limit = 0) {
    return {name + " token, 1 KB", [token] { return VerifyByLibrary(token); }, comparedWith,
            [token, other] { return other(token); }, limit};
}

}  // namespace

int main(int argc, char **argv) {
    Test::Server issuer(Test::CertificateFor("IP:127.0.0.1"));
    PublishKey(issuer);
    const SignedToken rs256 = MakeToken(Algorithm::kRS256, kClaimsSize, issuer.URL(""));
    const SignedToken hs256 = MakeToken(Algorithm::kHS256, kClaimsSize);
    return Bench::RunComparisons(
        {
            Compare("RS256", rs256, "the floor", Bench::VerifyByFloor, kLimit),
            Compare("RS256", rs256, "cjose", Bench::VerifyByCjose),
            Compare("RS256", rs256, "libjwt", Bench::VerifyByLibjwt),
            Compare("RS256", rs256, "SciTokens", Bench::VerifyBySciTokens),
            Compare("HS256", hs256, "the floor", Bench::VerifyByFloor, kLimit),
            Compare("HS256", hs256, "cjose", Bench::VerifyByCjose),
            Compare("HS256", hs256, "libjwt", Bench::VerifyByLibjwt),
        },
        argc, argv);
}
