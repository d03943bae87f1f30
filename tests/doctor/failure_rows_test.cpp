#include <gtest/gtest.h>

#include <cstdio>
#include <iostream>
#include <ostream>
#include <set>
#include <string>
#include <vector>

#include "tests/doctor/appliance.h"
#include "tests/doctor/doctor_process.h"
#include "tests/doctor/login_dialogue.h"
#include "tests/support/authority.h"
#include "tests/support/files.h"
#include "tests/support/token.h"
#include "web/failure_lookup.h"

// For each text that a login can fail with: the doctor reports the cause first, then the login fails with that text.
// Prints each row with the doctor's finding.
namespace Test {

namespace {

/// The command that an administrator would run.
enum class Command { kPass, kToken, kLogin };

constexpr Profile kAzure = Profile::kAzure;
constexpr Profile kWebSphere = Profile::kWebSphere;
constexpr Command kPass = Command::kPass;
constexpr Command kToken = Command::kToken;

const char *Name(Command command) {
    return command == Command::kPass    ? "tavosso-doctor"
           : command == Command::kToken ? "tavosso-doctor token - --fetch"
                                        : "tavosso-doctor login";
}

using TAVO::Web::kErrorAnswer;
constexpr char kAlgorithm[] = "ALG algorithm is not supported";

struct Row {
    std::string name;
    Profile profile;
    std::string text;  // in the table of failures
    Command command;
    std::string check;  // the id; for `login`, whose report has no ids, the subject
    void (*arrange)(Appliance &appliance);
};

void PrintTo(const Row &row, std::ostream *stream) { *stream << row.name; }

void WriteProfile(const std::string &content) { WriteFile(kProfileFile, content); }

/// An address that refuses connections while the program runs.
std::string NobodysURL() {
    static const Port port;
    return "https://127.0.0.1:" + std::to_string(port.number()) + "/";
}

/// A second server on the provider's host. It runs until the program ends.
template <Credentials (*make)(const std::string &)>
std::string OtherServersURL() {
    static const Server server(make("IP:127.0.0.1"));
    return server.URL("/");
}

/// The provider accepts it too, because it returns its token for any request.
void SetSecretEverywhere(Appliance &appliance, const std::string &secret) {
    appliance.AnswerAt("/token_endpoint", TokenResponse(appliance.Token()));
    appliance.SetClient("client_secret", secret);
}

void AnswerKey(Appliance &appliance, const char *changes) { appliance.AnswerAt("/keys", KeySet(changes)); }

std::string OtherKeySet() {
    static const RSAKey other;
    Json::Value keySet;
    keySet["keys"].append(other.JWK(kKeyID));
    return Compact(keySet);
}

std::vector<Row> RowsOfFiles() {
    return {
        {"SwitchedOff", kAzure, "sso does not enable.", kPass, "profile.sso_enable",
         [](Appliance &) { WriteProfile(R"({"sso_enable": false, "sso_profile": "azure"})"); }},
        {"SwitchMissing", kAzure, "sso does not enable.", kPass, "profile.sso_enable",
         [](Appliance &) { WriteProfile(R"({"sso_profile": "azure"})"); }},
        {"SwitchIsAText", kWebSphere, "sso does not enable.", kPass, "profile.sso_enable",
         [](Appliance &) { WriteProfile(R"({"sso_enable": "true", "sso_profile": "websphere"})"); }},
        {"ProfileFileIsAList", kAzure, "sso does not enable.", kPass, "profile.file",
         [](Appliance &) { WriteProfile("[]"); }},
        {"ProfileFileMissing", kAzure, "read profile file failed.", kPass, "profile.file",
         [](Appliance &) { RemoveFiles(); }},
        {"ProfileFileNoJSON", kWebSphere, "read profile file failed.", kPass, "profile.file",
         [](Appliance &) { WriteProfile("sso_enable = true\n"); }},
        {"ProfileMissing", kAzure, "not specify sso profile", kPass, "profile.sso_profile",
         [](Appliance &) { WriteProfile(R"({"sso_enable": true})"); }},
        {"ProfileInCapitals", kAzure, "profile not support.", kPass, "profile.sso_profile",
         [](Appliance &) { WriteProfile(R"({"sso_enable": true, "sso_profile": "Azure"})"); }},
        {"SecretTooLong", kWebSphere, "encode base64 failed.", kPass, "client.client_secret",
         [](Appliance &appliance) { SetSecretEverywhere(appliance, std::string(766, 's')); }},
        {"SecretTooLongForAToken", kWebSphere, "encode base64 failed.", kToken, "token.secret",
         [](Appliance &appliance) { SetSecretEverywhere(appliance, std::string(766, 's')); }},
        {"ClientFileMissing", kAzure, "parse json falied", kPass, "client.file",
         [](Appliance &) { ASSERT_EQ(std::remove(kAzureFile), 0); }},
        {"ClientFileNoJSON", kWebSphere, "parse json falied", kPass, "client.file",
         [](Appliance &) { WriteFile(kWebSphereFile, "{\"websphere_client_id\": \"the client\",}"); }},
        {"TokenEndpointEmpty", kAzure, "parse json falied", kPass, "client.token_endpoint",
         [](Appliance &appliance) { appliance.SetClient("token_endpoint", ""); }},
    };
}

std::vector<Row> RowsOfTokenEndpoints() {
    constexpr char kNoToken[] = "we cannot find key 'id_token' in response!";
    return {
        {"NobodyListens", kAzure, "parse json falied", kPass, "token_endpoint.reachable",
         [](Appliance &appliance) { appliance.MoveEndpoint("token_endpoint", NobodysURL()); }},
        {"CertificateUntrusted", kAzure, "parse json falied", kPass, "token_endpoint.certificate",
         [](Appliance &appliance) {
             appliance.MoveEndpoint("token_endpoint", OtherServersURL<SelfSignedCertificateFor>());
         }},
        {"CertificateExpired", kWebSphere, "parse json falied", kPass, "token_endpoint.certificate",
         [](Appliance &appliance) {
             appliance.MoveEndpoint("token_endpoint", OtherServersURL<ExpiredCertificateFor>());
         }},
        {"AnswerIsNoJSON", kAzure, "parse json falied", kPass, "token_endpoint.client",
         [](Appliance &appliance) { appliance.AnswerAt("/token_endpoint", "<html>Hello</html>"); }},
        {"NoSuchPage", kWebSphere, "parse json falied", kPass, "token_endpoint.client",
         [](Appliance &appliance) { appliance.MoveEndpoint("token_endpoint", appliance.URL("/tokn")); }},
        {"SecretWrong", kAzure, kErrorAnswer, kPass, "token_endpoint.client",
         [](Appliance &appliance) { appliance.SetClient("client_secret", "the one of last year"); }},
        {"CodeRefused", kAzure, kErrorAnswer, Command::kLogin, "exchange of the code",
         [](Appliance &appliance) { appliance.RefuseCodes("invalid_grant", "the redirect URI is another one"); }},
        {"SecretWrongByWebSphere", kWebSphere, kNoToken, kPass, "token_endpoint.client",
         [](Appliance &appliance) { appliance.SetClient("client_secret", "the one of last year"); }},
        {"ClientUnknownByWebSphere", kWebSphere, kNoToken, kPass, "token_endpoint.client",
         [](Appliance &appliance) { appliance.SetClient("client_id", "another client"); }},
        {"CodeRefusedByWebSphere", kWebSphere, kNoToken, Command::kLogin, "exchange of the code",
         [](Appliance &appliance) { appliance.RefuseCodes("invalid_grant"); }},
        {"NoTokenInTheAnswer", kAzure, kNoToken, Command::kLogin, "exchange of the code",
         [](Appliance &appliance) {
             appliance.AnswerAt("/token_endpoint", R"({"access_token": "without OpenID Connect"})");
         }},
        {"NoTokenEndpoint", kAzure, kNoToken, kPass, "token_endpoint.client",
         [](Appliance &appliance) { appliance.AnswerAt("/token_endpoint", "{}"); }},
    };
}

std::vector<Row> RowsOfKeys() {
    constexpr char kNoKey[] = "kid does not exist in Azure verified kyes";
    return {
        {"DiscoveryAddressEmpty", kAzure, kNoKey, kPass, "client.wellknown",
         [](Appliance &appliance) { appliance.SetClient("wellknown", ""); }},
        {"DiscoveryUnreachable", kAzure, kNoKey, kPass, "discovery.reachable",
         [](Appliance &appliance) { appliance.SetClient("wellknown", NobodysURL()); }},
        {"DiscoveryUnreachableForAToken", kAzure, kNoKey, kToken, "token.key",
         [](Appliance &appliance) { appliance.SetClient("wellknown", NobodysURL()); }},
        {"DiscoveryCertificateUntrusted", kAzure, kNoKey, kPass, "discovery.certificate",
         [](Appliance &appliance) { appliance.SetClient("wellknown", OtherServersURL<SelfSignedCertificateFor>()); }},
        {"DiscoveryNoJSON", kAzure, kNoKey, kPass, "discovery.document",
         [](Appliance &appliance) { appliance.AnswerAt("/discovery", "<html>Sign in</html>"); }},
        {"DiscoveryIsAnError", kAzure, kNoKey, kPass, "discovery.document",
         [](Appliance &appliance) {
             appliance.AnswerAt("/discovery", R"({"error": "invalid_tenant"})", "400 Bad Request");
         }},
        {"DiscoveryWithoutKeys", kAzure, kNoKey, kPass, "keys.reachable",
         [](Appliance &appliance) { appliance.ChangeDiscovery(R"({"jwks_uri": null})"); }},
        {"KeySetUnreachable", kAzure, kNoKey, kPass, "keys.reachable",
         [](Appliance &appliance) { appliance.ChangeDiscovery(R"({"jwks_uri": ")" + NobodysURL() + "\"}"); }},
        {"KeySetNoJSON", kAzure, kNoKey, kPass, "keys.set",
         [](Appliance &appliance) { appliance.AnswerAt("/keys", "<html>Sign in</html>"); }},
        {"KeySetWithoutKeys", kAzure, kNoKey, kPass, "keys.set",
         [](Appliance &appliance) { appliance.AnswerAt("/keys", "{}"); }},
        {"KeySetEmpty", kAzure, kNoKey, kPass, "keys.set",
         [](Appliance &appliance) { appliance.AnswerAt("/keys", R"({"keys": []})"); }},
        {"KeyUnknown", kAzure, kNoKey, kToken, "token.key",
         [](Appliance &appliance) { AnswerKey(appliance, R"({"kid": "second key"})"); }},
        {"KeyOfATokenUnknown", kAzure, kNoKey, kToken, "token.key",
         [](Appliance &appliance) { appliance.GiveToken(R"({"kid": "key of another tenant"})", "{}"); }},
        {"KeyWithoutN", kAzure, "RSA public 'n' cannot be found!", kToken, "token.key_numbers",
         [](Appliance &appliance) { AnswerKey(appliance, R"({"n": null})"); }},
        {"KeyWithoutE", kAzure, "RSA public 'e' cannot be found!", kToken, "token.key_numbers",
         [](Appliance &appliance) { AnswerKey(appliance, R"({"e": null})"); }},
        {"KeyOfACurve", kAzure, "RSA public 'n' cannot be found!", kPass, "keys.set",
         [](Appliance &appliance) {
             AnswerKey(appliance, R"({"kty": "EC", "crv": "P-256", "n": null, "e": null, "x": "AQAB", "y": "AQAB"})");
         }},
        {"OtherKey", kAzure, "verify rsa signature failed", kToken, "token.signature",
         [](Appliance &appliance) { appliance.AnswerAt("/keys", OtherKeySet()); }},
    };
}

std::vector<Row> RowsOfTokens() {
    return {
        {"TokenExpired", kAzure, "id_token expired.", kToken, "token.expiry",
         [](Appliance &appliance) { appliance.GiveToken("{}", R"({"exp": 1700000000})"); }},
        {"TokenWithoutExpiry", kWebSphere, "id_token expired.", kToken, "token.expiry",
         [](Appliance &appliance) { appliance.GiveToken("{}", R"({"exp": null})"); }},
        {"OtherTenant", kAzure, "tenant ID invalid", kToken, "token.tenant",
         [](Appliance &appliance) { appliance.GiveToken("{}", R"({"tid": "another tenant"})"); }},
        {"TenantWrongInTheFile", kAzure, "tenant ID invalid", kPass, "client.tenant",
         [](Appliance &appliance) { appliance.SetClient("tenant_id", "00000000-1111-2222-3333-444444444444"); }},
        {"OtherClient", kAzure, "client ID invalid", kToken, "token.audience",
         [](Appliance &appliance) { appliance.GiveToken("{}", R"({"aud": "another client"})"); }},
        {"OtherClientByWebSphere", kWebSphere, "client ID invalid", kToken, "token.audience",
         [](Appliance &appliance) { appliance.GiveToken("{}", R"({"aud": "another client"})"); }},
        {"AudienceIsAList", kAzure, "client ID invalid", kToken, "token.audience",
         [](Appliance &appliance) { appliance.GiveToken("{}", R"({"aud": ["the client"]})"); }},
        {"AudienceIsAListByWebSphere", kWebSphere, "client ID invalid", kToken, "token.audience",
         [](Appliance &appliance) { appliance.GiveToken("{}", R"({"aud": ["the client"]})"); }},
        {"SignedByTheSecretForAzure", kAzure, kAlgorithm, kToken, "token.algorithm",
         [](Appliance &appliance) { appliance.GiveToken(R"({"alg": "HS256"})", "{}"); }},
        {"SignedByAKeyForWebSphere", kWebSphere, kAlgorithm, kToken, "token.algorithm",
         [](Appliance &appliance) { appliance.GiveToken(R"({"alg": "RS256"})", "{}"); }},
        {"Unsigned", kWebSphere, kAlgorithm, kToken, "token.algorithm",
         [](Appliance &appliance) { appliance.GiveToken(R"({"alg": "none"})", "{}"); }},
        {"NoAlgorithm", kAzure, kAlgorithm, kToken, "token.algorithm",
         [](Appliance &appliance) { appliance.GiveToken(R"({"alg": null})", "{}"); }},
        {"AlgorithmNotOffered", kWebSphere, kAlgorithm, kPass, "discovery.algorithms",
         [](Appliance &appliance) {
             appliance.ChangeDiscovery(R"({"id_token_signing_alg_values_supported": ["RS256"]})");
             appliance.GiveToken(R"({"alg": "RS256"})", "{}");
         }},
        {"OtherSecret", kWebSphere, "verify hmac signature failed", kToken, "token.signature",
         [](Appliance &appliance) {
             appliance.GiveToken(SignedToken(TokenHeader(kWebSphere), GoodClaims(kWebSphere), "another secret"));
         }},
        {"SecretEmpty", kWebSphere, "verify hmac signature failed", kPass, "client.client_secret",
         [](Appliance &appliance) { SetSecretEverywhere(appliance, ""); }},
        {"SecretEmptyForAToken", kWebSphere, "verify hmac signature failed", kToken, "token.signature",
         [](Appliance &appliance) { SetSecretEverywhere(appliance, ""); }},
        {"NoToken", kAzure, "token cannot be empty", kToken, "token.form",
         [](Appliance &appliance) { appliance.GiveToken(""); }},
        {"TokenOfTwoParts", kWebSphere, "bad jwt format!", kToken, "token.form",
         [](Appliance &appliance) { appliance.GiveToken("e30.e30"); }},
        {"HeaderNoJSON", kAzure, "bad jwt header format!", kToken, "token.header",
         [](Appliance &appliance) { appliance.GiveToken("bm8gSlNPTg.e30.e30"); }},
        {"ClaimsNoJSON", kWebSphere, "bad jwt body format!", kToken, "token.claims",
         [](Appliance &appliance) { appliance.GiveToken("e30.bm8gSlNPTg.e30"); }},
        {"HeaderEmpty", kWebSphere, "empty jwt part", kToken, "token.header",
         [](Appliance &appliance) { appliance.GiveToken(".e30.e30"); }},
        {"ClaimsEmpty", kAzure, "empty jwt part", kToken, "token.claims",
         [](Appliance &appliance) { appliance.GiveToken("e30..e30"); }},
        {"NoName", kAzure, "cannot find the user name!", kToken, "token.user_name",
         [](Appliance &appliance) { appliance.GiveToken("{}", R"({"unique_name": null})"); }},
        {"NoNameByWebSphere", kWebSphere, "cannot find the user name!", kToken, "token.user_name",
         [](Appliance &appliance) { appliance.GiveToken("{}", R"({"sub": 4711})"); }},
        {"NameWithoutDomain", kAzure, "cannot get the user name!", kToken, "token.user_name",
         [](Appliance &appliance) { appliance.GiveToken("{}", R"({"unique_name": "alice"})"); }},
        {"DomainUnknown", kAzure, "TAVOWinsUserNameFqdn2Netbios failed.", kToken, "token.domain",
         [](Appliance &appliance) { appliance.GiveToken("{}", R"({"unique_name": "alice@elsewhere.example"})"); }},
        {"NoDomains", kAzure, "TAVOWinsUserNameFqdn2Netbios failed.", kPass, "directory.source",
         [](Appliance &) { WriteFile(kDomainTable, "{}"); }},
    };
}

std::vector<Row> Rows() {
    std::vector<Row> rows;
    for (const auto &some : {RowsOfFiles(), RowsOfTokenEndpoints(), RowsOfKeys(), RowsOfTokens()}) {
        rows.insert(rows.end(), some.begin(), some.end());
    }
    return rows;
}

/// The part of an exception that the doctor prints: only the error of a provider's response.
std::string Shown(const std::string &thrown) {
    if (thrown.front() != '{') {
        return thrown;
    }
    const Json::Value answer = Parse(thrown);
    const std::string description = answer["error_description"].asString();
    return "The provider refused: " + answer["error"].asString() +
           (description.empty() ? "" : " (" + description + ")");
}

std::string GroupOf(const std::string &id) { return id.substr(0, id.find('.')); }

void PrintRow(const Row &row, const Check &check) {
    std::cout << row.text << " | " << Name(row.command) << " | " << row.check << " | " << check.found << std::endl;
}

class FailureRow : public ::testing::TestWithParam<Row> {};

TEST_P(FailureRow, IsDiagnosedBeforeLoginFails) {
    const Row &row = GetParam();
    Appliance appliance(row.profile);
    row.arrange(appliance);

    Check check;
    if (row.command == Command::kLogin) {
        check = WalkLogin().FirstFinding();
        EXPECT_EQ(check.subject, row.check);
    } else {
        const Report report = row.command == kToken ? Ask({"token", "-", "--fetch"}, appliance.Token()) : Ask({});
        check = report.Find(row.check, "finding");
        EXPECT_EQ(check.id, row.check) << "findings: " << ::testing::PrintToString(report.Findings());
        if (row.command == kToken) {
            EXPECT_EQ(report.json["stops_at"], row.check);
            ExpectToStopAtTheOnlyFinding(report);
        } else {
            // The certificate's check reports the failed transfer.
            EXPECT_EQ(GroupOf(report.FirstFinding().id), GroupOf(row.check));
        }
    }
    EXPECT_NE(check.remedy, "");
    PrintRow(row, check);

    const Outcome outcome = appliance.LogIn();
    EXPECT_TRUE(TAVO::Web::IsText(outcome.text, row.text.c_str())) << outcome.text;
    if (row.command != kPass || !check.library.empty()) {
        EXPECT_EQ(check.library, Shown(outcome.text));
    }
}

INSTANTIATE_TEST_SUITE_P(Doctor, FailureRow, ::testing::ValuesIn(Rows()),
                         [](const auto &row) { return row.param.name; });

std::set<std::string> TextsOfLogins() {
    std::set<std::string> texts;
    for (const TAVO::Web::FailureRow &failure : TAVO::Web::FailureTable()) {
        if (std::string(failure.thrownBy).find("login") != std::string::npos) {
            texts.insert(failure.texts.begin(), failure.texts.end());
        }
    }
    return texts;
}

TEST(FailureRows, CoverEveryTextOfFailedLogins) {
    std::set<std::string> withRow;
    for (const Row &row : Rows()) {
        withRow.insert(row.text);
    }
    EXPECT_EQ(withRow, TextsOfLogins());
}

class Healthy : public ::testing::TestWithParam<Profile> {};

INSTANTIATE_TEST_SUITE_P(Doctor, Healthy, ::testing::Values(Profile::kAzure, Profile::kWebSphere),
                         [](const auto &profile) { return Name(profile.param); });

TEST_P(Healthy, MachineHasNoFindingsAndSignsIn) {
    const Appliance appliance(GetParam());
    EXPECT_EQ(Ask({}).Findings(), Strings());
    EXPECT_EQ(appliance.LogIn(), LoggedIn(UserName(GetParam())));
}

TEST_P(Healthy, TokenHasNoFindingsAndSignsIn) {
    const Appliance appliance(GetParam());
    const Report report = Ask({"token", "-", "--fetch"}, appliance.Token());
    EXPECT_EQ(report.Findings(), Strings());
    EXPECT_EQ(report.json["stops_at"], "");
    EXPECT_EQ(appliance.LogIn(), LoggedIn(UserName(GetParam())));
}

}  // namespace

}  // namespace Test
