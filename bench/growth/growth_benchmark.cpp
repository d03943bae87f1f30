// Measures how the time depends on the size of the token, of the key set and of the state.
#include <json/json.h>

#include <algorithm>
#include <memory>
#include <string>

#include "bench/comparison.h"
#include "bench/verification/verifiers.h"
#include "sso/sso.h"
#include "tests/support/files.h"
#include "tests/support/token.h"

#pragma GCC diagnostic ignored "-Wdeprecated-declarations"  // the library parses with Json::Reader

namespace {

using Bench::Comparison;
using Bench::SignedToken;

constexpr char kDiscoveryURL[] = "discovery";
constexpr char kConfiguration[] = R"({
    "azure_wellknown": "discovery", "azure_tenant_id": "6a404290-634b-4458-b016-3eeac818f228",
    "azure_client_id": "9f1c2c2e-1d0e-4a3f-8b0e-5d6f7a8b9c0d"})";

Comparison TokenOf(std::size_t bytes, const std::string &size) {
    const SignedToken token = MakeToken(Bench::Algorithm::kRS256, bytes);
    return {"RS256 token, " + size, [token] { return VerifyByLibrary(token); }, "the floor",
            [token] { return VerifyByFloor(token); }, 1.03};
}

/// The token's key is the last one.
std::string KeySet(std::size_t size) {
    Json::Value key = Bench::PublicKey();
    Json::Value keys;
    for (std::size_t i = 1; i < size; ++i) {
        Json::Value other = key;
        other["kid"] = "key " + std::to_string(i);
        keys["keys"].append(other);
    }
    keys["keys"].append(key);
    return Test::Compact(keys);
}

/// httpGet, below, returns this for every address except the discovery document's.
std::string publishedKeySet;

class ClientWithToken : public TAVO::SSO::AzureSSOClient {
  public:
    explicit ClientWithToken(const std::string &idToken) { token = idToken; }
};

std::size_t Append(char *data, std::size_t size, std::size_t count, void *response) {
    static_cast<std::string *>(response)->append(data, size * count);
    return size * count;
}

bool ReceiveAndParse() {
    std::string response;
    TAVO::SSO::httpGet("keys", response, true, Append);
    Json::Value keys;
    return Json::Reader().parse(response.data(), response.data() + response.size(), keys, true);
}

Comparison KeySetOf(std::size_t keys, double limit = 0) {
    const auto client = std::make_shared<ClientWithToken>(MakeToken(Bench::Algorithm::kRS256, 300).compact);
    const auto verify = [client] {
        client->VerifyIDToken();  // throws if the token is invalid
        return true;
    };
    const std::string keySet = KeySet(keys);
    return {"verification with a set of " + std::to_string(keys) + " keys",
            verify,
            "receiving and parsing it",
            ReceiveAndParse,
            limit,
            [keySet] { publishedKeySet = keySet; }};
}

bool MakesAuthorizationURL(const Json::Value &state) {
    static TAVO::SSO::AzureSSOClient client;
    return !client.GetAccessTokenReqURI(state).empty();
}

Json::Value StateOf(std::size_t bytes) {
    Json::Value state;
    state["origin"] = std::string(bytes, 'o');
    return state;
}

/// 700 bytes are close to the limit of the state.
Comparison LargestState() {
    return {"authorization URL, state of 700 bytes", [state = StateOf(700)] { return MakesAuthorizationURL(state); },
            "state of 16 bytes", [state = StateOf(16)] { return MakesAuthorizationURL(state); }, 1.1};
}

}  // namespace

namespace TAVO::SSO {

/// Replaces the library's function. Passes documents in blocks, as libcurl does, without a transfer.
void httpGet(const std::string &url, std::string &response, bool /*verifySSL*/,
             std::size_t (*writeCallback)(char *, std::size_t, std::size_t, void *)) {
    static std::string discovery = R"({"jwks_uri": "keys"})";
    std::string &document = url == kDiscoveryURL ? discovery : publishedKeySet;
    constexpr std::size_t kBlock = 16384;
    for (std::size_t sent = 0; sent < document.size(); sent += kBlock) {
        writeCallback(document.data() + sent, 1, std::min(kBlock, document.size() - sent), &response);
    }
}

}  // namespace TAVO::SSO

int main(int argc, char **argv) {
    Test::WriteFile(Test::kAzureFile, kConfiguration);
    return Bench::RunComparisons(
        {
            TokenOf(16 << 10, "16 KB"),
            TokenOf(1 << 20, "1 MB"),
            KeySetOf(10),
            KeySetOf(1000),
            KeySetOf(10000, 1.1),
            LargestState(),
        },
        argc, argv);
}
