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

/// Whether header and claims are well-formed, or the token is not one at all.
bool IsCertain(const std::string &token);

/// A token taken apart, and each check as the clients must make it: throws what they must throw.
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

/// Holds what a client says of a token against what it must say. Where that is not certain it may not be trusted unless
/// it is good, and is refused for one of the reasons of both clients, or for one of these.
void RequireVerdict(const Test::Failure &failure, const Test::Failure &told, bool certain,
                    const std::vector<Test::Failure> &reasons);

}  // namespace Fuzz

#endif
