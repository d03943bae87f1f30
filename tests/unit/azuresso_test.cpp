#include <locale>

#include "jwt/jwt.h"
#include "tests/support/conversion.h"
#include "tests/support/encoding.h"
#include "tests/support/interposed/clock.h"
#include "tests/support/interposed/memory.h"
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
using testing::ElementsAre;
using testing::IsEmpty;

constexpr char kEveryKey[] = R"({
    "azure_sso_enable": true,
    "azure_wellknown": "the wellknown",
    "azure_client_id": "the id",
    "azure_client_secret": "made-up",
    "azure_tenant_id": "the tenant",
    "azure_authorization_endpoint": "the authorization",
    "azure_token_endpoint": "the token endpoint",
    "azure_redirect_uri": "the redirect",
    "azure_logout_endpoint": "the logout",
    "code": "no code", "token": "no token", "other": [1, 2]})";

class AzureConfiguration : public Library {
  protected:
    static AzureClient ReadFrom(const std::string &file) {
        WriteFile(kAzureFile, file);
        return {};
    }

    static void ExpectDefaults(AzureClient client) {
        EXPECT_FALSE(client.isEnable());
        for (const std::string &text :
             {client.GetWellknownEndpoint(), client.GetClientID(), client.GetClientSecret(), client.tenantID,
              client.GetAuthEndpoint(), client.GetTokenEndpoint(), client.GetRedirectURI(), client.GetLogoutEndpoint(),
              client.code, client.GetToken()}) {
            EXPECT_EQ(text, "");
        }
    }
};

TEST_F(AzureConfiguration, ReadsEachKey) {
    AzureClient client = ReadFrom(kEveryKey);
    EXPECT_TRUE(client.isEnable());
    EXPECT_EQ(client.GetWellknownEndpoint(), "the wellknown");
    EXPECT_EQ(client.GetClientID(), "the id");
    EXPECT_EQ(client.GetClientSecret(), "made-up");
    EXPECT_EQ(client.tenantID, "the tenant");
    EXPECT_EQ(client.GetAuthEndpoint(), "the authorization");
    EXPECT_EQ(client.GetTokenEndpoint(), "the token endpoint");
    EXPECT_EQ(client.GetRedirectURI(), "the redirect");
    EXPECT_EQ(client.GetLogoutEndpoint(), "the logout");
    EXPECT_EQ(client.code, "");
    EXPECT_EQ(client.GetToken(), "");
}

TEST_F(AzureConfiguration, KeepsDefaultsSilentlyWithoutFile) { ExpectDefaults({}); }

TEST_F(AzureConfiguration, KeepsDefaultsSilentlyForMalformedFile) {
    ExpectDefaults(ReadFrom(""));
    ExpectDefaults(ReadFrom(R"({"azure_sso_enable": true, "azure_client_id": "the id", )"));
    ExpectDefaults(ReadFrom("[]"));
    ExpectDefaults(ReadFrom("\"text\""));
    ExpectDefaults(ReadFrom(std::string(2000, '[')));
}

TEST_F(AzureConfiguration, IgnoresEnableAsString) {
    AzureClient client = ReadFrom(R"({"azure_sso_enable": "true", "azure_client_id": "the id"})");
    EXPECT_FALSE(client.isEnable());
    EXPECT_EQ(client.GetClientID(), "the id");
}

TEST_F(AzureConfiguration, IgnoresMembersOfAnotherType) {
    AzureClient client = ReadFrom(R"({"azure_wellknown": 1, "azure_client_id": null, "azure_client_secret": [],
        "azure_tenant_id": 5, "azure_authorization_endpoint": {}, "azure_token_endpoint": true,
        "azure_redirect_uri": 1.5, "azure_logout_endpoint": "the logout"})");
    EXPECT_EQ(client.tenantID, "");
    EXPECT_EQ(client.GetWellknownEndpoint() + client.GetClientID() + client.GetClientSecret() +
                  client.GetAuthEndpoint() + client.GetTokenEndpoint() + client.GetRedirectURI(),
              "");
    EXPECT_EQ(client.GetLogoutEndpoint(), "the logout");
}

