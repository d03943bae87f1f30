#include "tests/loopback/loopback_provider.h"

#include <openssl/evp.h>

#include <ostream>

#include "sso/sso.h"
#include "tests/support/authority.h"
#include "tests/support/failure.h"
#include "tests/support/files.h"
#include "tests/support/interposed/clock.h"
#include "tests/support/system_log.h"
#include "tests/support/token.h"

namespace Test {

namespace {

Json::Value Configuration(Profile profile) {
    const std::string prefix = profile == Profile::kAzure ? "azure_" : "websphere_";
    Json::Value configuration;
    configuration[prefix + "client_id"] = "the client";
    configuration[prefix + "client_secret"] = kSecret;
    configuration[prefix + "token_endpoint"] = "$BASE/token";
    configuration[prefix + "redirect_uri"] = "https://nas.example/return";
    if (profile == Profile::kAzure) {
        configuration["azure_tenant_id"] = "the tenant";
        configuration["azure_wellknown"] = "$BASE/discovery";
    }
    return configuration;
}

const EVP_MD *DigestOf(const std::string &algorithm) {
    const std::string bits = algorithm.size() == 5 ? algorithm.substr(2) : "";
    return bits == "512" ? EVP_sha512() : bits == "384" ? EVP_sha384() : EVP_sha256();
}

}  // namespace

std::string Name(Profile profile) { return profile == Profile::kAzure ? "Azure" : "WebSphere"; }

void PrintTo(Profile profile, std::ostream *stream) { *stream << Name(profile); }

std::string UserName(Profile profile) { return profile == Profile::kAzure ? R"(CORP\Alice)" : "alice"; }

bool operator==(const Outcome &a, const Outcome &b) {
    return a.exception == b.exception && a.text == b.text && a.userName == b.userName;
}

std::ostream &operator<<(std::ostream &stream, const Outcome &outcome) {
    return stream << "[" << outcome.exception << "] \"" << outcome.text << "\", user name \"" << outcome.userName
                  << "\"";
}

Outcome LoggedIn(const std::string &userName) { return {"", "", userName}; }

Outcome LogIn(const std::string &code) {
    Outcome outcome{"", "", kUserNameBefore};
    try {
        TAVO::SSO::OIDCLogin(code, outcome.userName);
    } catch (const std::exception &error) {
        RequireInTable(error);
        outcome.exception = typeid(error).name();
        outcome.text = error.what();
    }
    return outcome;
}

Json::Value Change(Json::Value value, const std::string &changes) {
    const Json::Value members = Parse(changes);
    for (const std::string &name : members.getMemberNames()) {
        if (members[name].isNull()) {
            value.removeMember(name);
        } else {
            value[name] = members[name];
        }
    }
    return value;
}

Json::Value TokenHeader(Profile profile) {
    return profile == Profile::kAzure ? Parse(R"({"typ": "JWT", "alg": "RS256", "kid": "first key"})")
                                      : Parse(R"({"typ": "JWT", "alg": "HS256"})");
}

Json::Value TokenClaims(Profile profile) {
    Json::Value claims = Parse(R"({"iss": "the provider", "aud": "the client", "sub": "alice"})");
    claims["exp"] = Json::Int64(kNow + 300);
    if (profile == Profile::kAzure) {
        claims["tid"] = "the tenant";
        claims["unique_name"] = "Alice@corp.example";
    }
    return claims;
}

std::string SignedToken(const Json::Value &header, const Json::Value &claims, const std::string &secret) {
    const Json::Value algorithm = header["alg"];
    const std::string name = algorithm.isString() ? algorithm.asString() : "";
    const std::string signingInput = SigningInput(header, claims);
    const bool hmac = name.compare(0, 2, "HS") == 0;
    return signingInput + "." +
           (hmac ? SignHMAC(signingInput, secret, DigestOf(name)) : ProviderKey().Sign(signingInput, DigestOf(name)));
}

std::string TokenResponse(const std::string &idToken) {
    return R"({"token_type": "Bearer", "id_token": ")" + idToken + "\"}";
}

std::string KeySet(const std::string &changes) {
    Json::Value keySet;
    keySet["keys"].append(Change(ProviderKey().JWK(kKeyID), changes));
    return Compact(keySet);
}

Provider::Provider(Profile profile, const std::string &changes)
    : profile_(profile), server_(CertificateFor("IP:127.0.0.1")) {
    const bool azure = profile == Profile::kAzure;
    TakeSystemLog();  // left by another test
    SetClock(kNow);
    RemoveFiles();
    TrustAuthority();
    WriteFile(kProfileFile, azure ? R"({"sso_enable": true, "sso_profile": "azure"})"
                                  : R"({"sso_enable": true, "sso_profile": "websphere"})");
    WriteFile(azure ? kAzureFile : kWebSphereFile, WithBase(Compact(Change(Configuration(profile), changes))));
    WriteFile(kDomainTable, R"({"corp.example": "CORP"})");
}

void Provider::Answer(const std::string &body) { server_.Answer(HTTPAnswer(WithBase(body))); }

void Provider::AnswerByteByByte(const std::string &answer) { server_.Answer(answer); }

void Provider::Play(const Script &script) { server_.Play(script); }

void Provider::AnswerVerification() {
    if (profile_ == Profile::kAzure) {
        Answer(R"({"jwks_uri": "$BASE/keys"})");
        Answer(KeySet());
    }
}

void Provider::AnswerLogin(const std::string &idToken) {
    AnswerByteByByte(HTTPAnswer(TokenResponse(idToken)));
    AnswerVerification();
}

Outcome Provider::LogIn() { return Test::LogIn("code/1"); }

std::string Provider::WithBase(std::string text) const {
    constexpr char kBase[] = "$BASE";
    const std::size_t base = text.find(kBase);
    return base == std::string::npos ? text : WithBase(text.replace(base, sizeof kBase - 1, server_.URL("")));
}

std::vector<std::string> AllRequestLines(Profile profile) {
    std::vector<std::string> lines{"POST /token HTTP/1.1"};
    if (profile == Profile::kAzure) {
        lines.insert(lines.end(), {"GET /discovery HTTP/1.1", "GET /keys HTTP/1.1"});
    }
    return lines;
}

}  // namespace Test
