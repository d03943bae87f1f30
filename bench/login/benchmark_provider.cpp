#include "bench/login/benchmark_provider.h"

#include <json/json.h>

#include <ctime>

#include "tests/support/files.h"
#include "tests/support/token.h"

namespace Bench {

namespace {

constexpr char kClientID[] = "6731de76-14a6-49ae-97bc-6eba6914391e";
constexpr char kClientSecret[] = "JqQX2PNo9bpM0uEihUPzyrh";
constexpr char kTenant[] = "8eaef023-2b34-4da1-9baa-8bc8c9d6a490";

void WriteConfiguration(const std::string &prefix, const char *file, const std::string &url) {
    Json::Value configuration;
    configuration[prefix + "_client_id"] = kClientID;
    configuration[prefix + "_client_secret"] = kClientSecret;
    configuration[prefix + "_redirect_uri"] = "https://nas.example/return";
    configuration[prefix + "_token_endpoint"] = url + "/token";
    configuration[prefix + "_wellknown"] = url + "/discovery";
    configuration[prefix + "_tenant_id"] = kTenant;
    Test::WriteFile(file, Test::Compact(configuration));
}

Json::Value Claims(const std::string &issuer) {
    Json::Value claims;
    claims["iss"] = issuer;
    claims["aud"] = kClientID;
    claims["sub"] = "alice";
    claims["exp"] = Json::Int64(std::time(nullptr) + 24 * 60 * 60);
    claims["tid"] = kTenant;
    claims["unique_name"] = "alice@corp.example";
    claims["name"] = "Alice of the Office";
    return claims;
}

std::string TokenResponse(const std::string &idToken) {
    Json::Value response;
    response["token_type"] = "Bearer";
    response["expires_in"] = 3600;
    response["access_token"] = std::string(1200, 'a');
    response["refresh_token"] = std::string(800, 'r');
    response["id_token"] = idToken;
    return Test::HTTPAnswer(Test::Compact(response));
}

std::string Discovery(const std::string &url) {
    Json::Value discovery;
    discovery["issuer"] = url;
    for (const char *name : {"authorization", "device_authorization", "end_session", "userinfo", "token"}) {
        discovery[std::string(name) + "_endpoint"] = url + "/" + name;
    }
    for (const char *claim : {"sub", "iss", "aud", "exp", "iat", "auth_time", "acr", "nonce", "name", "tid", "email"}) {
        discovery["claims_supported"].append(claim);
    }
    discovery["jwks_uri"] = url + "/keys";
    return Test::HTTPAnswer(Test::Compact(discovery));
}

std::string KeySet() {
    Json::Value keySet;
    for (const char *name : {"key 1", "key 2", "key 3", "key 4", "key 5", "key 6"}) {
        Json::Value key = Test::ProviderKey().JWK(name);
        key["x5c"].append(std::string(1000, 'c'));
        keySet["keys"].append(key);
    }
    return Test::HTTPAnswer(Test::Compact(keySet));
}

}  // namespace

Provider::Provider() : server_(Test::CertificateFor("IP:127.0.0.1")) {
    Test::TrustAuthority();
    Test::WriteFile(Test::kDomainTable, R"({"corp.example": "CORP"})");
    WriteConfiguration("azure", Test::kAzureFile, URL("azure"));
    WriteConfiguration("websphere", Test::kWebSphereFile, URL("websphere"));
    answers_ = {
        {"POST /azure/token", TokenResponse(Test::ProviderKey().RS256Token(Claims(URL("azure")), "key 3"))},
        {"GET /azure/discovery", Discovery(URL("azure"))},
        {"GET /azure/keys", KeySet()},
        {"POST /websphere/token", TokenResponse(Test::HS256Token(Claims(URL("websphere")), kClientSecret))},
    };
    AnswerNextConnection();
}

void Provider::AnswerNextConnection() {
    server_.Play([this](Test::Connection &connection) {
        AnswerNextConnection();
        const std::string request = connection.ReceiveRequest();
        connection.Send(answers_[request.substr(0, request.find(" HTTP/"))]);
    });
}

}  // namespace Bench
