#include <tuple>

#include "jwt/jwt.h"
#include "tests/support/encoding.h"
#include "tests/support/interposed/calls.h"
#include "tests/support/interposed/clock.h"
#include "tests/support/interposed/platform_calls.h"
#include "tests/support/interposed/process.h"
#include "tests/support/interposed/transport.h"
#include "tests/support/token.h"
#include "tests/unit/clients.h"
#include "tests/unit/fixture.h"
#include "tests/unit/user_identity.h"

namespace Test {

namespace {

using namespace TAVO::SSO;
using TAVO::JWT::jwt_not_support;
using TAVO::JWT::jwt_verify_failed;

class WebSphereConfiguration : public Library {
  protected:
    static WebSphereClient ReadFrom(const std::string &file) {
        WriteFile(kWebSphereFile, file);
        return {};
    }

    static std::string AllFieldsOf(WebSphereClient client) {
        return client.GetWellknownEndpoint() + client.GetClientID() + client.GetClientSecret() +
               client.GetAuthEndpoint() + client.GetTokenEndpoint() + client.GetRedirectURI() +
               client.GetLogoutEndpoint() + client.code + client.GetToken();
    }
};

TEST_F(WebSphereConfiguration, ReadsEachKeyAndStaysDisabled) {
    WebSphereClient client = ReadFrom(R"({
        "websphere_wellknown": "the wellknown",
        "websphere_client_id": "the id",
        "websphere_client_secret": "made-up",
        "websphere_authorization_endpoint": "the authorization",
        "websphere_token_endpoint": "the token endpoint",
        "websphere_redirect_uri": "the redirect",
        "websphere_logout_endpoint": "the logout",
        "websphere_sso_enable": true, "enable": true, "code": "no code", "token": "no token"})");
    EXPECT_FALSE(client.isEnable());
    EXPECT_EQ(client.GetWellknownEndpoint(), "the wellknown");
    EXPECT_EQ(client.GetClientID(), "the id");
    EXPECT_EQ(client.GetClientSecret(), "made-up");
    EXPECT_EQ(client.GetAuthEndpoint(), "the authorization");
    EXPECT_EQ(client.GetTokenEndpoint(), "the token endpoint");
    EXPECT_EQ(client.GetRedirectURI(), "the redirect");
    EXPECT_EQ(client.GetLogoutEndpoint(), "the logout");
    EXPECT_EQ(client.code, "");
    EXPECT_EQ(client.GetToken(), "");
}

TEST_F(WebSphereConfiguration, IgnoresNumericClientID) {
    WebSphereClient client = ReadFrom(R"({"websphere_client_id": 5, "websphere_redirect_uri": "the redirect"})");
    EXPECT_EQ(client.GetClientID(), "");
    EXPECT_EQ(client.GetRedirectURI(), "the redirect");
}

TEST_F(WebSphereConfiguration, StaysEmptySilentlyForMalformedFile) {
    EXPECT_EQ(AllFieldsOf({}), "");
    for (const char *file : {"", "{", "[]", "5", R"({"websphere_client_id": "the id")"}) {
        EXPECT_EQ(AllFieldsOf(ReadFrom(file)), "") << file;
    }
}

TEST_F(WebSphereConfiguration, ChangesNoIdsAsRoot) {
    SetEffectiveIDs(0, 0);
    ReadFrom("{}");
    EXPECT_THAT(TakeSetIDCalls(), testing::IsEmpty());
}

TEST_F(WebSphereConfiguration, ReadsFileOnceAtConstruction) {
    WebSphereClient client = ReadFrom(R"({"websphere_client_id": "first"})");
    WriteFile(kWebSphereFile, R"({"websphere_client_id": "second"})");
    EXPECT_EQ(client.GetClientID(), "first");
}

class WebSphereTokenResponse : public Library {};

TEST_F(WebSphereTokenResponse, ReportsErrorOnlyAsMissingToken) {
    WebSphereClient client;
    client.token = "earlier";
    EXPECT_EQ(FailureOf([&] { client.ProcessTokenResponse(R"({"error": "invalid_grant"})"); }),
              Fails<sso_err_resp>("we cannot find key 'id_token' in response!"));
    EXPECT_EQ(client.GetToken(), "");
}

TEST_F(WebSphereTokenResponse, IgnoresErrorNextToToken) {
    WebSphereClient client;
    client.ProcessTokenResponse(R"({"error": "invalid_grant", "id_token": "h.b.s"})");
    EXPECT_EQ(client.GetToken(), "h.b.s");
}

constexpr std::time_t kNow = 1700000000;
const Failure &kVerified = kNothingThrown;
const auto kExpired = Fails<std::invalid_argument>("id_token expired.");
const auto kWrongAudience = Fails<std::invalid_argument>("client ID invalid");
const auto kNotEncoded = Fails<sso_op_failed>("encode base64 failed.");
const auto kBadSignature = Fails<jwt_verify_failed>("verify hmac signature failed");

class WebSphereVerification : public Library {
  protected:
    void SetUp() override {
        Library::SetUp();
        SetClock(kNow);
        client.clientID = "the id";
        client.clientSecret = "made-up";
        header = Parse(R"({"alg": "HS256"})");
        claims = Parse(R"({"aud": "the id"})");
        claims["exp"] = static_cast<Json::Int64>(kNow);
    }

