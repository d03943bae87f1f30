// How the time grows with what a provider, or the front end, hands over.
#include <json/json.h>

#include <algorithm>
#include <memory>
#include <string>

#include "bench/support/measure.h"
#include "bench/verification/subjects.h"
#include "sso/sso.h"
#include "tests/support/encoding.h"
#include "tests/support/files.h"
#include "tests/support/token.h"

#pragma GCC diagnostic ignored "-Wdeprecated-declarations"  // the reader that the library parses with

namespace Bench {

namespace {

constexpr char kDiscoveryAddress[] = "discovery";
constexpr char kKeySetAddress[] = "keys";
constexpr char kClient[] = R"({
    "azure_wellknown": "discovery", "azure_tenant_id": "6a404290-634b-4458-b016-3eeac818f228",
    "azure_client_id": "9f1c2c2e-1d0e-4a3f-8b0e-5d6f7a8b9c0d"})";
constexpr Algorithm kRS256{"RS256", Kind::kRSA, EVP_sha256, 2048};

std::string Name(const char *what, std::size_t size, const char *subject) {
    return std::string("growth/") + what + "/" + std::to_string(size) + "/" + subject;
}

void RegisterTokenSizes() {
    for (std::size_t size = 1024; size <= 1024 * 1024; size *= 4) {
        const auto token = std::make_shared<const SignedToken>(MakeToken(kRS256, size));
        Register(Name("token size", size, "ours"), [token] { return VerifyByLibrary(*token); });
        Register(Name("token size", size, "floor"), [token] { return VerifyByFloor(*token); });
    }
}

/// The token's key behind others that have the same form.
std::string KeySet(std::size_t size, const SignedToken &token) {
    Json::Value keys;
    const Json::Value key = Test::Parse(token.jwk);
    for (std::size_t i = 1; i < size; ++i) {
        Json::Value other = key;
        other["kid"] = "key " + std::to_string(i);
        keys["keys"].append(other);
    }
    keys["keys"].append(key);
    return Test::Compact(keys);
}

/// What the provider in this program has under the address of its key set.
std::string &PublishedKeySet() {
    static std::string keySet;
    return keySet;
}

/// A client that has got its token.
class LoggingIn : public TAVO::SSO::AzureSSOClient {
  public:
    explicit LoggingIn(const std::string &idToken) { token = idToken; }
};

bool Parses(const std::string &document) {
    Json::Value value;
    return Json::Reader().parse(document.data(), document.data() + document.size(), value, true);
}

void RegisterKeySets() {
    Test::WriteFile(Test::kAzureFile, kClient);
    const SignedToken token = MakeToken(kRS256, 300);
    const auto client = std::make_shared<LoggingIn>(token.compact);
    for (const std::size_t size : {1, 10, 100, 1000, 10000}) {
        const std::string keySet = KeySet(size, token);
        Register(Name("key set", size, "ours"), [client, keySet] {
            if (PublishedKeySet().size() != keySet.size()) {
                PublishedKeySet() = keySet;
            }
            client->VerifyIDToken();
            return true;
        });
        Register(Name("key set", size, "floor"), [keySet] { return Parses(keySet); });
    }
}

/// Up to what fits into the text that the state is encoded into.
void RegisterStates() {
    static TAVO::SSO::AzureSSOClient client;
    for (const std::size_t size : {16, 32, 64, 128, 256, 512, 700}) {
        Json::Value state;
        state["origin"] = std::string(size, 'o');
        Register(Name("state", size, "ours"), [state] { return !client.GetAccessTokenReqURI(state).empty(); });
    }
}

}  // namespace

}  // namespace Bench

namespace TAVO::SSO {

/// The library's calls of this function come here: documents as libcurl hands them over, without their transfer.
void httpGet(const std::string &url, std::string &response, bool /*verifySSL*/,
             std::size_t (*writeCallback)(char *, std::size_t, std::size_t, void *)) {
    static std::string discovery = std::string(R"({"jwks_uri": ")") + Bench::kKeySetAddress + R"("})";
    std::string &document = url == Bench::kDiscoveryAddress ? discovery : Bench::PublishedKeySet();
    constexpr std::size_t kChunk = 16384;
    for (std::size_t sent = 0; sent < document.size(); sent += kChunk) {
        writeCallback(document.data() + sent, 1, std::min(kChunk, document.size() - sent), &response);
    }
}

}  // namespace TAVO::SSO

int main(int argc, char **argv) {
    Bench::RegisterTokenSizes();
    Bench::RegisterKeySets();
    Bench::RegisterStates();
    return Bench::RunBenchmarks(argc, argv);
}
