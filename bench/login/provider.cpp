// A provider of both profiles in a process of its own, with the appliance's configuration for it. Prints its address
// when it can be asked, and ends with its standard input.
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <openssl/err.h>
#include <openssl/ssl.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <csignal>
#include <ctime>
#include <iostream>
#include <map>
#include <memory>
#include <stdexcept>
#include <string>

#include "bench/login/exchange.h"
#include "tests/support/authority.h"
#include "tests/support/files.h"
#include "tests/support/server.h"
#include "tests/support/token.h"

namespace {

constexpr char kTenant[] = "8eaef023-2b34-4da1-9baa-8bc8c9d6a490";
constexpr char kKeyID[] = "key 3";
constexpr int kKeys = 6;  // as a provider publishes that changes its keys now and then

/// By the first line of the request: method and path.
using Answers = std::map<std::string, std::string>;

void Require(bool condition, const char *what) {
    if (!condition) {
        throw std::runtime_error(what);
    }
}

std::shared_ptr<SSL_CTX> MakeTLS() {
    const Test::Credentials credentials = Test::CertificateFor("IP:127.0.0.1");
    std::shared_ptr<SSL_CTX> context(SSL_CTX_new(TLS_server_method()), SSL_CTX_free);
    Require(context && SSL_CTX_use_certificate(context.get(), credentials.certificate.get()) == 1 &&
                SSL_CTX_use_PrivateKey(context.get(), credentials.key.get()) == 1,
            "credentials of a server");
    return context;
}

Json::Value Claims(const std::string &issuer) {
    const std::time_t now = std::time(nullptr);
    Json::Value claims;
    claims["iss"] = issuer;
    claims["aud"] = CLIENT_ID;
    claims["sub"] = "alice";
    claims["iat"] = Json::Int64(now);
    claims["exp"] = Json::Int64(now + 24 * 60 * 60);
    claims["tid"] = kTenant;
    claims["unique_name"] = "alice@corp.example";
    claims["given_name"] = "Alice";
    claims["name"] = "Alice of the Office";
    claims["oid"] = "b3809430-6c00-46a3-b5f7-d6f3a3ab1d0f";
    return claims;
}

std::string TokenResponse(const std::string &idToken) {
    Json::Value response;
    response["token_type"] = "Bearer";
    response["expires_in"] = 3600;
    response["scope"] = "openid profile email";
    response["access_token"] = std::string(1200, 'a');
    response["refresh_token"] = std::string(800, 'r');
    response["id_token"] = idToken;
    return Test::Compact(response);
}

/// Of all the members of such documents only as many as make them as long as they are.
std::string Discovery(const std::string &address) {
    Json::Value discovery;
    discovery["issuer"] = address;
    for (const char *name : {"authorization", "device_authorization", "end_session", "userinfo", "token"}) {
        discovery[std::string(name) + "_endpoint"] = address + "/" + name;
    }
    for (const char *claim : {"sub", "iss", "aud", "exp", "iat", "auth_time", "acr", "nonce", "name", "tid", "email"}) {
        discovery["claims_supported"].append(claim);
    }
    discovery["jwks_uri"] = address + KEYS_PATH;
    return Test::Compact(discovery);
}

std::string KeySet() {
    Json::Value keySet;
    for (int i = 0; i < kKeys; ++i) {
        Json::Value key = Test::ProviderKey().JWK("key " + std::to_string(i));
        key["x5c"].append(std::string(1000, 'c'));
        keySet["keys"].append(key);
    }
    return Test::Compact(keySet);
}

void WriteConfiguration(const std::string &prefix, const char *file, const std::string &address) {
    Json::Value configuration;
    configuration[prefix + "_client_id"] = CLIENT_ID;
    configuration[prefix + "_client_secret"] = CLIENT_SECRET;
    configuration[prefix + "_redirect_uri"] = REDIRECT_URI;
    configuration[prefix + "_authorization_endpoint"] = address + "/authorization";
    configuration[prefix + "_token_endpoint"] = address + TOKEN_PATH;
    configuration[prefix + "_wellknown"] = address + DISCOVERY_PATH;
    configuration[prefix + "_tenant_id"] = kTenant;
    Test::WriteFile(file, Test::Compact(configuration));
}

/// The appliance, where the provider has that address; what the provider answers.
Answers Configure(const std::string &address) {
    Test::TrustAuthority();
    Test::WriteFile(Test::kDomainTable, R"({"corp.example": "CORP"})");
    const std::string azure = address + "/azure";
    const std::string webSphere = address + "/websphere";
    WriteConfiguration("azure", Test::kAzureFile, azure);
    WriteConfiguration("websphere", Test::kWebSphereFile, webSphere);
    const std::string azureToken = Test::ProviderKey().RS256Token(Claims(azure), kKeyID);
    const std::string webSphereToken = Test::HS256Token(Claims(webSphere), CLIENT_SECRET);
    return {
        {"POST /azure" TOKEN_PATH, Test::HTTPAnswer(TokenResponse(azureToken))},
        {"GET /azure" DISCOVERY_PATH, Test::HTTPAnswer(Discovery(azure))},
        {"GET /azure" KEYS_PATH, Test::HTTPAnswer(KeySet())},
        {"POST /websphere" TOKEN_PATH, Test::HTTPAnswer(TokenResponse(webSphereToken))},
    };
}

bool EndsWith(const std::string &text, const std::string &end) {
    return text.size() >= end.size() && text.compare(text.size() - end.size(), end.size(), end) == 0;
}

std::string Answer(const Answers &answers, const std::string &request) {
    const auto answer = answers.find(request.substr(0, request.find(" HTTP/")));
    const bool isForm = request.compare(0, 4, "POST") == 0;
    if (answer == answers.end() || (isForm && !EndsWith(request, "\r\n\r\n" TOKEN_REQUEST))) {
        std::cerr << "login_provider: not answered:\n" << request << "\n";
        return Test::HTTPAnswer("", "400 Bad Request");
    }
    return answer->second;
}

/// Until the client goes.
void Serve(int socket, SSL_CTX *tls, const Answers &answers) {
    const int atOnce = 1;  // as servers do: else an answer waits for the client to have acknowledged the handshake
    setsockopt(socket, IPPROTO_TCP, TCP_NODELAY, &atOnce, sizeof atOnce);
    ERR_clear_error();  // what the last connection left there would count as this one's
    Test::Connection connection(socket, tls, [](const std::string & /*request*/) {});
    for (std::string request; !(request = connection.ReceiveRequest()).empty();) {
        connection.Send(Answer(answers, request));
    }
}

bool IsNextConnection(int listener) {
    pollfd awaited[] = {{listener, POLLIN, 0}, {STDIN_FILENO, POLLIN, 0}};
    return poll(awaited, 2, -1) > 0 && awaited[1].revents == 0;
}

}  // namespace

int main() {
    std::signal(SIGPIPE, SIG_IGN);  // a client that goes away early ends its connection, not the provider
    const Test::Port port;
    const std::shared_ptr<SSL_CTX> tls = MakeTLS();
    const std::string address = "https://127.0.0.1:" + std::to_string(port.number());
    const Answers answers = Configure(address);
    Require(listen(port.socket(), SOMAXCONN) == 0, "listen");
    std::cout << address << std::endl;
    while (IsNextConnection(port.socket())) {
        const int socket = accept4(port.socket(), nullptr, nullptr, SOCK_CLOEXEC);
        if (socket >= 0) {
            Serve(socket, tls.get(), answers);
        }
    }
}
