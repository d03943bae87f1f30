#ifndef TAVOSSO_TESTS_FUZZ_TOKEN_ORACLE_H
#define TAVOSSO_TESTS_FUZZ_TOKEN_ORACLE_H

#include <json/json.h>
#include <openssl/types.h>

#include <ctime>
#include <string>
#include <vector>

#include "tests/support/failure.h"

// The expected results of ID token verification.
namespace Fuzz {

/// The current time, fixed so that results are reproducible.
constexpr std::time_t kNow = 2000000000;

/// The header or the claims of a token. The result is not certain for malformed base64: the library may decode the
/// bytes before the error or reject the part.
struct ExpectedPart {
    Json::Value value;
    Test::Failure failure = Test::kNothingThrown;
    bool certain = true;
};

ExpectedPart ReadPart(const std::string &part, const char *notJson);

/// Whether the expected result is certain.
bool IsCertain(const std::string &token);

/// A parsed token with the expected checks, which throw the expected exceptions.
class ExpectedToken {
  public:
    explicit ExpectedToken(const std::string &token);

    void CheckExpiry() const;
    void CheckMember(const std::string &name, const std::string &expected, const char *failure) const;
    const EVP_MD *ChooseDigest(const std::string &family) const;

    Json::Value header;
    Json::Value claims;
    std::string signature;

    /// Up to the first NUL.
    std::string signingInput;
};

/// Compares a client's result with the expected one. If that is not certain, requires that an invalid token is
/// rejected, for a reason of both clients or one of `reasons`.
void RequireVerdict(const Test::Failure &failure, const Test::Failure &expected, bool certain,
                    const std::vector<Test::Failure> &reasons);

}  // namespace Fuzz

#endif
