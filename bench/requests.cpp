// The texts of a login's requests: what each costs beside the transfers.
#include <json/json.h>

#include <string>

#include "bench/support/measure.h"
#include "sso/sso.h"
#include "tests/support/encoding.h"
#include "tests/support/files.h"
#include "tests/support/token.h"

namespace Bench {

namespace {

constexpr char kAzure[] = R"({
    "azure_sso_enable": true, "azure_wellknown": "https://idp.example/.well-known/openid-configuration",
    "azure_client_id": "9f1c2c2e-1d0e-4a3f-8b0e-5d6f7a8b9c0d", "azure_client_secret": "0123456789abcdef0123456789abcdef",
    "azure_tenant_id": "6a404290-634b-4458-b016-3eeac818f228",
    "azure_authorization_endpoint": "https://idp.example/oauth2/authorize",
    "azure_token_endpoint": "https://idp.example/oauth2/token",
    "azure_redirect_uri": "https://nas.example.net:5001/webman/sso/return.cgi",
    "azure_logout_endpoint": "https://idp.example/oauth2/logout"})";
constexpr char kOrigin[] = R"({"origin": "https://nas.example.net:5001/webman/index.cgi"})";

void RegisterAll() {
    Test::WriteFile(Test::kAzureFile, kAzure);
    static TAVO::SSO::AzureSSOClient client;
    client.SetCode(std::string(700, 'c'));  // about what a provider sends
    const Json::Value state = Test::Parse(kOrigin);
    const std::string encodedState = Test::Base64(kOrigin);

    Register("requests/authorization URL/ours", [state] { return !client.GetAccessTokenReqURI(state).empty(); });
    Register("requests/token request body/ours", [] { return !client.GetIDTokenReqParams().empty(); });
    Register("requests/relay URL/ours",
             [encodedState] { return !TAVO::SSO::GetSSORelayURL(true, encodedState, "").empty(); });
    // Reads the client's file, which the others have in hand.
    Register("requests/logout URL/ours",
             [] { return !TAVO::SSO::GetAzureSSOLogoutURL("https://nas.example.net:5001/webman/index.cgi").empty(); });
}

}  // namespace

}  // namespace Bench

int main(int argc, char **argv) {
    Bench::RegisterAll();
    return Bench::RunBenchmarks(argc, argv);
}
