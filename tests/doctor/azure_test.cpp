#include <gmock/gmock.h>

#include <boost/algorithm/string/case_conv.hpp>
#include <string>

#include "tests/doctor/appliance.h"
#include "tests/doctor/doctor_process.h"

// Settings of Azure AD that must agree.
namespace Test {

namespace {

using ::testing::AllOf;
using ::testing::Each;
using ::testing::HasSubstr;
using ::testing::Not;

class AzureSettings : public ::testing::Test {
  protected:
    Appliance appliance{Profile::kAzure};
};

TEST_F(AzureSettings, RejectsTenantThatIsNoGUID) {
    for (const char *tenant : {"common", "organizations", "corp.onmicrosoft.com"}) {
        appliance.SetClient("tenant_id", tenant);
        const Check finding = Ask({}).Find("client.tenant_id", "finding");
        EXPECT_THAT(finding.found, HasSubstr("is not a GUID"));
        EXPECT_THAT(finding.remedy, HasSubstr("directory (tenant) ID"));
    }
}

TEST_F(AzureSettings, TenantInCapitalsIsAFinding) {
    appliance.SetClient("tenant_id", boost::to_upper_copy(std::string(kTenant)));
    const Check finding = OnlyFinding();
    EXPECT_EQ(finding.id, "discovery.tenant");
    EXPECT_EQ(finding.remedy, "Set azure_tenant_id to \"" + std::string(kTenant) + "\"");
    appliance.ChangeDiscovery(R"({"issuer": "https://sts.example/"})");
    EXPECT_EQ(OnlyFinding().id, "discovery.tenant") << "without a tenant in the issuer";
}

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
    const Check finding = Ask({}).FirstFinding();
    EXPECT_EQ(finding.remedy, "Swap the values of azure_client_id and azure_client_secret.");
    EXPECT_THAT(RunDoctor({"login"}).errors, HasSubstr("azure_client_id is not a GUID"));
}

TEST_F(AzureSettings, ReportsMixedVersionsWithValueToSet) {
    appliance.AnswerAt("/token", [](const std::string & /*request*/) { return std::string(); });
    appliance.MoveEndpoint("token_endpoint", appliance.URL("/oauth2/v2.0/token"));
    const Check finding = Ask({}).Find("client.version", "finding");
    EXPECT_THAT(finding.found, AllOf(HasSubstr("azure_wellknown, azure_authorization_endpoint are v1"),
                                     HasSubstr("azure_token_endpoint is v2.0")));
    EXPECT_EQ(finding.remedy, "Set azure_token_endpoint to \"" + appliance.URL("/oauth2/token") + "\"");
}

TEST_F(AzureSettings, NotesOptionalClaimOfVersion2) {
    for (const char *key : {"wellknown", "authorization_endpoint", "token_endpoint"}) {
        appliance.SetClient(key, appliance.URL(std::string("/v2.0/") + key));
    }
    EXPECT_THAT(Ask({}).Find("client.version", "note").remedy, HasSubstr("optional claim \"email\""));
}

TEST_F(AzureSettings, ReportsAddressForSeveralTenants) {
    std::string url = appliance.URL("/token_endpoint");
    url.replace(url.find(kTenant), std::string(kTenant).size(), "common");
    appliance.SetClient("token_endpoint", url);
    const Check finding = Ask({}).FirstFinding();
    EXPECT_EQ(finding.id, "client.tenant");
    EXPECT_EQ(finding.remedy, "Set azure_token_endpoint to \"" + appliance.URL("/token_endpoint") + "\"");
}

}  // namespace

}  // namespace Test