TEST_F(AzureConfiguration, ReadsFileOnceAtConstruction) {
    AzureClient client = ReadFrom(R"({"azure_client_id": "first"})");
    WriteFile(kAzureFile, R"({"azure_client_id": "second"})");
    EXPECT_EQ(client.GetClientID(), "first");
}

class AzureTokenResponse : public Library {};

TEST_F(AzureTokenResponse, ThrowsCompactResponseWithLineFeedOnError) {
    AzureClient client;
    client.token = "earlier";
    EXPECT_EQ(
        FailureOf([&] {
            client.ProcessTokenResponse(R"({"id_token": "h.b.s", "error": "invalid_grant", "error_codes": [70]})");
        }),
        Fails<sso_err_resp>("{\"error\":\"invalid_grant\",\"error_codes\":[70],\"id_token\":\"h.b.s\"}\n"));
    EXPECT_EQ(client.GetToken(), "");
}

TEST_F(AzureTokenResponse, TreatsAnyErrorMemberAsError) {
    AzureClient client;
    EXPECT_EQ(FailureOf([&] { client.ProcessTokenResponse(R"({"id_token": "h.b.s", "error": null})"); }),
              Fails<sso_err_resp>("{\"error\":null,\"id_token\":\"h.b.s\"}\n"));
}

constexpr std::time_t kNow = 1700000000;
constexpr char kWellknown[] = "https://provider.example/wellknown";
constexpr char kKeys[] = "https://provider.example/keys";
const auto kUnknownKid = Fails<std::invalid_argument>("kid does not exist in Azure verified kyes");

class AzureVerification : public Library {
  protected:
    void SetUp() override {
        Library::SetUp();
        SetClock(kNow);
        client.wellknownEndpoint = kWellknown;
        client.clientID = "the id";
        client.tenantID = "the tenant";
        header = Parse(R"({"alg": "RS256", "kid": "key 1"})");
        claims = Parse(R"({"aud": "the id", "tid": "the tenant"})");
        claims["exp"] = static_cast<Json::Int64>(kNow);
        CurrentTransport().answers[kWellknown] = Whole(R"({"jwks_uri": ")" + std::string(kKeys) + "\"}");
        keySet["keys"].append(ProviderKey().JWK("key 1"));
    }

    /// Verifies a token of `header` and `claims` with the provider's signature. `keySet` is the published key set.
    Failure Verify(const EVP_MD *digest = EVP_sha256()) {
        const std::string signingInput = SigningInput(header, claims);
        return VerifyToken(signingInput + "." + ProviderKey().Sign(signingInput, digest));
    }

    Failure VerifyToken(const std::string &token) {
        if (!keySet.isNull()) {
            CurrentTransport().answers[kKeys] = Whole(Compact(keySet));
        }
        client.token = token;
        return FailureOf([this] { client.VerifyIDToken(); });
    }

    void ExpectNoRequest() { EXPECT_THAT(CurrentTransport().urls, IsEmpty()); }

    AzureClient client;
    Json::Value header;
    Json::Value claims;
    Json::Value keySet;
};

const Failure &kVerified = kNothingThrown;
const auto kExpired = Fails<std::invalid_argument>("id_token expired.");
const auto kWrongTenant = Fails<std::invalid_argument>("tenant ID invalid");
const auto kWrongAudience = Fails<std::invalid_argument>("client ID invalid");

TEST_F(AzureVerification, FetchesBothDocumentsForEachToken) {
    EXPECT_EQ(Verify(), kVerified);
    EXPECT_EQ(Verify(), kVerified);
    EXPECT_THAT(CurrentTransport().urls, ElementsAre(kWellknown, kKeys, kWellknown, kKeys));
}

TEST_F(AzureVerification, VerifiesRS384AndRS512) {
    header["alg"] = "RS384";
    EXPECT_EQ(Verify(EVP_sha384()), kVerified);
    header["alg"] = "RS512";
    EXPECT_EQ(Verify(EVP_sha512()), kVerified);
}

TEST_F(AzureVerification, RejectsEmptyToken) {
    EXPECT_EQ(VerifyToken(""), Fails<std::invalid_argument>("token cannot be empty"));
    ExpectNoRequest();
}

