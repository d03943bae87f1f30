#include <gmock/gmock.h>

#include <string>

#include "tests/doctor/appliance.h"
#include "tests/doctor/doctor_process.h"

// Settings of Azure AD.
namespace Test {

namespace {

using ::testing::Each;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::Not;

class AzureSettings : public ::testing::Test {
  protected:
    Appliance appliance{Profile::kAzure};
};

TEST_F(AzureSettings, HidesClientIDThatIsNoGUID) {
    constexpr char kOther[] = "Qx8~not-a-client-id-but-a-secret";
    KeepSecret(kOther);
    appliance.SetClient("client_id", kOther);
    const Check finding = Ask({}).FirstFinding();
    EXPECT_EQ(finding.id, "client.client_id");
    EXPECT_THAT(appliance.Requests(), Each(Not(HasSubstr("client_id="))));
    for (const char *command : {"login", "token"}) {
        RunDoctor(command == std::string("token") ? Strings{"token", "-"} : Strings{"login"}, appliance.Token());
    }
}

TEST_F(AzureSettings, SwappedIDAndSecretAreNotPrinted) {
    appliance.SetClient("client_id", kClientSecret);
    appliance.SetClient("client_secret", kClientID);
    EXPECT_EQ(Ask({}).FirstFinding().id, "client.client_id");
    EXPECT_THAT(RunDoctor({"login"}).errors, HasSubstr("azure_client_id is not a GUID"));
}

TEST_F(AzureSettings, NotesOptionalClaimOfVersion2) {
    for (const char *key : {"wellknown", "authorization_endpoint", "token_endpoint"}) {
        appliance.SetClient(key, appliance.URL(std::string("/v2.0/") + key));
    }
    EXPECT_THAT(Ask({}).Find("client.version", "note").remedy, HasSubstr("optional claim \"email\""));
}

TEST_F(AzureSettings, WrongLogoutEndpointAffectsSignOutOnly) {
    for (const char *endpoint : {"https://", "http://login.example/logout", "https://login.example/logout?x=1"}) {
        appliance.SetClient("logout_endpoint", endpoint);
        const Check finding = Ask({}).Find("client.logout_endpoint", "finding");
        EXPECT_THAT(finding.found, EndsWith("Sign-in works, sign-out at the provider does not")) << endpoint;
    }
}

}  // namespace

}  // namespace Test
