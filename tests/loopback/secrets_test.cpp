#include <gmock/gmock.h>

#include <memory>
#include <new>
#include <string>
#include <vector>

#include "jwt/jwt.h"
#include "sso/sso.h"
#include "tests/loopback/loopback_provider.h"
#include "tests/support/encoding.h"
#include "tests/support/files.h"
#include "tests/support/interposed/memory.h"
#include "tests/support/interposed/releases.h"
#include "tests/support/system_log.h"
#include "tests/support/token.h"

// The secrets of a login: the client secret, the code, and the answers of the provider.
namespace Test {

namespace {

using ::testing::Each;
using ::testing::Field;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;

/// The text plain, percent-encoded and in base64.
std::vector<std::string> FormsOf(const std::string &text) { return {text, TAVO::SSO::URLEncode(text), Base64(text)}; }

class Secrets : public ::testing::TestWithParam<Profile> {
  protected:
    static constexpr char kCode[] = "a code & long enough for a heap allocation";
    static constexpr char kAccessToken[] = "an access token that was not requested";

    static std::string Claims() { return Compact(TokenClaims(GetParam())); }

    static std::vector<std::string> All() {
        std::vector<std::string> secrets = FormsOf(kSecret);
        for (const std::string &form : FormsOf(kCode)) {
            secrets.push_back(form);
        }
        secrets.insert(secrets.end(), {kAccessToken, Claims(), "&client_secret="});
        return secrets;
    }

    static std::string FailureOfLogin() {
        std::string userName;
        try {
            TAVO::SSO::OIDCLogin(kCode, userName);
        } catch (const std::exception &error) {
            return error.what();
        }
        return {};
    }

    /// All secrets, the token and its parts.
    static std::vector<std::string> AllWith(const std::string &token) {
        std::vector<std::string> secrets = All();
        const std::size_t firstDot = token.find('.');
        const std::size_t lastDot = token.rfind('.');
        secrets.insert(secrets.end(),
                       {token, token.substr(firstDot + 1, lastDot - firstDot - 1), token.substr(lastDot + 1)});
        return secrets;
    }

    static std::string Answer(const std::string &token) {
        return R"({"access_token": ")" + std::string(kAccessToken) + R"(", "id_token": ")" + token + "\"}";
    }

    template <typename Client>
    static std::unique_ptr<TAVO::SSO::SSOClient, void (*)(TAVO::SSO::SSOClient *)> Make() {
        return {new Client(), [](TAVO::SSO::SSOClient *client) { delete static_cast<Client *>(client); }};
    }

    static auto MakeClient(Profile profile) {
        return profile == Profile::kAzure ? Make<TAVO::SSO::AzureSSOClient>() : Make<TAVO::SSO::WebSphereSSOClient>();
    }

    static std::vector<std::string> PiecesOf(const std::string &text, std::size_t length) {
        std::vector<std::string> pieces;
        for (std::size_t at = 0; at < text.size(); at += length) {
            pieces.push_back(text.substr(at, length));
        }
        return pieces;
    }
};

INSTANTIATE_TEST_SUITE_P(Of, Secrets, ::testing::Values(Profile::kAzure, Profile::kWebSphere),
                         [](const auto &row) { return Name(row.param); });

TEST_P(Secrets, AreOverwrittenBeforeRelease) {
    // The file exceeds one read and the answer arrives in pieces, so texts grow and move in memory.
    Provider provider(GetParam(), Compact(Change({}, R"({"z": ")" + std::string(10000, ' ') + "\"}")));
    const std::string token = SignedToken(TokenHeader(GetParam()), TokenClaims(GetParam()));
    provider.AnswerByteByByte(ChunkedHTTPAnswer(PiecesOf(Answer(token), 50)));
    provider.AnswerVerification();
    const std::vector<std::string> secrets = AllWith(token);
    std::string userName;
    const std::string code = kCode;
    const WatchReleases releases(secrets);
    TAVO::SSO::OIDCLogin(code, userName);
    EXPECT_EQ(userName, UserName(GetParam()));
    EXPECT_GT(releases.Blocks(), 100U);
    EXPECT_THAT(releases.Found(), IsEmpty());
}

TEST_P(Secrets, AreOverwrittenWhenReplaced) {
    Provider provider(GetParam());
    const std::unique_ptr<TAVO::SSO::SSOClient, void (*)(TAVO::SSO::SSOClient *)> client = MakeClient(GetParam());
    // Without the first character: clearing a string overwrites it with a NUL.
    const std::string token = SignedToken(TokenHeader(GetParam()), TokenClaims(GetParam()));
    const std::vector<std::string> secrets{token.substr(1), std::string(kCode).substr(1)};
    const std::string answer = Answer(token);
    const std::string nextAnswer = Answer("another token that is long enough for a heap allocation");
    client->SetCode(kCode);
    client->ProcessTokenResponse(answer);
    const WatchReleases releases(secrets);
    client->SetCode("another code that is long enough for a heap allocation");
    client->ProcessTokenResponse(nextAnswer);
    EXPECT_GT(releases.Blocks(), 0U);
    EXPECT_THAT(releases.Found(), IsEmpty());
}