TEST_F(AzureVerification, RejectsMalformedToken) {
    EXPECT_EQ(VerifyToken("a.b"), Fails<std::invalid_argument>("bad jwt format!"));
    EXPECT_EQ(VerifyToken("bm8.e30.c2ln"), Fails<std::invalid_argument>("bad jwt header format!"));
    EXPECT_EQ(VerifyToken("e30.bm8.c2ln"), Fails<std::invalid_argument>("bad jwt body format!"));
    EXPECT_EQ(VerifyToken(".e30.c2ln").type, Fails<std::logic_error>("").type);
    ExpectNoRequest();
}

TEST_F(AzureVerification, AcceptsTokenExpiringInThisSecond) {
    EXPECT_EQ(Verify(), kVerified);
    claims["exp"] = static_cast<Json::Int64>(kNow - 1);
    EXPECT_EQ(Verify(), kExpired);
}

TEST_F(AzureVerification, TreatsUnreadableExpiryAsExpired) {
    for (const char *exp :
         {"null", "\"\"", "\"soon\"", "[1700000000]", "{}", "true", "-1", "\"0x7fffffff\"", "\"-1700000000\"", "0.5"}) {
        claims["exp"] = Parse(std::string("[") + exp + "]")[0];
        EXPECT_EQ(Verify(), kExpired) << exp;
    }
    claims.removeMember("exp");
    EXPECT_EQ(Verify(), kExpired);
    ExpectNoRequest();
}

TEST_F(AzureVerification, ReadsExpiryUpToFirstNonDigit) {
    for (const char *exp : {"1700000000", "\"01700000000\"", "\"1700000000\"", "\" 1700000000\"", "\"1700000000.9\"",
                            "1700000000.5", "\"1700000000 seconds\"", "\"99999999999999999999\""}) {
        claims["exp"] = Parse(std::string("[") + exp + "]")[0];
        EXPECT_EQ(Verify(), kVerified) << exp;
    }
    claims["exp"] = Parse("[1e300]")[0];  // as text 1.0000000000000001e+300
    EXPECT_EQ(Verify(), kExpired);
}

/// Groups digits by threes with a point, as in Germany.
struct Grouping : std::numpunct<char> {
    char do_thousands_sep() const override { return '.'; }
    std::string do_grouping() const override { return "\3"; }
};

TEST_F(AzureVerification, ReadsExpiryIndependentOfLocale) {
    const std::locale former = std::locale::global(std::locale(std::locale(), new Grouping));
    claims["exp"] = "1.700.000.000";
    const Failure failure = Verify();
    std::locale::global(former);
    EXPECT_EQ(failure, kExpired);
}

TEST_F(AzureVerification, ChecksExpiryThenTenantThenAudience) {
    claims["aud"] = "another";
    claims["tid"] = "another";
    EXPECT_EQ(Verify(), kWrongTenant);
    claims["exp"] = 1;
    EXPECT_EQ(Verify(), kExpired);
    ExpectNoRequest();
}

TEST_F(AzureVerification, ComparesTenantExactly) {
    for (const char *tenant : {"\"The tenant\"", "\"the tenant \"", "\"\"", "null", "5", "[\"the tenant\"]"}) {
        claims["tid"] = Parse(std::string("[") + tenant + "]")[0];
        EXPECT_EQ(Verify(), kWrongTenant) << tenant;
    }
    claims["tid"] = std::string("the tenant\0", 11);
    EXPECT_EQ(Verify(), kWrongTenant);
    ExpectNoRequest();
}

TEST_F(AzureVerification, ComparesAudienceExactlyAndRejectsList) {
    for (const char *audience : {"\"The id\"", "\"the id,other\"", "null", "[\"the id\"]", "{}"}) {
        claims["aud"] = Parse(std::string("[") + audience + "]")[0];
        EXPECT_EQ(Verify(), kWrongAudience) << audience;
    }
    ExpectNoRequest();
}

