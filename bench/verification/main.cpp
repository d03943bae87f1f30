// One ID token, from its compact text and the text of its key to the verdict, its header and claims parsed.
#include <memory>
#include <optional>
#include <string>

#include "bench/support/measure.h"
#include "bench/verification/issuer.h"
#include "bench/verification/subjects.h"

namespace Bench {

namespace {

constexpr Algorithm kAlgorithms[] = {
    {"RS256", Kind::kRSA, EVP_sha256, 2048}, {"RS256", Kind::kRSA, EVP_sha256, 4096},
    {"RS512", Kind::kRSA, EVP_sha512, 2048}, {"HS256", Kind::kHMAC, EVP_sha256, 0},
    {"HS512", Kind::kHMAC, EVP_sha512, 0},
};
constexpr std::size_t kClaimsSizes[] = {300, 1024, 8192};

struct Subject {
    const char *name;
    bool (*verify)(const SignedToken &);
};
constexpr Subject kSubjects[] = {
    {"ours", VerifyByLibrary},  {"floor", VerifyByFloor},     {"cjose", VerifyByCjose},
    {"libjwt", VerifyByLibjwt}, {"libjwt3", VerifyByLibjwt3}, {"scitokens", VerifyBySciTokens},
};

/// SciTokens knows, of these, RS256 alone.
bool Knows(const Subject &subject, const Algorithm &algorithm) {
    return subject.verify != VerifyBySciTokens || algorithm.name == std::string("RS256");
}

std::string CaseName(const Algorithm &algorithm, std::size_t claimsSize) {
    const std::string bits = algorithm.bits == 0 ? "" : std::to_string(algorithm.bits) + " bits, ";
    return std::string(algorithm.name) + ", " + bits + std::to_string(claimsSize) + " B";
}

void RegisterAll(const std::string &issuer) {
    for (const Algorithm &algorithm : kAlgorithms) {
        for (const std::size_t size : kClaimsSizes) {
            const auto token = std::make_shared<std::optional<SignedToken>>();  // made when it is needed
            for (const Subject &subject : kSubjects) {
                if (!Knows(subject, algorithm)) {
                    continue;
                }
                Register("verification/" + CaseName(algorithm, size) + "/" + subject.name,
                         [verify = subject.verify, token, algorithm, size, issuer] {
                             if (!*token) {
                                 *token = MakeToken(algorithm, size, issuer);
                             }
                             return verify(**token);
                         });
            }
        }
    }
}

}  // namespace

}  // namespace Bench

int main(int argc, char **argv) {
    const Bench::Issuer issuer({2048, 4096});
    Bench::RegisterAll(issuer.name());
    return Bench::RunBenchmarks(argc, argv);
}
