// Verification of a WebSphere ID token. Input lines: the client secret and the token. An input is accepted if the token
// is trusted.
#include "jwt/jwt.h"
#include "sso/sso.h"
#include "tests/fuzz/oracle.h"
#include "tests/fuzz/target.h"
#include "tests/fuzz/token_oracle.h"
#include "tests/support/interposed/clock.h"

namespace Fuzz {

namespace {

constexpr char kClientID[] = "client-of-this-appliance";
constexpr std::size_t kLongestSecret = 765;

struct Client : TAVO::SSO::WebSphereSSOClient {
    Client(const std::string &secret, const std::string &idToken) {
        clientID = kClientID;
        clientSecret = secret;
        token = idToken;
    }
};

/// The expected verification.
void Verify(const std::string &secret, const std::string &idToken) {
    const ExpectedToken token(idToken);
    token.CheckExpiry();
    token.CheckMember("aud", kClientID, "client ID invalid");
    const EVP_MD *digest = token.ChooseDigest("HS");
    if (secret.size() > kLongestSecret) {
        throw TAVO::SSO::sso_op_failed("encode base64 failed.");
    }
    if (secret.empty() || HMACSignature(secret, token.signingInput, digest) != UpToNUL(token.signature)) {
        throw TAVO::JWT::jwt_verify_failed("verify hmac signature failed");
    }
}

}  // namespace

bool Accepts(const std::string &input) {
    const std::vector<std::string> lines = Lines(input, 2);
    const std::string &secret = lines[0];
    const std::string &token = lines[1];
    Test::SetClock(kNow);
    Client client(secret, token);
    const Test::Failure failure = FailureOf([&] { client.VerifyIDToken(); });

    const Test::Failure expected = Test::FailureOf([&] { Verify(secret, token); });
    RequireVerdict(failure, expected, IsCertain(token),
                   {Test::Fails<TAVO::JWT::jwt_verify_failed>("verify hmac signature failed"),
                    Test::Fails<TAVO::SSO::sso_op_failed>("encode base64 failed.")});
    RequireLog({});
    Require(client.GetToken() == token && client.GetClientSecret() == secret, "the client has changed");
    return failure == Test::kNothingThrown;
}

}  // namespace Fuzz