TEST_F(AzureVerification, MatchesEmptyTenantWithMissingClaim) {
    client.tenantID = "";
    EXPECT_EQ(Verify(), kWrongTenant);
    claims["tid"] = Json::arrayValue;
    EXPECT_EQ(Verify(), kWrongTenant);
    claims.removeMember("tid");
    EXPECT_EQ(Verify(), kVerified) << "both are the empty text";
}

TEST_F(AzureVerification, TreatsNonObjectClaimsAsExpired) {
    claims = Json::arrayValue;
    EXPECT_EQ(Verify(), kExpired);
    claims = 5;
    EXPECT_EQ(Verify(), kExpired);
}

TEST_F(AzureVerification, ReportsUnknownKidIfDiscoveryIsUnreachable) {
    CurrentTransport().answers.erase(kWellknown);
    EXPECT_EQ(Verify(), kUnknownKid);
    EXPECT_THAT(CurrentTransport().urls, ElementsAre(kWellknown, ""));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("sso:N " + ::Test::kNotConnected),
                                             Error("azuresso:N request wellknown uri " + ::Test::kNotConnected + ".")));
}

TEST_F(AzureVerification, SendsNoRequestForExpiredToken) {
    CurrentTransport().answers.erase(kWellknown);
    claims["exp"] = 1;
    EXPECT_EQ(Verify(), kExpired);
    ExpectNoRequest();
}

TEST_F(AzureVerification, ReportsUnknownKidWithoutJwksUri) {
    for (const char *document : {"{}", "[]", R"({"jwks_uri": ["https://provider.example/keys"]})", "5"}) {
        CurrentTransport().answers[kWellknown] = Whole(document);
        EXPECT_EQ(Verify(), kUnknownKid) << document;
        EXPECT_EQ(CurrentTransport().urls.back(), "");
        EXPECT_THAT(TakeSystemLog(),
                    ElementsAre(Error("azuresso:N request wellknown uri " + ::Test::kNotConnected + ".")));
    }
}

TEST_F(AzureVerification, LogsInvalidKeySetAndReportsUnknownKid) {
    CurrentTransport().answers[kKeys] = Whole("<html>");
    keySet = Json::Value();
    EXPECT_EQ(Verify(), kUnknownKid);
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("azuresso:N request wellknown uri bad wellknown json format..")));
}

TEST_F(AzureVerification, RejectsTruncatedKeySet) {
    const std::string whole = Compact(keySet);
    keySet = Json::Value();
    CurrentTransport().answers[kKeys] = Whole(whole.substr(0, whole.size() - 1));
    EXPECT_EQ(Verify(), kUnknownKid);
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("azuresso:N request wellknown uri bad wellknown json format..")));
}

TEST_F(AzureVerification, LogsMissingKeysAndReportsUnknownKid) {
    for (const char *document : {"{}", "[]", "\"keys\""}) {
        keySet = Parse(std::string("[") + document + "]")[0];
        EXPECT_EQ(Verify(), kUnknownKid) << document;
        EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("azuresso:N no kyes information"))) << document;
    }
}

TEST_F(AzureVerification, IgnoresKeysUnlessList) {
    const Json::Value key = keySet["keys"][0];
    Json::Value named;
    named["a"] = key;
    for (const Json::Value &keys : {Json::Value(), Json::Value(Json::arrayValue), key, named, Json::Value("key 1")}) {
        keySet["keys"] = keys;
        EXPECT_EQ(Verify(), kUnknownKid);
    }
}

TEST_F(AzureVerification, SkipsKeysWithoutKid) {
    Json::Value keys;
    keys.append(Json::Value());
    keys.append(5);
    keys.append(Json::arrayValue);
    keys.append(Json::objectValue);
    keys.append(Parse(R"({"kid": ["key 1"]})"));
    keys.append(keySet["keys"][0]);
    keySet["keys"] = keys;
    EXPECT_EQ(Verify(), kVerified);
}

TEST_F(AzureVerification, ComparesKidExactly) {
    for (const char *kid : {"\"Key 1\"", "\"key 1 \"", "null", "[\"key 1\"]", "{}"}) {
        header["kid"] = Parse(std::string("[") + kid + "]")[0];
        EXPECT_EQ(Verify(), kUnknownKid) << kid;
    }
}