    void TearDown() override {
        EXPECT_THAT(CurrentTransport().calls, testing::IsEmpty()) << "verification sends no request";
        Library::TearDown();
    }

    /// Verifies a token of `header` and `claims`, signed with the secret.
    Failure Verify(const EVP_MD *digest = EVP_sha256(), const std::string &secret = "made-up") {
        const std::string signingInput = SigningInput(header, claims);
        return VerifyToken(signingInput + "." + SignHMAC(signingInput, secret, digest));
    }

    Failure VerifyToken(const std::string &token) {
        client.token = token;
        return FailureOf([this] { client.VerifyIDToken(); });
    }

    WebSphereClient client;
    Json::Value header;
    Json::Value claims;
};

TEST_F(WebSphereVerification, VerifiesSameTokenTwice) {
    EXPECT_EQ(Verify(), kVerified);
    EXPECT_EQ(FailureOf([this] { client.VerifyIDToken(); }), kVerified);
}

TEST_F(WebSphereVerification, VerifiesHS384AndHS512) {
    header["alg"] = "HS384";
    EXPECT_EQ(Verify(EVP_sha384()), kVerified);
    header["alg"] = "HS512";
    EXPECT_EQ(Verify(EVP_sha512()), kVerified);
    EXPECT_EQ(Verify(EVP_sha256()), kBadSignature);
}

TEST_F(WebSphereVerification, RejectsEmptyToken) {
    EXPECT_EQ(VerifyToken(""), Fails<std::invalid_argument>("token cannot be empty"));
}

TEST_F(WebSphereVerification, RejectsMalformedToken) {
    EXPECT_EQ(VerifyToken("a.b.c.d"), Fails<std::invalid_argument>("bad jwt format!"));
    EXPECT_EQ(VerifyToken("bm8.e30.c2ln"), Fails<std::invalid_argument>("bad jwt header format!"));
    EXPECT_EQ(VerifyToken("e30.bm8.c2ln"), Fails<std::invalid_argument>("bad jwt body format!"));
    EXPECT_EQ(VerifyToken("e30..c2ln").type, typeid(std::logic_error).name());
}

TEST_F(WebSphereVerification, AcceptsTokenExpiringInThisSecond) {
    EXPECT_EQ(Verify(), kVerified);
    claims["exp"] = static_cast<Json::Int64>(kNow - 1);
    EXPECT_EQ(Verify(), kExpired);
}

TEST_F(WebSphereVerification, TreatsUnreadableExpiryAsExpired) {
    for (const char *exp : {"null", "\"\"", "\"soon\"", "[1700000000]", "{}", "-1"}) {
        claims["exp"] = Parse(std::string("[") + exp + "]")[0];
        EXPECT_EQ(Verify(), kExpired) << exp;
    }
    claims.removeMember("exp");
    EXPECT_EQ(Verify(), kExpired);
}

TEST_F(WebSphereVerification, ChecksExpiryThenAudienceThenAlgorithm) {
    claims["aud"] = "another";
    header["alg"] = "none";
    EXPECT_EQ(Verify(), kWrongAudience);
    claims["exp"] = 1;
    EXPECT_EQ(Verify(), kExpired);
}

TEST_F(WebSphereVerification, ComparesAudienceExactlyAndRejectsList) {
    for (const char *audience : {"\"The id\"", "\"the id \"", "null", "[\"the id\"]", "{\"the id\": 1}"}) {
        claims["aud"] = Parse(std::string("[") + audience + "]")[0];
        EXPECT_EQ(Verify(), kWrongAudience) << audience;
    }
    client.clientID = "";
    claims["aud"] = Json::arrayValue;
    EXPECT_EQ(Verify(), kWrongAudience) << "a list is not the empty text";
}

TEST_F(WebSphereVerification, RejectsOtherAlgorithms) {
    for (const char *algorithm : {"RS256", "none", "hs256", "HS256 ", "HS1", ""}) {
        header["alg"] = algorithm;
        EXPECT_EQ(Verify(), Fails<jwt_not_support>(std::string(algorithm) + " algorithm is not supported"));
    }
}

TEST_F(WebSphereVerification, ReportsMissingAlgorithmAsEmptyName) {
    header.removeMember("alg");
    EXPECT_EQ(Verify(), Fails<jwt_not_support>(" algorithm is not supported"));
}

TEST_F(WebSphereVerification, ChecksAlgorithmBeforeSecret) {
    client.clientSecret = std::string(766, 'x');
    header["alg"] = "none";
    EXPECT_EQ(Verify(), Fails<jwt_not_support>("none algorithm is not supported"));
}

TEST_F(WebSphereVerification, RejectsAnotherSecret) {
    client.clientSecret = "another";
    EXPECT_EQ(Verify(), kBadSignature);
}

TEST_F(WebSphereVerification, RejectsTokenSignedWithEmptySecret) {
    client.clientSecret = "";
    EXPECT_EQ(Verify(EVP_sha256(), ""), kBadSignature);
}

TEST_F(WebSphereVerification, AcceptsSecretUpTo765Bytes) {
    client.clientSecret = std::string(765, '\xff');
    EXPECT_EQ(Verify(EVP_sha256(), client.clientSecret), kVerified);
    client.clientSecret += '\xff';
    EXPECT_EQ(Verify(EVP_sha256(), client.clientSecret), kNotEncoded);
}

TEST_F(WebSphereVerification, UsesAllBytesOfSecretAsKey) {
    client.clientSecret = std::string("a\0b", 3);
    EXPECT_EQ(Verify(EVP_sha256(), client.clientSecret), kVerified);
    EXPECT_EQ(Verify(EVP_sha256(), "a"), kBadSignature);
}

TEST_F(WebSphereVerification, PassesZeroedBufferAndFlagsToEncoder) {
    Platform platform;
    platform.encode = [](const std::string &src, char *dst, int flag1, std::size_t size, int flag2, int flag3) {
        EXPECT_EQ(src.size(), 7u);
        EXPECT_EQ(flag1, 1);
        EXPECT_EQ(size, 1024u);
        EXPECT_EQ(flag2, 0);
        EXPECT_EQ(flag3, 1);
        EXPECT_EQ(std::string(dst, size), std::string(1024, '\0'));
        std::fill_n(dst, size, 'A');  // fills the buffer, without a NUL
        return -1;                    // every value except 0 is success
    };
    ReplacePlatform(platform);
    EXPECT_EQ(Verify(EVP_sha256(), std::string(768, '\0')), kVerified);
}

/// An algorithm, and whether the token is signed with the client's secret.
using Signing = std::tuple<const char *, bool>;

class WebSphereSecret : public WebSphereVerification, public testing::WithParamInterface<Signing> {
  protected:
    static const EVP_MD *Digest(const std::string &algorithm) {
        return algorithm == "HS256" ? EVP_sha256() : algorithm == "HS384" ? EVP_sha384() : EVP_sha512();
    }
};

INSTANTIATE_TEST_SUITE_P(, WebSphereSecret,
                         testing::Combine(testing::Values("HS256", "HS384", "HS512"), testing::Bool()),
                         [](const auto &row) {
                             return std::string(std::get<0>(row.param)) +
                                    (std::get<1>(row.param) ? "GoodSignature" : "BadSignature");
                         });

TEST_P(WebSphereSecret, IsOverwrittenInEachForm) {
    const auto &[algorithm, isGood] = GetParam();
    client.clientSecret = "a secret that is long enough";
    header["alg"] = algorithm;
    TakeCleansed();
    EXPECT_EQ(Verify(Digest(algorithm), isGood ? client.clientSecret : "another"), isGood ? kVerified : kBadSignature);
    const std::vector<std::string> cleansed = TakeCleansed();
    const std::string form = "YSBzZWNyZXQgdGhhdCBpcyBsb25nIGVub3VnaA==";
    EXPECT_THAT(cleansed, testing::Contains(testing::AllOf(testing::StartsWith(form), testing::SizeIs(1024))))
        << "the encoder's buffer";
    EXPECT_THAT(cleansed, testing::Contains(form)) << "the key text";
    EXPECT_THAT(cleansed, testing::Contains(form + std::string(1, '\0'))) << "the decoder's scratch space";
    EXPECT_THAT(cleansed, testing::Contains(testing::StartsWith(client.clientSecret))) << "the decoded key";
    const std::string signature = SignHMAC(SigningInput(header, claims), client.clientSecret, Digest(algorithm));
    const auto macSize = static_cast<std::size_t>(EVP_MD_get_size(Digest(algorithm)));
    EXPECT_THAT(cleansed,
                testing::Contains(testing::ResultOf(
                    [&](const std::string &memory) { return Base64Url(memory.substr(0, macSize)); }, signature)))
        << "the MAC";
    EXPECT_THAT(cleansed, testing::Contains(testing::StartsWith(signature))) << "the text of the MAC";
}

TEST_F(WebSphereVerification, IgnoresKid) {
    header["kid"] = "key 1";
    EXPECT_EQ(Verify(), kVerified);
}

class WebSphereIdentity : public Identity<WebSphereClient> {};

const Failure &kNamed = kNothingThrown;

TEST_F(WebSphereIdentity, ReturnsSubjectUnchangedAndIgnoresEmail) {
    EXPECT_EQ(NameOf(R"({"sub": " Alice@Corp ", "email": "bob@corp.example.net"})"), kNamed);
    EXPECT_EQ(userName, " Alice@Corp ");
}

TEST_F(WebSphereIdentity, AcceptsEmptySubject) {
    EXPECT_EQ(NameOf(R"({"sub": ""})"), kNamed);
    EXPECT_EQ(userName, "");
}

TEST_F(WebSphereIdentity, RequiresStringSubject) {
    const auto notFound = Fails<std::invalid_argument>("cannot find the user name!");
    for (const char *claims : {R"({"sub": 5})", R"({"sub": null})", R"({"email": "bob@corp"})", "[\"sub\"]", "5"}) {
        EXPECT_EQ(NameOf(claims), notFound) << claims;
        EXPECT_EQ(userName, "before") << claims;
    }
}

}  // namespace

}  // namespace Test