/// Tokens that fail at each step of the verification and after it.
std::vector<std::string> RefusedTokens(Profile profile) {
    const Json::Value header = TokenHeader(profile);
    const Json::Value claims = TokenClaims(profile);
    std::vector<std::string> tokens{
        "no token",
        "bm8gSlNPTi4gQnV0IGxvbmcgZW5vdWdoIGZvciBtZW1vcnkgb2YgaXRzIG93bg." + Base64Url(Compact(claims)) + ".c2ln",
        Base64Url(Compact(header)) + ".bm8gSlNPTi4gQnV0IGxvbmcgZW5vdWdoIGZvciBtZW1vcnkgb2YgaXRzIG93bg.c2ln",
        SignedToken(header, Change(claims, R"({"exp": 1})")),
        SignedToken(header, Change(claims, R"({"aud": "another"})")),
        SignedToken(Change(header, R"({"alg": "none"})"), claims),
        SignedToken(header, Change(claims, R"({"unique_name": null, "email": null, "sub": null})")),
    };
    for (const char *bits : {"256", "384", "512"}) {
        const std::string algorithm = (profile == Profile::kAzure ? "RS" : "HS") + std::string(bits);
        tokens.push_back(SignedToken(Change(header, "{\"alg\": \"" + algorithm + "\"}"), claims) + "x");
    }
    return tokens;
}

/// Answers of the token endpoint that fail at each step.
std::vector<std::string> Failures(Profile profile) {
    std::vector<std::string> answers{
        "not JSON",
        R"({"error": "invalid_grant", "error_description": "the code is used up"})",
        R"({"access_token": "none for you"})",
    };
    for (const std::string &token : RefusedTokens(profile)) {
        answers.push_back(TokenResponse(token));
    }
    return answers;
}

TEST_P(Secrets, AreOverwrittenWhenLoginFails) {
    for (const std::string &token : RefusedTokens(GetParam())) {
        Provider provider(GetParam());
        provider.AnswerByteByByte(HTTPAnswer(TokenResponse(token)));
        provider.AnswerVerification();
        const std::vector<std::string> secrets = token == "no token" ? All() : AllWith(token);
        const WatchReleases releases(secrets);
        EXPECT_NE(FailureOfLogin(), "");
        EXPECT_GT(releases.Blocks(), 100U);
        EXPECT_THAT(releases.Found(), IsEmpty()) << token;
    }
}

TEST_P(Secrets, AreOverwrittenWhenAnswerIsNotJSON) {
    Provider provider(GetParam());
    const std::string token = SignedToken(TokenHeader(GetParam()), TokenClaims(GetParam()));
    provider.AnswerByteByByte(HTTPAnswer("[" + Answer(token) + ", cut off"));
    const std::vector<std::string> secrets = AllWith(token);
    const WatchReleases releases(secrets);
    EXPECT_EQ(FailureOfLogin(), "parse json falied");
    EXPECT_GT(releases.Blocks(), 100U);
    EXPECT_THAT(releases.Found(), IsEmpty());
}

TEST_P(Secrets, AreOverwrittenWhenFileIsNotJSON) {
    WriteFile(GetParam() == Profile::kAzure ? kAzureFile : kWebSphereFile,
              R"({"secret": ")" + std::string(kSecret) + R"(", "cut off": )" + std::string(5000, ' '));
    const std::vector<std::string> secrets = All();
    const WatchReleases releases(secrets);
    EXPECT_EQ(MakeClient(GetParam())->GetClientSecret(), "");
    EXPECT_GT(releases.Blocks(), 0U);
    EXPECT_THAT(releases.Found(), IsEmpty());
}

TEST_P(Secrets, AreOverwrittenWhenMemoryRunsOut) {
    const Provider provider(GetParam());
    const auto client = MakeClient(GetParam());
    client->SetCode(kCode);
    const std::vector<std::string> secrets = All();
    int n = 0;
    for (bool ranOut = true; ranOut;) {
        const WatchReleases releases(secrets);
        FailingAllocation failing(++n, FailingAllocation::Of::kCxx);
        try {
            client->GetIDTokenReqParams();
        } catch (const std::bad_alloc &) {
        }
        failing.Stop();
        ranOut = failing.Happened();
        EXPECT_THAT(releases.Found(), IsEmpty()) << n;
    }
    EXPECT_GT(n, 10);
}

TEST(LargeParts, AreOverwrittenCompletely) {
    const std::string filler(10000, 'x');
    const std::string endOfClaims = R"(","sub":"the last of the claims"})";
    const std::string endOfSecret = "the last of the secret";
    const std::string body = Base64Url("{\"filler\":\"" + filler + endOfClaims);
    const std::string secret = filler + endOfSecret;
    const std::string input = "e30." + body;
    const std::string token = input + "." + SignHMAC(input, secret, EVP_sha256());
    std::string key = Base64(secret);
    std::string otherKey = Base64("x" + secret);
    const std::vector<std::string> secrets{endOfClaims, endOfSecret, body.substr(body.size() - 20),
                                           key.substr(key.size() - 20), otherKey.substr(otherKey.size() - 20)};
    const WatchReleases releases(secrets);
    {
        TAVO::JWT::Jwt jwt(token);
        EXPECT_EQ(jwt.GetBody()["sub"], "the last of the claims");
        jwt.JwtHMACVerify(key, EVP_sha256());
        EXPECT_THROW(jwt.JwtHMACVerify(otherKey, EVP_sha256()), TAVO::JWT::jwt_verify_failed);
    }
    EXPECT_GT(releases.Blocks(), 10U);
    EXPECT_THAT(releases.Found(), IsEmpty());
}

TEST_P(Secrets, AppearInNoLogLineOrException) {
    for (const std::string &answer : Failures(GetParam())) {
        Provider provider(GetParam());
        provider.AnswerByteByByte(HTTPAnswer(answer));
        provider.AnswerVerification();
        const std::string failure = FailureOfLogin();
        EXPECT_NE(failure, "");
        const std::vector<LogLine> log = TakeSystemLog();
        for (const std::string &secret : All()) {
            EXPECT_THAT(failure, Not(HasSubstr(secret)));
            EXPECT_THAT(log, Each(Field(&LogLine::text, Not(HasSubstr(secret)))));
        }
    }
}

}  // namespace

}  // namespace Test