TEST_F(AzureVerification, MatchesMissingKidWithEmptyKid) {
    header.removeMember("kid");
    EXPECT_EQ(Verify(), kUnknownKid);
    keySet["keys"].append(Json::objectValue);
    EXPECT_EQ(Verify(), kUnknownKid) << "a key without kid is skipped, not one with an empty kid";
    keySet["keys"][0]["kid"] = "";
    EXPECT_EQ(Verify(), kVerified);
}

TEST_F(AzureVerification, ComparesNumericKidAsText) {
    header["kid"] = 17;
    keySet["keys"][0]["kid"] = "17";
    EXPECT_EQ(Verify(), kVerified);
}

TEST_F(AzureVerification, UsesFirstKeyWithMatchingKid) {
    const Json::Value good = keySet["keys"][0];
    Json::Value other = good;
    other["n"] = Base64Url(std::string(256, '\x55'));
    keySet["keys"].append(other);
    EXPECT_EQ(Verify(), kVerified);
    keySet["keys"] = Json::arrayValue;
    keySet["keys"].append(other);
    keySet["keys"].append(good);
    EXPECT_EQ(Verify(), Fails<jwt_verify_failed>("verify rsa signature failed"));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("jwt:N EVP_DigestVerifyFinal failed")));
}

TEST_F(AzureVerification, RequiresStringModulus) {
    const auto missing = Fails<std::invalid_argument>("RSA public 'n' cannot be found!");
    keySet["keys"][0]["n"] = 5;
    EXPECT_EQ(Verify(), missing);
    keySet["keys"][0]["n"] = Json::Value();
    EXPECT_EQ(Verify(), missing);
    keySet["keys"][0].removeMember("n");
    keySet["keys"][0].removeMember("e");
    EXPECT_EQ(Verify(), missing) << "n is checked before e";
}

TEST_F(AzureVerification, RequiresStringExponent) {
    const auto missing = Fails<std::invalid_argument>("RSA public 'e' cannot be found!");
    keySet["keys"][0]["e"] = 65537;
    EXPECT_EQ(Verify(), missing);
    header["alg"] = "none";
    keySet["keys"][0].removeMember("e");
    EXPECT_EQ(Verify(), missing) << "e is checked before the algorithm";
}

TEST_F(AzureVerification, RejectsOtherAlgorithms) {
    for (const char *algorithm : {"HS256", "none", "rs256", "RS256 ", "PS256", "ES256", ""}) {
        header["alg"] = algorithm;
        EXPECT_EQ(Verify(), Fails<jwt_not_support>(std::string(algorithm) + " algorithm is not supported"));
    }
}

TEST_F(AzureVerification, ReportsMissingAlgorithmAsEmptyName) {
    header.removeMember("alg");
    EXPECT_EQ(Verify(), Fails<jwt_not_support>(" algorithm is not supported"));
    header["alg"] = Parse(R"(["RS256"])");
    EXPECT_EQ(Verify(), Fails<jwt_not_support>(" algorithm is not supported"));
}

TEST_F(AzureVerification, LooksUpKeyBeforeCheckingAlgorithm) {
    header["alg"] = "HS256";
    header["kid"] = "unknown";
    EXPECT_EQ(Verify(), kUnknownKid);
}

TEST_F(AzureVerification, RejectsSignatureOfAnotherKey) {
    static const RSAKey other;
    EXPECT_EQ(VerifyToken(other.RS256Token(claims, "key 1")), Fails<jwt_verify_failed>("verify rsa signature failed"));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("jwt:N EVP_DigestVerifyFinal failed")));
}

TEST_F(AzureVerification, RejectsHMACUnderPublicKey) {
    // Algorithm confusion: the public modulus as the secret of an HMAC.
    header["alg"] = "HS256";
    const std::string signingInput = SigningInput(header, claims);
    EXPECT_EQ(VerifyToken(signingInput + "." + SignHMAC(signingInput, keySet["keys"][0]["n"].asString(), EVP_sha256())),
              Fails<jwt_not_support>("HS256 algorithm is not supported"));
}

