#ifndef TAVOSSO_TESTS_LOOPBACK_LOOPBACK_PROVIDER_H
#define TAVOSSO_TESTS_LOOPBACK_LOOPBACK_PROVIDER_H

#include <json/json.h>

#include <ctime>
#include <iosfwd>
#include <string>
#include <typeinfo>
#include <vector>

#include "tests/support/server.h"

// Whole logins against a provider in this program, over TLS. The clock stands still, for the library and for the test.
namespace Test {

constexpr std::time_t kNow = 1'700'000'000;

enum class Profile { kAzure, kWebSphere };

std::string Name(Profile profile);
void PrintTo(Profile profile, std::ostream *stream);

/// What the appliance calls the user whom the tokens name.
std::string UserName(Profile profile);

constexpr char kSecret[] = "a secret & 100 % only of this test";
constexpr char kKeyID[] = "first key";
constexpr char kUserNameBefore[] = "as it was before";

/// How a login ended.
struct Outcome {
    std::string exception;  // its class, as the compiler names it; empty after a login
    std::string text;
    std::string userName;
};

bool operator==(const Outcome &a, const Outcome &b);
std::ostream &operator<<(std::ostream &stream, const Outcome &outcome);

template <typename Exception>
Outcome Refused(const std::string &text, const std::string &userName = kUserNameBefore) {
    return {typeid(Exception).name(), text, userName};
}

Outcome LoggedIn(const std::string &userName);

/// Logs in with this code, through the provider that the appliance is configured for.
Outcome LogIn(const std::string &code);

/// JSON text with these members, over those of the value; a null takes a member away.
Json::Value Change(Json::Value value, const std::string &changes);

/// What a token of this provider says, unless a test changes it.
Json::Value TokenHeader(Profile profile);
Json::Value TokenClaims(Profile profile);

/// Signed as the header's "alg" says: HSnnn under the secret, everything else with the provider's RSA key; under
/// SHA-256 where "alg" names no digest.
std::string SignedToken(const Json::Value &header, const Json::Value &claims, const std::string &secret = kSecret);

std::string TokenResponse(const std::string &idToken);

/// The provider's key set, with changes to its one key.
std::string KeySet(const std::string &changes = "{}");

/// A provider and the appliance's configuration for it, which is nothing else than that.
class Provider {
  public:
    /// Changes are those to the client's configuration file; $BASE in them and in every answer is the provider's URL.
    explicit Provider(Profile profile, const std::string &changes = "{}");

    void Answer(const std::string &body);
    void AnswerByteByByte(const std::string &answer);
    void Play(const Script &script);

    /// Discovery document and key set, where this provider has them.
    void AnswerVerification();

    /// The token and what it takes to verify it.
    void AnswerLogin(const std::string &idToken);

    Outcome LogIn();

    std::vector<std::string> Requests() const { return server_.Requests(); }
    std::vector<std::string> RequestLines() const { return server_.RequestLines(); }
    std::string URL(const std::string &path) const { return server_.URL(path); }

  private:
    std::string WithBase(std::string text) const;

    Profile profile_;
    Server server_;
};

/// The requests of a login that gets through.
std::vector<std::string> AllRequestLines(Profile profile);

}  // namespace Test

#endif
