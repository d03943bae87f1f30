#include <new>

#include "sso/sso.h"
#include "tests/support/interposed/memory.h"
#include "tests/support/interposed/process.h"
#include "tests/unit/fixture.h"

namespace Test {

namespace {

using namespace TAVO::SSO;
using testing::ElementsAre;

class Profile : public Library {
  protected:
    void SetUp() override {
        Library::SetUp();
        WriteFile(kAzureFile, R"({"azure_sso_enable": true, "azure_client_id": "id of azure",
            "azure_client_secret": "made-up", "azure_wellknown": "w", "azure_authorization_endpoint": "a",
            "azure_token_endpoint": "t", "azure_redirect_uri": "r", "azure_logout_endpoint": "l"})");
        WriteFile(kWebSphereFile, R"({"websphere_client_id": "id of websphere"})");
    }

    static void ExpectEmptyClient(SSOProfile &profile) {
        SSOClient *client = profile.GetSSOClient();
        EXPECT_FALSE(client->isEnable());
        for (const std::string &text : {client->GetClientID(), client->GetClientSecret(), client->GetRedirectURI(),
                                        client->GetToken(), client->GetAuthEndpoint(), client->GetTokenEndpoint(),
                                        client->GetWellknownEndpoint(), client->GetLogoutEndpoint()}) {
            EXPECT_EQ(text, "");
        }
    }
};

TEST_F(Profile, IsDisabledAndEmptyWithoutFile) {
    SSOProfile profile;
    EXPECT_FALSE(profile.SSOIsEnable());
    EXPECT_EQ(profile.GetSSOProfile(), "");
    ExpectEmptyClient(profile);
}

TEST_F(Profile, IsDisabledAndEmptyWithMalformedFile) {
    for (const char *file : {"", "{", "sso_enable", R"({"sso_enable": true, "sso_profile": "azure")", "[]", "true"}) {
        WriteFile(kProfileFile, file);
        SSOProfile profile;
        EXPECT_FALSE(profile.SSOIsEnable()) << file;
        EXPECT_EQ(profile.GetSSOProfile(), "") << file;
        ExpectEmptyClient(profile);
    }
}

TEST_F(Profile, IgnoresEnableAsString) {
    WriteFile(kProfileFile, R"({"sso_enable": "true", "sso_profile": "azure"})");
    SSOProfile profile;
    EXPECT_FALSE(profile.SSOIsEnable());
    EXPECT_EQ(profile.GetSSOProfile(), "azure");
    ExpectEmptyClient(profile);
}

TEST_F(Profile, LogsNonStringProfileAsUnsupported) {
    WriteFile(kProfileFile, R"({"sso_enable": true, "sso_profile": 1})");
    SSOProfile profile;
    EXPECT_TRUE(profile.SSOIsEnable());
    EXPECT_EQ(profile.GetSSOProfile(), "");
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("profile:N Profile '' not support")));
}

TEST_F(Profile, ComparesNamesExactly) {
    WriteFile(kProfileFile, R"({"sso_enable": true, "sso_profile": "Azure"})");
    SSOProfile profile;
    EXPECT_TRUE(profile.SSOIsEnable());
    EXPECT_EQ(profile.GetSSOProfile(), "Azure");
    ExpectEmptyClient(profile);
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("profile:N Profile 'Azure' not support")));
}

TEST_F(Profile, ConstructsNoClientIfDisabled) {
    WriteFile(kProfileFile, R"({"sso_enable": false, "sso_profile": "azure"})");
    SetEffectiveIDs(0, 100);
    SSOProfile profile;
    EXPECT_FALSE(profile.SSOIsEnable());
    EXPECT_EQ(profile.GetSSOProfile(), "azure");
    ExpectEmptyClient(profile);
    EXPECT_THAT(TakeSystemLog(), ElementsAre(LogLine{LOG_AUTH | LOG_INFO, "profile:N WARNING: setresgid(-1, 0, -1)"}))
        << "the client's own file must not be read";
}

TEST_F(Profile, CopiesSettingsOfAzureClient) {
    WriteFile(kProfileFile, R"({"sso_enable": true, "sso_profile": "azure", "other": {}})");
    SSOProfile profile;
    EXPECT_TRUE(profile.SSOIsEnable());
    EXPECT_EQ(profile.GetSSOProfile(), "azure");
    SSOClient *client = profile.GetSSOClient();
    EXPECT_TRUE(client->isEnable());
    EXPECT_EQ(client->GetClientID(), "id of azure");
    EXPECT_EQ(client->GetClientSecret(), "made-up");
    EXPECT_EQ(client->GetWellknownEndpoint(), "w");
    EXPECT_EQ(client->GetAuthEndpoint(), "a");
    EXPECT_EQ(client->GetTokenEndpoint(), "t");
    EXPECT_EQ(client->GetRedirectURI(), "r");
    EXPECT_EQ(client->GetLogoutEndpoint(), "l");
    EXPECT_EQ(client->GetToken(), "");
}

TEST_F(Profile, CopiesSettingsOfDisabledWebSphereClient) {
    WriteFile(kProfileFile, R"({"sso_enable": true, "sso_profile": "websphere"})");
    SSOProfile profile;
    EXPECT_TRUE(profile.SSOIsEnable());
    EXPECT_EQ(profile.GetSSOClient()->GetClientID(), "id of websphere");
    EXPECT_FALSE(profile.GetSSOClient()->isEnable());
}

TEST_F(Profile, ReturnsClientThatCannotLogIn) {
    WriteFile(kProfileFile, R"({"sso_enable": true, "sso_profile": "azure"})");
    SSOProfile profile;
    std::string userName;
    EXPECT_EQ(FailureOf([&] { profile.GetSSOClient()->OpenIDConnectLogin("abc", userName); }),
              Fails<sso_not_implemented>("GetIDTokenReqParams not implemented"));
}

TEST_F(Profile, ReadsFileOnceAtConstruction) {
    WriteFile(kProfileFile, R"({"sso_enable": true, "sso_profile": "azure"})");
    SSOProfile profile;
    WriteFile(kProfileFile, R"({"sso_enable": false})");
    EXPECT_TRUE(profile.SSOIsEnable());
    EXPECT_EQ(profile.GetSSOProfile(), "azure");
}

TEST_F(Profile, PropagatesExceptionOfClientConstructor) {
    WriteFile(kProfileFile, R"({"sso_enable": true, "sso_profile": "websphere"})");
    WriteFile(kWebSphereFile, R"({"websphere_client_id": ")" + std::string(100000, 'x') + "\"}");
    const MemoryLimit limit(50000);
    EXPECT_THROW(SSOProfile(), std::bad_alloc);
}

TEST_F(Profile, AlwaysReturnsSameClient) {
    SSOProfile profile;
    EXPECT_NE(profile.GetSSOClient(), nullptr);
    EXPECT_EQ(profile.GetSSOClient(), profile.GetSSOClient());
}

}  // namespace

}  // namespace Test
