// A configuration file: the first line of an input names it, the rest is its content. It is good when a client takes a
// setting from it, or the profile when it names a provider that is on.
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
constexpr char kCode[] = "code-of-this-login";

using Settings = std::vector<std::string>;

/// In the order of the getters below.
Settings Read(const Json::Value &file, const std::string &prefix) {
    Settings settings;
    for (const char *name : {"wellknown", "client_id", "client_secret", "authorization_endpoint", "token_endpoint",
                             "redirect_uri", "logout_endpoint"}) {
        settings.push_back(StringMember(file, prefix + name).value_or(""));
    }
    return settings;
}

Settings SettingsOf(TAVO::SSO::SSOClient &client) {
    return {client.GetWellknownEndpoint(), client.GetClientID(),    client.GetClientSecret(),  client.GetAuthEndpoint(),
            client.GetTokenEndpoint(),     client.GetRedirectURI(), client.GetLogoutEndpoint()};
}

bool IsTrue(const Json::Value &file, const std::string &name) {
    const Json::Value *member = Member(file, name);
    return member != nullptr && member->isBool() && member->asBool();
}

struct Azure : TAVO::SSO::AzureSSOClient {
    using AzureSSOClient::tenantID;
};

bool ConfiguresAzure(const std::string &content) {
    Test::WriteFile(Test::kAzureFile, content);
    std::optional<Azure> client;
    RequireSame(FailureOf([&] { client.emplace(); }), Test::kNothingThrown);

    const Json::Value file = ParseJson(content).value_or(Json::Value());
    const std::string tenantID = StringMember(file, "azure_tenant_id").value_or("");
    const Settings settings = Read(file, "azure_");
    Require(SettingsOf(*client) == settings && client->tenantID == tenantID &&
                client->isEnable() == IsTrue(file, "azure_sso_enable"),
            "the settings are the file's");
    Require(client->GetToken().empty(), "no token is configured");
    RequireLog({});
    return client->isEnable() || !tenantID.empty() || settings != Settings(settings.size());
}

bool ConfiguresWebSphere(const std::string &content) {
    Test::WriteFile(Test::kWebSphereFile, content);
    std::optional<TAVO::SSO::WebSphereSSOClient> client;
    RequireSame(FailureOf([&] { client.emplace(); }), Test::kNothingThrown);

    const Settings settings = Read(ParseJson(content).value_or(Json::Value()), "websphere_");
    Require(SettingsOf(*client) == settings, "the settings are the file's");
    Require(!client->isEnable() && client->GetToken().empty(), "neither the switch nor a token is configured");
    RequireLog({});
    return settings != Settings(settings.size());
}

/// What the profile in force must be, and what a login by it must come to when nobody answers.
struct Profile {
    explicit Profile(const std::optional<Json::Value> &file)
        : isJson(file.has_value()),
          enable(IsTrue(file.value_or(Json::Value()), "sso_enable")),
          name(StringMember(file.value_or(Json::Value()), "sso_profile")) {}

    bool IsAzure() const { return name == "azure"; }
    bool IsSupported() const { return IsAzure() || name == "websphere"; }

    Settings ExpectedSettings() const {
        if (!enable || !IsSupported()) {
            return Settings(7);
        }
        return IsAzure() ? Read(*ParseJson(kAzure), "azure_") : Read(*ParseJson(kWebSphere), "websphere_");
    }

    void LogIn() const {
        if (!isJson) {
            throw TAVO::SSO::sso_op_failed("read profile file failed.");
        }
        if (!enable) {
            throw TAVO::SSO::sso_op_failed("sso does not enable.");
        }
        if (!name) {
            throw TAVO::SSO::sso_op_failed("not specify sso profile");
        }
        if (!IsSupported()) {
            throw TAVO::SSO::sso_exception("profile not support.");
        }
        throw std::invalid_argument("parse json falied");
    }

    bool isJson;
    bool enable;
    std::optional<std::string> name;
};

void RequireLogin(const Profile &expected) {
    Test::ResetTransport();
    std::string userName = "as it was";
    RequireSame(FailureOf([&] { TAVO::SSO::OIDCLogin(kCode, userName); }), Test::FailureOf([&] { expected.LogIn(); }));
    Require(userName == "as it was", "nobody is named who did not log in");
    if (!expected.enable || !expected.IsSupported()) {
        RequireLog({});
        Require(Test::CurrentTransport().urls.empty(), "nobody is asked");
        return;
    }
    const std::string name = expected.IsAzure() ? "azure" : "websphere";
    RequireLog({"sso:N request token uri Couldn't connect to server."});
    Require(Test::CurrentTransport().urls == std::vector<std::string>{"https://" + name + ".example.com/token"},
            "the provider is asked, once");
    Require(Test::CurrentTransport().form == "client_id=" + name + "-client&client_secret=secret-of-the-" + name +
                                                 "-client&code=" + kCode +
                                                 "&grant_type=authorization_code&redirect_uri=",
            "it is shown the code and the secret");
}

bool ChoosesProfile(const std::string &content) {
    Test::WriteFile(Test::kProfileFile, content);
    Test::WriteFile(Test::kAzureFile, kAzure);
    Test::WriteFile(Test::kWebSphereFile, kWebSphere);
    std::optional<TAVO::SSO::SSOProfile> profile;
    RequireSame(FailureOf([&] { profile.emplace(); }), Test::kNothingThrown);

    const Profile expected(ParseJson(content));
    Require(profile->SSOIsEnable() == expected.enable && profile->GetSSOProfile() == expected.name.value_or(""),
            "the profile is the file's");
    Require(SettingsOf(*profile->GetSSOClient()) == expected.ExpectedSettings(), "the settings are its client's");
    const bool isUnknown = expected.enable && !expected.IsSupported();
    RequireLog(isUnknown ? std::vector<std::string>{"profile:N Profile '" + UpToNUL(expected.name.value_or("")) +
                                                    "' not support"}
                         : std::vector<std::string>{});
    RequireLogin(expected);
    return expected.enable && expected.IsSupported();
}

}  // namespace

bool Accepts(const std::string &input) {
    const std::vector<std::string> lines = Lines(input, 2);
    if (lines[0] == "azure.conf") {
        return ConfiguresAzure(lines[1]);
    }
    if (lines[0] == "websphere.conf") {
        return ConfiguresWebSphere(lines[1]);
    }
    return lines[0] == "profile.conf" && ChoosesProfile(lines[1]);
}

}  // namespace Fuzz
