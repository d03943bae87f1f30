#include "tests/support/files.h"

#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <string>

#include "tests/doctor/appliance.h"
#include "tests/doctor/doctor_process.h"

// Errors in the configuration files and the findings for them.
namespace Test {

namespace {

using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;

constexpr uid_t kNobody = 65534;

class FileCheck : public ::testing::Test {
  protected:
    Check FirstFindingWith(const std::string &clientKey, const Json::Value &value) {
        appliance.SetClient(clientKey, value);
        const Check finding = Ask({}).FirstFinding();
        EXPECT_EQ(finding.id, "client." + clientKey);
        return finding;
    }

    Appliance appliance{Profile::kAzure};
};

TEST_F(FileCheck, ReportsLineAndColumnOfJSONError) {
    WriteFile(kAzureFile, "{\n  \"azure_client_id\": \"the client\",\n  \"azure_tenant_id\" \"the tenant\"\n}\n");
    EXPECT_THAT(Ask({}).Find("client.file", "finding").found, HasSubstr("line 3, column 21: "));
}

TEST_F(FileCheck, HidesSecretWithoutQuotationMarks) {
    WriteFile(kAzureFile, "{\"azure_client_secret\": -" + std::string(kClientSecret) + "}");
    EXPECT_EQ(Ask({}).FirstFinding().id, "client.file");
}

TEST(ClientSecret, IsNotedIfShorterThanHS256Key) {
    Appliance appliance(Profile::kWebSphere);
    appliance.SetClient("client_secret", std::string(31, 'k'));
    EXPECT_THAT(Ask({}).Find("client.client_secret", "note").found, HasSubstr("31 bytes. "));
    appliance.SetClient("client_secret", std::string(32, 'k'));
    EXPECT_EQ(Ask({}).Find("client.client_secret", "good").found, "is set, 32 bytes");
}

TEST(ClientSecret, MayBeShortForAzure) {
    Appliance appliance(Profile::kAzure);
    appliance.SetClient("client_secret", "a short one");
    EXPECT_EQ(Ask({}).Find("client.client_secret", "good").found, "is set, 11 bytes");
}

TEST_F(FileCheck, NotesStringInsteadOfBoolean) {
    appliance.SetClient("sso_enable", "yes");
    EXPECT_THAT(Ask({}).Find("client.sso_enable", "note").found, HasSubstr("not a boolean"));
}

TEST_F(FileCheck, ReportsNumberInsteadOfString) {
    EXPECT_THAT(FirstFindingWith("client_id", 4711).found, HasSubstr("not a string"));
}

TEST_F(FileCheck, ReportsMissingKey) {
    EXPECT_THAT(FirstFindingWith("redirect_uri", Json::Value()).found, HasSubstr("is not a string"));
    appliance.ChangeClientFile(R"({"azure_redirect_uri": null})");
    EXPECT_EQ(OnlyFinding().found, "is missing");
}

TEST_F(FileCheck, SuggestsSimilarKey) {
    appliance.ChangeClientFile(R"({"azure_Client_id": "the client", "azure_client_id": null})");
    const Report report = Ask({});
    EXPECT_THAT(report.Findings(), ElementsAre("client.unknown_key", "client.client_id", "token_endpoint.client"));
    EXPECT_THAT(report.FirstFinding().remedy, HasSubstr("\"azure_client_id\""));
}

TEST_F(FileCheck, NotesUnknownKey) {
    appliance.ChangeClientFile(R"({"written_by": "the administrator"})");
    const Report report = Ask({});
    EXPECT_THAT(report.Find("client.unknown_key", "note").found, HasSubstr("\"written_by\""));
    EXPECT_THAT(report.Findings(), IsEmpty());
}

TEST_F(FileCheck, SendsNoSecretToEndpointWithoutTLS) {
    appliance.MoveEndpoint("token_endpoint", "http" + appliance.URL("/token_endpoint").substr(5));
    const Report report = Ask({});
    EXPECT_THAT(report.Findings(), ElementsAre("client.token_endpoint"));
    EXPECT_EQ(report.Find("token_endpoint.reachable", "not checked").id, "token_endpoint.reachable");
    EXPECT_THAT(appliance.Requests(), Not(Contains(HasSubstr("client_secret"))));
}

TEST_F(FileCheck, ReportsInvalidEndpoint) {
    EXPECT_THAT(FirstFindingWith("authorization_endpoint", "https://").found, HasSubstr("is not a URL"));
}

TEST_F(FileCheck, ReportsQueryInAuthorizationEndpoint) {
    appliance.MoveEndpoint("authorization_endpoint", appliance.URL("/authorization_endpoint?p=policy"));
    EXPECT_THAT(OnlyFinding().found, HasSubstr("query"));
}

TEST_F(FileCheck, ReportsBlanksAroundValue) {
    EXPECT_THAT(FirstFindingWith("tenant_id", std::string(kTenant) + " ").found, HasSubstr("a blank"));
}

TEST_F(FileCheck, ReportsRedirectURIToOtherProgram) {
    EXPECT_THAT(FirstFindingWith("redirect_uri", "https://nas.example/sso/back.cgi").found,
                HasSubstr("\"/sso/back.cgi\""));
    EXPECT_THAT(Ask({"--return-program", "/sso/back.cgi"}).Findings(), IsEmpty());
}

TEST_F(FileCheck, ReportsSecretReadableByOthers) {
    for (const mode_t mode : {0640U, 0604U}) {
        ASSERT_EQ(chmod(kAzureFile, mode), 0);
        EXPECT_THAT(OnlyFinding().found, HasSubstr("read the client secret"));
    }
}

TEST_F(FileCheck, ReportsFileWritableByOthers) {
    ASSERT_EQ(chmod(kAzureFile, 0620), 0);
    EXPECT_THAT(OnlyFinding().found, HasSubstr("can change it"));
    ASSERT_EQ(chmod(kAzureFile, 0600), 0);
    ASSERT_EQ(chmod(kProfileFile, 0646), 0);
    EXPECT_EQ(OnlyFinding().id, "profile.rights");
}

TEST_F(FileCheck, ReportsDirectoryInsteadOfProfile) {
    ASSERT_EQ(std::remove(kProfileFile), 0);
    ASSERT_EQ(mkdir(kProfileFile, 0755), 0);
    EXPECT_THAT(OnlyFinding().found, HasSubstr("Is a directory"));
    EXPECT_EQ(appliance.LogIn().text, "read profile file failed.");
}

TEST_F(FileCheck, ReportsDirectoryInsteadOfClientFile) {
    ASSERT_EQ(std::remove(kAzureFile), 0);
    ASSERT_EQ(mkdir(kAzureFile, 0755), 0);
    EXPECT_THAT(Ask({}).Find("client.file", "finding").found, HasSubstr("Is a directory"));
}

TEST_F(FileCheck, ReportsLinkToMissingFile) {
    ASSERT_EQ(std::remove(kAzureFile), 0);
    ASSERT_EQ(symlink("/usr/tavo/etc/moved.conf", kAzureFile), 0);
    EXPECT_THAT(Ask({}).Find("client.file", "finding").found, EndsWith("is a link to a file that is missing"));
}

TEST_F(FileCheck, ReportsListInsteadOfObject) {
    WriteFile(kAzureFile, "[\"azure_client_id\", \"the client\"]");
    EXPECT_THAT(Ask({}).Find("client.file", "finding").found, EndsWith("is JSON, but not an object"));
}

TEST_F(FileCheck, ReportsDomainTableThatIsNotJSON) {
    WriteFile(kDomainTable, "corp.example = CORP\n");
    EXPECT_THAT(Ask({}).Find("directory.table", "finding").found, HasSubstr("Line 1, Column 1"));
}

TEST_F(FileCheck, ReportsUnknownDomain) {
    EXPECT_EQ(Ask({"--domain", "corp.example"}).Find("directory.domain", "good").found, "is \"CORP\", by the table");
    EXPECT_EQ(OnlyFinding({"--domain", "elsewhere.example"}).id, "directory.domain");
}

/// Findings for programs that do not run as root.
TEST(DomainTable, IsReadLikeByStandIn) {
    const Appliance appliance(Profile::kAzure);
    WriteFile(kDomainTable, "\xef\xbb\xbf{\"corp.example\": \"CORP\",}");
    const Report report = Ask({"--domain", "alice@corp.example"});
    EXPECT_THAT(report.Findings(), IsEmpty());
    EXPECT_EQ(report.Find("directory.domain", "good").found, "is \"CORP\\alice\", by the table");
    EXPECT_THAT(RunDoctor({"--domain", "alice@corp.example"}).output,
                HasSubstr("\nalice@corp.example signs in as \"CORP\\alice\", by the table.\n"));
}

class RightsOfUser : public FileCheck {
  protected:
    void SetUp() override {
        const std::string probe = "/tmp/probe";
        WriteFile(probe, "");
        if (chown(probe.c_str(), kNobody, kNobody) != 0) {
            GTEST_SKIP() << "needs the ids of other users";
        }
    }
};

TEST_F(RightsOfUser, ReportsUnreadableClientFile) {
    ASSERT_EQ(chmod(kProfileFile, 0644), 0);
    const Report report = Ask({"--user", "nobody"});
    EXPECT_EQ(report.FirstFinding().id, "client.ids");
    EXPECT_THAT(report.Find("client.file", "finding").found, HasSubstr("Permission denied"));
}

}  // namespace

}  // namespace Test
