#ifndef TAVOSSO_TESTS_FUZZ_TOKEN_ORACLE_H
#define TAVOSSO_TESTS_FUZZ_TOKEN_ORACLE_H

#include <json/json.h>
#include <openssl/types.h>

#include <ctime>
#include <string>
#include <vector>

#include "tests/support/failure.h"

// What the clients must say of an ID token, worked out without them.
namespace Fuzz {

/// The second that it is for the clients, so that a token is judged alike whenever it is shown.
constexpr std::time_t kNow = 2000000000;

/// The header or the claims of a token. Where the part is not well-formed base64 it is not certain: the library may
/// read the bytes before the fault, or refuse.
struct ExpectedPart {
    Json::Value value;
    Test::Failure failure = Test::kNothingThrown;
    bool certain = true;
};

ExpectedPart ReadPart(const std::string &part, const char *notJson);

/// A token taken apart, and each check as the clients must make it: throws what they must throw.
class ExpectedToken {
  public:
    explicit ExpectedToken(const std::string &token);

    void CheckExpiry() const;
    void CheckMember(const std::string &name, const std::string &expected, const char *failure) const;
    const EVP_MD *ChooseDigest(const std::string &family) const;

    /// Whether every part was well-formed.
    bool certain = true;

    Json::Value header;
    Json::Value claims;
    std::string signature;

    /// Up to the first NUL.
    std::string signingInput;
};

/// Everything that both clients may say of a token that is not good, but for its algorithm and signature.
std::vector<Test::Failure> TokenFailures();

}  // namespace Fuzz

#endif