TEST_F(AzureVerification, IgnoresOtherClaims) {
    claims["iss"] = "someone else";
    claims["nbf"] = static_cast<Json::Int64>(kNow + 1000);
    claims["iat"] = static_cast<Json::Int64>(kNow + 1000);
    claims["nonce"] = "another";
    EXPECT_EQ(Verify(), kVerified);
}

struct OwnDiscovery : AzureClient {
    void RequestWellknownInfo(Json::Value &out) override { out["jwks_uri"] = "https://elsewhere.example/keys"; }
};

TEST_F(AzureVerification, UsesDiscoveryDocumentOfDerivedClass) {
    OwnDiscovery derived;
    derived.clientID = "the id";
    derived.tenantID = "the tenant";
    derived.token = ProviderKey().RS256Token(claims, "key 1");
    EXPECT_EQ(FailureOf([&] { derived.VerifyIDToken(); }), kUnknownKid);
    EXPECT_THAT(CurrentTransport().urls, ElementsAre("https://elsewhere.example/keys"));
    TakeSystemLog();
}

TEST_F(AzureVerification, KeepsClientUnchanged) {
    EXPECT_EQ(Verify(), kVerified);
    const std::string token = client.GetToken();
    client.VerifyIDToken();
    EXPECT_EQ(client.GetToken(), token);
}

class AzureKeySet : public Library {
  protected:
    AzureSSOClient client;
    Json::Value keys;
};

TEST_F(AzureKeySet, FetchesKeysAndCleansUpLibcurlTwice) {
    CurrentTransport().answers[kKeys] = Whole(R"({"keys": []})");
    client.RequestKeysInfo(kKeys, keys);
    EXPECT_EQ(keys, Parse(R"({"keys": []})"));
    EXPECT_THAT(CurrentTransport().calls,
                ElementsAre("curl_global_init 3", "curl_easy_init",
                            "curl_easy_setopt CURLOPT_URL https://provider.example/keys",
                            "curl_easy_setopt CURLOPT_WRITEFUNCTION", "curl_easy_setopt CURLOPT_WRITEDATA",
                            "curl_easy_perform", "curl_easy_cleanup", "curl_global_cleanup", "curl_global_cleanup"));
}

TEST_F(AzureKeySet, CleansUpLibcurlTwiceAfterFailure) {
    client.RequestKeysInfo(kKeys, keys);
    EXPECT_TRUE(keys.isNull());
    EXPECT_EQ(std::count(CurrentTransport().calls.begin(), CurrentTransport().calls.end(), "curl_global_cleanup"), 2);
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("azuresso:N request wellknown uri " + ::Test::kNotConnected + ".")));
}

TEST_F(AzureKeySet, LogsOneLineWithoutTransferHandle) {
    CurrentTransport().noHandle = true;
    client.RequestKeysInfo(kKeys, keys);
    const auto log = TakeSystemLog();
    ASSERT_EQ(log.size(), 1u);
    EXPECT_EQ(log[0].priority, LOG_ERR);
    EXPECT_THAT(log[0].text, testing::StartsWith("azuresso:N curl_easy_init failed. "));
}

class AzureIdentity : public Identity<AzureClient> {
  protected:
    void SetUp() override {
        Library::SetUp();
        WriteFile(kDomainTable, R"({"corp.example.net": "ACME"})");
    }
};

const Failure &kNamed = kNothingThrown;

TEST_F(AzureIdentity, ReturnsDomainBackslashUser) {
    EXPECT_EQ(NameOf(R"({"unique_name": "alice@corp.example.net"})"), kNamed);
    EXPECT_EQ(userName, "ACME\\alice");
}

TEST_F(AzureIdentity, PrefersUniqueNameToEmail) {
    EXPECT_EQ(NameOf(R"({"email": "bob@corp.example.net", "unique_name": "alice@corp.example.net"})"), kNamed);
    EXPECT_EQ(userName, "ACME\\alice");
}

TEST_F(AzureIdentity, UsesEmailIfUniqueNameIsNoString) {
    EXPECT_EQ(NameOf(R"({"email": "bob@corp.example.net", "unique_name": 5})"), kNamed);
    EXPECT_EQ(userName, "ACME\\bob");
}

