// A configuration file. The first input line is its name, the rest its content. An input is accepted if a client reads
// a setting from it, or if the profile is enabled and names a provider.
#include <optional>
#include <stdexcept>

#include "sso/sso.h"
#include "tests/fuzz/oracle.h"
#include "tests/fuzz/target.h"
#include "tests/support/files.h"
#include "tests/support/interposed/transport.h"

namespace Fuzz {

namespace {

constexpr char kAzure[] = R"({"azure_sso_enable": true, "azure_client_id": "azure-client",
    "azure_client_secret": "secret-of-the-azure-client", "azure_token_endpoint": "https://azure.example.com/token"})";
constexpr char kWebSphere[] = R"({"websphere_client_id": "websphere-client",
    "websphere_client_secret": "secret-of-the-websphere-client",
    "websphere_token_endpoint": "https://websphere.example.com/token"})";

bool HasSetting(TAVO::SSO::SSOClient &client) {
    return client.isEnable() || !client.GetWellknownEndpoint().empty() || !client.GetClientID().empty() ||
           !client.GetClientSecret().empty() || !client.GetAuthEndpoint().empty() ||
           !client.GetTokenEndpoint().empty() || !client.GetRedirectURI().empty() ||
           !client.GetLogoutEndpoint().empty();
}

struct Azure : TAVO::SSO::AzureSSOClient {
    bool HasSetting() { return Fuzz::HasSetting(*this) || !tenantID.empty(); }
};

struct WebSphere : TAVO::SSO::WebSphereSSOClient {
    bool HasSetting() { return Fuzz::HasSetting(*this); }
};

template <typename Client>
bool Configures(const char *file, const std::string &content) {
    Test::WriteFile(file, content);
    std::optional<Client> client;
    RequireSame(FailureOf([&] { client.emplace(); }), Test::kNothingThrown);
    RequireLog({});
    Require(client->GetToken().empty(), "a token was read from the file");
    const bool isConfigured = client->HasSetting();
    Require(!isConfigured || ParseJson(content), "settings were read from invalid JSON");
    return isConfigured;
}

/// No server answers, so every login fails.
void RequireRefusedLogin(bool sendsRequest) {
    Test::ResetTransport();
    std::string userName = "unchanged";
    RequireOneOf(FailureOf([&] { TAVO::SSO::OIDCLogin("code-of-this-login", userName); }),
                 {Test::Fails<TAVO::SSO::sso_op_failed>("read profile file failed."),
                  Test::Fails<TAVO::SSO::sso_op_failed>("sso does not enable."),
                  Test::Fails<TAVO::SSO::sso_op_failed>("not specify sso profile"),
                  Test::Fails<TAVO::SSO::sso_exception>("profile not support."),
                  Test::Fails<std::invalid_argument>("parse json falied")});
    Require(userName == "unchanged", "a failed login changed the user name");
    Require(Test::CurrentTransport().urls.size() == (sendsRequest ? 1U : 0U), "unexpected number of requests");
}

bool ChoosesProfile(const std::string &content) {
    Test::WriteFile(Test::kProfileFile, content);
    Test::WriteFile(Test::kAzureFile, kAzure);
    Test::WriteFile(Test::kWebSphereFile, kWebSphere);
    std::optional<TAVO::SSO::SSOProfile> profile;
    RequireSame(FailureOf([&] { profile.emplace(); }), Test::kNothingThrown);
    Test::TakeSystemLog();

    const std::string name = profile->GetSSOProfile();
    const bool isEnabled = profile->SSOIsEnable() && (name == "azure" || name == "websphere");
    Require(profile->GetSSOClient()->GetClientID() == (isEnabled ? name + "-client" : ""),
            "the settings are not those of the profile's client");
    RequireRefusedLogin(isEnabled);
    Test::TakeSystemLog();
    return isEnabled;
}

}  // namespace

bool Accepts(const std::string &input) {
    const std::vector<std::string> lines = Lines(input, 2);
    if (lines[0] == "azure.conf") {
        return Configures<Azure>(Test::kAzureFile, lines[1]);
    }
    if (lines[0] == "websphere.conf") {
        return Configures<WebSphere>(Test::kWebSphereFile, lines[1]);
    }
    return lines[0] == "profile.conf" && ChoosesProfile(lines[1]);
}

}  // namespace Fuzz
