#include "tests/e2e/soak/provider_process.h"

#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <filesystem>
#include <map>
#include <stdexcept>
#include <string>

#include "tests/loopback/loopback_provider.h"
#include "tests/support/files.h"
#include "tests/support/token.h"

namespace Test {

namespace {

void Require(bool condition, const char *what) {
    if (!condition) {
        throw std::runtime_error(what);
    }
}

/// The answers to requests that contain a text.
using Answers = std::map<std::string, std::string>;

std::string Form(const char *code) { return std::string("&code=") + code + "&"; }

std::string ForgedToken(Profile profile) {
    return profile == Profile::kAzure ? RSAKey().RS256Token(TokenClaims(profile), kKeyID)
                                      : HS256Token(TokenClaims(profile), "another secret");
}

Answers AnswersOf(Profile profile, const Provider &provider) {
    const std::string token = SignedToken(TokenHeader(profile), TokenClaims(profile));
    return {
        {Form(kGoodCode), HTTPAnswer(TokenResponse(token))},
        {Form(kForgedCode), HTTPAnswer(TokenResponse(ForgedToken(profile)))},
        {Form(kRefusedCode), HTTPAnswer(R"({"token_type": "Bearer"})")},
        {"GET /discovery ", HTTPAnswer(R"({"jwks_uri": ")" + provider.URL("/keys") + "\"}")},
        {"GET /keys ", HTTPAnswer(KeySet())},
    };
}

std::string Find(const Answers &answers, const std::string &request) {
    for (const auto &[text, answer] : answers) {
        if (request.find(text) != std::string::npos) {
            return answer;
        }
    }
    return HTTPAnswer("", "404 Not Found");
}

/// Answers the next connection, and adds the script for the one after it.
void AnswerEachConnection(Provider &provider, const Answers &answers) {
    provider.Play([&provider, &answers](Connection &connection) {
        AnswerEachConnection(provider, answers);
        connection.Send(Find(answers, connection.ReceiveRequest()));
    });
}

std::string AuthorizationEndpointOf(const char *prefix) {
    return std::string("{\"") + prefix + R"(_authorization_endpoint": ")" + kAuthorizationEndpoint + "\"}";
}

/// Serves until the other end of the socket is closed.
void Provide(int life) {
    Provider azure(Profile::kAzure, AuthorizationEndpointOf("azure"));
    // The next provider removes all files.
    const std::filesystem::path kept = "/tmp/azure.conf";
    std::filesystem::copy(kAzureFile, kept);
    Provider webSphere(Profile::kWebSphere, AuthorizationEndpointOf("websphere"));
    std::filesystem::copy(kept, kAzureFile);

    const Answers azureAnswers = AnswersOf(Profile::kAzure, azure);
    const Answers webSphereAnswers = AnswersOf(Profile::kWebSphere, webSphere);
    AnswerEachConnection(azure, azureAnswers);
    AnswerEachConnection(webSphere, webSphereAnswers);

    char byte = 0;
    Require(write(life, &byte, 1) == 1, "write");
    while (read(life, &byte, 1) > 0) {
    }
}

}  // namespace

ProviderProcess::ProviderProcess() : process_(-1), life_(-1) {
    int ends[2];
    Require(socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends) == 0, "socketpair");
    std::fflush(nullptr);
    process_ = fork();
    Require(process_ >= 0, "fork");
    if (process_ == 0) {
        close(ends[0]);
        Provide(ends[1]);
        _exit(0);
    }
    close(ends[1]);
    life_ = ends[0];
    char byte = 0;
    Require(read(life_, &byte, 1) == 1, "the providers' process did not start");
}

ProviderProcess::~ProviderProcess() {
    close(life_);
    waitpid(process_, nullptr, 0);
}

}  // namespace Test