TEST_F(AzureIdentity, PrefersEmptyUniqueNameToEmail) {
    EXPECT_EQ(NameOf(R"({"email": "bob@corp.example.net", "unique_name": ""})"),
              Fails<std::invalid_argument>("cannot get the user name!"));
}

TEST_F(AzureIdentity, RequiresStringUniqueNameOrEmail) {
    const auto notFound = Fails<std::invalid_argument>("cannot find the user name!");
    for (const char *claims : {R"({"sub": "alice@corp.example.net"})", R"({"unique_name": null, "email": ["a@b"]})",
                               "[\"alice@corp.example.net\"]", "5"}) {
        EXPECT_EQ(NameOf(claims), notFound) << claims;
    }
    EXPECT_EQ(userName, "before");
}

TEST_F(AzureIdentity, RequiresOneAtSignAndStoresUserPart) {
    const auto notGot = Fails<std::invalid_argument>("cannot get the user name!");
    EXPECT_EQ(NameOf(R"({"unique_name": "alice@corp@example.net"})"), notGot);
    EXPECT_EQ(userName, "alice");
    EXPECT_EQ(NameOf(R"({"unique_name": "bob"})"), notGot);
    EXPECT_EQ(userName, "bob");
    EXPECT_EQ(NameOf(R"({"unique_name": "alice@@corp.example.net"})"), notGot);
}

TEST_F(AzureIdentity, RejectsMillionAtSignsWithoutSplitting) {
    client.token = "e30." + Base64Url(R"({"email": "alice)" + std::string(1000000, '@') + "\"}") + ".";
    const MemoryLimit limit(4000000);
    EXPECT_EQ(FailureOf([this] { client.GetUserName(userName); }),
              Fails<std::invalid_argument>("cannot get the user name!"));
    EXPECT_EQ(userName, "alice");
}

TEST_F(AzureIdentity, StoresBackslashFormForUnknownDomain) {
    EXPECT_EQ(NameOf(R"({"unique_name": "Alice@elsewhere.example"})"),
              Fails<sso_op_failed>("TAVOWinsUserNameFqdn2Netbios failed."));
    EXPECT_EQ(userName, "ELSEWHERE.EXAMPLE\\Alice");
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error(UnknownDomain("ELSEWHERE.EXAMPLE"))));
}

TEST_F(AzureIdentity, ConvertsOnlyDomainToUpperCase) {
    std::string asked;
    Platform platform;
    platform.fqdn2Netbios = [&](const char *src, char *dst, std::size_t size) {
        asked = src;
        EXPECT_EQ(size, 1023u);
        EXPECT_EQ(std::string(dst, size + 1), std::string(1024, '\0'));
        *dst = 'x';
        return 5;  // every value from 0 is success
    };
    ReplacePlatform(platform);
    EXPECT_EQ(NameOf(R"({"unique_name": "aLice@cOrp.example-1.n\u00e9t"})"), kNamed);
    EXPECT_EQ(asked, "CORP.EXAMPLE-1.N\xc3\xa9T\\aLice");
    EXPECT_EQ(userName, "x");
}

/// Distinguishable from every real locale.
struct CustomCase : std::ctype<char> {
    char do_toupper(char c) const override { return c == 'p' ? '#' : c; }
};

TEST_F(AzureIdentity, ConvertsDomainByGlobalLocale) {
    const std::locale before = std::locale::global(std::locale(std::locale::classic(), new CustomCase));
    EXPECT_EQ(NameOf(R"({"unique_name": "pat@corp.example"})"),
              Fails<sso_op_failed>("TAVOWinsUserNameFqdn2Netbios failed."));
    std::locale::global(before);
    EXPECT_EQ(userName, "cor#.exam#le\\pat");
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error(UnknownDomain("cor#.exam#le"))));
}

TEST_F(AzureIdentity, PassesEmptyUserToConversion) {
    std::string asked;
    Platform platform;
    platform.fqdn2Netbios = [&](const char *src, char *, std::size_t) {
        asked = src;
        return 0;
    };
    ReplacePlatform(platform);
    EXPECT_EQ(NameOf(R"({"unique_name": "@corp.example.net"})"), kNamed);
    EXPECT_EQ(asked, "CORP.EXAMPLE.NET\\");
    EXPECT_EQ(userName, "");
}

