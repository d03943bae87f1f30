#include <gmock/gmock.h>

#include <ostream>
#include <stdexcept>
#include <string>
#include <tuple>

#include "jwt/jwt.h"
#include "tests/loopback/loopback_provider.h"
#include "tests/support/server.h"

// Logins with tokens of all sizes. OpenSSL's base64 filter works in blocks of 1024 characters and buffers depend on the
// size, so the sizes cover different code paths.
namespace Test {

namespace {

using ::testing::Combine;
using ::testing::Values;

constexpr std::size_t kHuge = std::size_t{30} << 20;

struct Size {
    const char *name;
    std::size_t atLeast;
    std::size_t below;
};

void PrintTo(const Size &size, std::ostream *stream) { *stream << size.name; }

/// A signed token with about `more` additional bytes in its claims.
std::string TokenWith(Profile profile, std::size_t more) {
    Json::Value claims = TokenClaims(profile);
    claims["groups"] = std::string(more, 'g');
    return SignedToken(TokenHeader(profile), claims);
}

std::string BodyOf(const std::string &token) {
    const std::size_t start = token.find('.') + 1;
    return token.substr(start, token.rfind('.') - start);
}

class TokenOfSize : public ::testing::TestWithParam<std::tuple<Profile, Size>> {
  protected:
    static Profile profile() { return std::get<0>(GetParam()); }

    static std::string Token() {
        const Size size = std::get<1>(GetParam());
        const std::size_t alone = BodyOf(TokenWith(profile(), 0)).size();
        std::string token = TokenWith(profile(), size.atLeast > alone ? (size.atLeast - alone) * 3 / 4 + 1 : 0);
        EXPECT_GE(BodyOf(token).size(), size.atLeast);
        EXPECT_LT(BodyOf(token).size(), size.below);
        return token;
    }
};

TEST_P(TokenOfSize, LogsUserIn) {
    Provider provider(profile());
    provider.AnswerLogin(Token());
    EXPECT_EQ(provider.LogIn(), LoggedIn(UserName(profile())));
}

TEST_P(TokenOfSize, RejectsBodyWithoutLastCharacter) {
    std::string token = Token();
    token.erase(token.rfind('.') - 1, 1);
    Provider provider(profile());
    provider.AnswerLogin(token);
    const Outcome outcome = provider.LogIn();
    EXPECT_NE(outcome.exception, "");
    EXPECT_EQ(outcome.userName, kUserNameBefore);
}

TEST_P(TokenOfSize, RejectsChangedCharacterInBody) {
    std::string token = Token();
    // Changes a letter of the long claim or of a member's name. The result may be invalid JSON.
    char &letter = token[token.find('.') + BodyOf(token).size() / 2];
    letter = letter == 'Z' ? 'W' : 'Z';
    Provider provider(profile());
    provider.AnswerLogin(token);
    const Outcome outcome = provider.LogIn();
    EXPECT_NE(outcome.exception, "");
    EXPECT_EQ(outcome.userName, kUserNameBefore);
}

INSTANTIATE_TEST_SUITE_P(
    Of, TokenOfSize,
    Combine(Values(Profile::kAzure, Profile::kWebSphere),
            Values(Size{"Below1KB", 0, 1024}, Size{"Above1KB", 1025, 2048}, Size{"Above3KB", 3073, 4096},
                   Size{"Above4KB", 4608, 5120}, Size{"100KB", 100 * 1024, 101 * 1024})),
    [](const auto &row) { return ::testing::PrintToString(std::get<0>(row.param)) + std::get<1>(row.param).name; });

class HugeAnswer : public ::testing::TestWithParam<Profile> {
  protected:
    static Outcome LogInWithToken(const std::string &token) {
        Provider provider(GetParam());
        provider.AnswerLogin(token);
        return provider.LogIn();
    }

    static Outcome LogInWithAnswer(const std::string &body) {
        Provider provider(GetParam());
        provider.AnswerByteByByte(HTTPAnswer(body));
        return provider.LogIn();
    }
};

INSTANTIATE_TEST_SUITE_P(Of, HugeAnswer, Values(Profile::kAzure, Profile::kWebSphere),
                         ::testing::PrintToStringParamName());

TEST_P(HugeAnswer, LogsUserInWithSignedToken) {
    const std::string token = TokenWith(GetParam(), kHuge * 3 / 4);
    EXPECT_GE(token.size(), kHuge);
    EXPECT_EQ(LogInWithToken(token), LoggedIn(UserName(GetParam())));
}

TEST_P(HugeAnswer, RejectsTokenOfOnePart) {
    EXPECT_EQ(LogInWithToken(std::string(kHuge, 'A')), Refused<std::invalid_argument>("bad jwt format!"));
}

TEST_P(HugeAnswer, RejectsTokenOfThreeGarbageParts) {
    const std::string part(kHuge / 3, 'A');
    EXPECT_EQ(LogInWithToken(part + "." + part + "." + part), Refused<std::invalid_argument>("bad jwt header format!"));
}

TEST_P(HugeAnswer, RejectsLongSignature) {
    std::string token = TokenWith(GetParam(), 0);
    const bool azure = GetParam() == Profile::kAzure;
    EXPECT_EQ(
        LogInWithToken(token + std::string(kHuge, 'A')),
        Refused<TAVO::JWT::jwt_verify_failed>(azure ? "verify rsa signature failed" : "verify hmac signature failed"));
}

TEST_P(HugeAnswer, RejectsDeeplyNestedJSON) {
    EXPECT_EQ(LogInWithAnswer(std::string(kHuge, '[')), Refused<std::invalid_argument>("parse json falied"));
}

TEST_P(HugeAnswer, RejectsInvalidJSON) {
    EXPECT_EQ(LogInWithAnswer(std::string(kHuge, 'x')), Refused<std::invalid_argument>("parse json falied"));
}

}  // namespace

}  // namespace Test
