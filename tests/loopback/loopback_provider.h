#ifndef TAVOSSO_TESTS_LOOPBACK_LOOPBACK_PROVIDER_H
#define TAVOSSO_TESTS_LOOPBACK_LOOPBACK_PROVIDER_H

#include <json/json.h>

#include <ctime>
#include <iosfwd>
#include <string>
#include <typeinfo>
#include <vector>

#include "tests/support/server.h"

// Whole logins with a provider in this program, over TLS. The clock is stopped at kNow.
namespace Test {

constexpr std::time_t kNow = 1'700'000'000;

enum class Profile { kAzure, kWebSphere };

std::string Name(Profile profile);
void PrintTo(Profile profile, std::ostream *stream);

/// The appliance's name for the user of this provider's tokens.
std::string UserName(Profile profile);

constexpr char kSecret[] = "a secret & 100 % only of this test";
constexpr char kKeyID[] = "first key";
constexpr char kUserNameBefore[] = "as it was before";

/// The outcome of a login.
struct Outcome {
    std::string exception;  // the mangled class name; empty after a successful login
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

/// Logs in with this code and the configured profile.
Outcome LogIn(const std::string &code);

/// Applies `changes`, a JSON object, to the value. A null removes a member.
Json::Value Change(Json::Value value, const std::string &changes);

/// The default content of this provider's tokens.
Json::Value TokenHeader(Profile profile);
Json::Value TokenClaims(Profile profile);

/// Signs as "alg" requires: HSnnn with the secret, every other value with the provider's RSA key. Uses SHA-256 if "alg"
/// names no digest.
std::string SignedToken(const Json::Value &header, const Json::Value &claims, const std::string &secret = kSecret);

std::string TokenResponse(const std::string &idToken);

/// The provider's key set, with changes to its only key.
std::string KeySet(const std::string &changes = "{}");

/// A provider, and the appliance's configuration for it.
class Provider {
  public:
    /// Applies `changes` to the client's configuration file. Replaces $BASE in them and in every answer by its URL.
    explicit Provider(Profile profile, const std::string &changes = "{}");

    void Answer(const std::string &body);
    void AnswerByteByByte(const std::string &answer);
    void Play(const Script &script);

    /// Answers with the discovery document and the key set, if the profile uses them.
    void AnswerVerification();

    /// Answers with the token and the documents to verify it.
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

/// The requests of a successful login.
std::vector<std::string> AllRequestLines(Profile profile);

}  // namespace Test

#endif