TEST_F(AzureIdentity, ReadsNameThatFillsBuffer) {
    Platform platform;
    platform.fqdn2Netbios = [](const char *, char *dst, std::size_t size) {
        std::fill_n(dst, size + 1, 'x');  // without a NUL
        return 0;
    };
    ReplacePlatform(platform);
    EXPECT_EQ(NameOf(R"({"unique_name": "a@b"})"), kNamed);
    EXPECT_EQ(userName, std::string(1024, 'x'));
}

class AzureLogout : public Library {
  protected:
    void SetUp() override {
        Library::SetUp();
        WriteFile(kAzureFile, R"({"azure_logout_endpoint": "https://provider.example/logout"})");
    }
};

constexpr char kLogoutToRelay[] =
    "https://provider.example/logout?post_logout_redirect_uri="
    "https%3A%2F%2Fnas.example%3A5001%2Fwebman%2Fssoclient%2Frelay.html";

TEST_F(AzureLogout, ReturnsBareEndpointForEmptyBase) {
    EXPECT_EQ(GetAzureSSOLogoutURL(""), "https://provider.example/logout");
}

TEST_F(AzureLogout, RemovesIndexOrSlashFromBase) {
    EXPECT_EQ(GetAzureSSOLogoutURL("https://nas.example:5001/index.cgi"), kLogoutToRelay);
    EXPECT_EQ(GetAzureSSOLogoutURL("https://nas.example:5001/"), kLogoutToRelay);
    EXPECT_EQ(GetAzureSSOLogoutURL("https://nas.example:5001"), kLogoutToRelay);
}

TEST_F(AzureLogout, RemovesOnlyOneFinalSlash) {
    EXPECT_THAT(GetAzureSSOLogoutURL("https://nas.example//"), testing::HasSubstr("nas.example%2F%2Fwebman%2F"));
    EXPECT_THAT(GetAzureSSOLogoutURL("https://nas.example//index.cgi"), testing::HasSubstr("nas.example%2Fwebman"));
}

TEST_F(AzureLogout, ReturnsRelayPathForBaseOfSuffix) {
    EXPECT_EQ(GetAzureSSOLogoutURL("/index.cgi"),
              "https://provider.example/logout?post_logout_redirect_uri=%2Fwebman%2Fssoclient%2Frelay.html");
}

TEST_F(AzureLogout, ThrowsOutOfRangeForShortBase) {
    for (std::size_t length = 1; length <= 9; ++length) {
        const Failure failure = FailureOf([&] { GetAzureSSOLogoutURL(std::string(length, '/')); });
        EXPECT_EQ(failure.type, Fails<std::out_of_range>("").type) << length;
        EXPECT_THAT(failure.text, testing::HasSubstr("basic_string::substr"));
    }
}

TEST_F(AzureLogout, KeepsSuffixInUpperCase) {
    EXPECT_THAT(GetAzureSSOLogoutURL("https://nas.example/INDEX.CGI"),
                testing::EndsWith("%2FINDEX.CGI%2Fwebman%2Fssoclient%2Frelay.html"));
}

TEST_F(AzureLogout, UsesEndpointVerbatim) {
    WriteFile(kAzureFile, R"({"azure_logout_endpoint": "https://provider.example/?a"})");
    EXPECT_THAT(GetAzureSSOLogoutURL("https://nas.example"), testing::StartsWith("https://provider.example/?a?post_"));
    WriteFile(kAzureFile, "");
    EXPECT_THAT(GetAzureSSOLogoutURL("https://nas.example"), testing::StartsWith("?post_logout_redirect_uri="));
    EXPECT_EQ(GetAzureSSOLogoutURL(""), "");
}

TEST_F(AzureLogout, IgnoresEnableFlag) {
    WriteFile(kAzureFile, R"({"azure_sso_enable": false, "azure_logout_endpoint": "l"})");
    EXPECT_EQ(GetAzureSSOLogoutURL(""), "l");
}

}  // namespace

}  // namespace Test
