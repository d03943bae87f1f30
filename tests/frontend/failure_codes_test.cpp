#include <gmock/gmock.h>

#include <set>
#include <stdexcept>

#include "web/failure.h"
#include "web/failure_table.h"
#include "web/refusal.h"

using namespace TAVO::Web;

namespace {

FailedLogin Of(const std::string &text) { return FailedLoginOf(std::runtime_error(text)); }

TEST(FailureCode, HasUniqueStableName) {
    std::set<std::string> names;
    for (int code = 0; code <= static_cast<int>(Failure::kInternal); ++code) {
        EXPECT_TRUE(names.insert(NameOf(static_cast<Failure>(code))).second);
    }
    EXPECT_EQ(NameOf(Failure::kSwitchedOff), "switched_off");
    EXPECT_EQ(NameOf(Failure::kUnknownDomain), "unknown_domain");
    EXPECT_EQ(NameOf(Failure::kInternal), "internal");
}

TEST(FailureCode, MatchesExceptionText) {
    for (const auto &[text, code] :
         {std::pair("id_token expired.", Failure::kTokenExpired), std::pair("tenant ID invalid", Failure::kOtherTenant),
          std::pair("sso does not enable.", Failure::kSwitchedOff),
          std::pair("none algorithm is not supported", Failure::kInvalidToken),
          std::pair("TAVOWinsUserNameFqdn2Netbios failed.", Failure::kUnknownDomain),
          std::pair("an unknown text", Failure::kInternal)}) {
        EXPECT_EQ(Of(text).failure, code) << text;
        EXPECT_EQ(Of(text).reason, text);
        EXPECT_NE(Of(text).sentence, "") << text;
    }
}

TEST(FailureCode, IncludesHintFromTable) {
    EXPECT_THAT(Of("tenant ID invalid").hint, testing::HasSubstr("azure_tenant_id"));
}

TEST(FailureCode, ReportsProviderError) {
    const FailedLogin failed = Of(R"({"error":"invalid_client","error_description":"d","id_token":"SECRET"})");
    EXPECT_EQ(failed.failure, Failure::kProviderRefused);
    EXPECT_EQ(failed.providerError, "invalid_client");
    EXPECT_EQ(failed.reason, "The provider refused: invalid_client (d)");
    EXPECT_THAT(failed.hint, testing::HasSubstr("client secret"));
    EXPECT_EQ(FailedLoginOf(ProviderRefusal("a (b)", "c")).providerError, "a (b)");
    EXPECT_EQ(FailedLoginOf(ProviderRefusal("", "")).providerError, "");
}

TEST(FailureCode, IgnoresTableForProviderText) {
    EXPECT_EQ(FailedLoginOf(ProviderRefusal("x algorithm is not supported", "")).failure, Failure::kProviderRefused);
}

TEST(FailureCode, IsStorageForFailureOfStore) {
    const FailedLogin failed = FailedLoginOf(StoreFailure("disk on fire"));
    EXPECT_EQ(failed.failure, Failure::kStorage);
    EXPECT_EQ(failed.reason, "disk on fire");
}

TEST(FailureCode, DistinguishesNetworkFromCertificateErrors) {
    const FailedLogin failed = Of("parse json falied");
    EXPECT_EQ(failed.failure, Failure::kInvalidResponse);
    EXPECT_EQ(FailedTransfer(failed, CURLE_COULDNT_CONNECT).failure, Failure::kNetwork);
    EXPECT_EQ(FailedTransfer(failed, CURLE_PEER_FAILED_VERIFICATION).failure, Failure::kCertificate);
    EXPECT_EQ(FailedTransfer(failed, CURLE_COULDNT_CONNECT).reason, "parse json falied");
}

}  // namespace
