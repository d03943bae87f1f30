#include <gmock/gmock.h>

#include <ctime>
#include <string>

#include "tests/doctor/appliance.h"
#include "tests/doctor/doctor_process.h"
#include "tests/support/authority.h"
#include "tests/support/server.h"
#include "tests/support/token.h"

// Errors of a provider and the findings for them.
namespace Test {

namespace {

using ::testing::AllOf;
using ::testing::Contains;
using ::testing::Each;
using ::testing::ElementsAre;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;
using ::testing::StartsWith;

constexpr char kHost[] = "IP:127.0.0.1";
constexpr std::time_t kHour = 3600;

std::string TimeText(const char *format, std::time_t time) {
    char text[64];
    std::tm utc{};
    gmtime_r(&time, &utc);
    return {text, std::strftime(text, sizeof text, format, &utc)};
}

/// A key set with these keys.
std::string KeysOf(std::initializer_list<Json::Value> keys) {
    Json::Value keySet;
    for (const Json::Value &key : keys) {
        keySet["keys"].append(key);
    }
    return Compact(keySet);
}

Json::Value GoodKey() { return ProviderKey().JWK(kKeyID); }

TEST(ProviderCertificate, AcceptsMissingEndDate) {
    CertificateText text;
    text.alternativeName = kHost;
    text.notAfter = "99991231235959Z";  // RFC 5280, section 4.1.2.5
    const Appliance appliance(Profile::kAzure, Certify(text, &Authority()));
    EXPECT_THAT(Ask({}).Findings(), IsEmpty());
}

TEST(ProviderCertificate, SendsNoSecretIfRejected) {
    for (const Credentials &credentials : {SelfSignedCertificateFor(kHost), ExpiredCertificateFor(kHost)}) {
        for (const Profile profile : {Profile::kAzure, Profile::kWebSphere}) {
            const Appliance appliance(profile, credentials);
            const Report report = Ask({});
            EXPECT_THAT(report.Findings(), ElementsAre(EndsWith(".certificate"))) << "once per certificate";
            EXPECT_THAT(appliance.Requests(), Each(StartsWith("GET ")));
            EXPECT_THAT(appliance.Requests(), Each(Not(HasSubstr("client_"))));
        }
    }
}

class ProviderCheck : public ::testing::Test {
  protected:
    void TellTime(std::time_t time) {
        std::string answer = HTTPAnswer(KeySet());
        answer.insert(answer.find("\r\n"), "\r\nDate: " + TimeText("%a, %d %b %Y %H:%M:%S GMT", time));
        appliance.AnswerAt("/keys", [answer](const std::string & /*request*/) { return answer; });
    }

    Appliance appliance{Profile::kAzure};
};

TEST_F(ProviderCheck, AcceptsEqualClock) {
    TellTime(std::time(nullptr));
    EXPECT_EQ(Ask({}).Find("clock", "good").id, "clock");
}

TEST_F(ProviderCheck, ReadsDateHeaderInAnyCase) {
    for (const char *name : {"Date", "date", "DATE"}) {
        std::string answer = HTTPAnswer(KeySet());
        answer.insert(answer.find("\r\n"), "\r\n" + std::string(name) + ": " +
                                               TimeText("%a, %d %b %Y %H:%M:%S GMT", std::time(nullptr) - kHour));
        appliance.AnswerAt("/keys", [answer](const std::string & /*request*/) { return answer; });
        EXPECT_EQ(OnlyFinding().id, "clock") << name;
    }
}

TEST_F(ProviderCheck, RequestsAddressInCapitals) {
    std::string url = appliance.URL("/discovery");
    appliance.SetClient("wellknown", "HTTPS" + url.substr(5));
    EXPECT_EQ(Ask({}).Find("discovery.reachable", "good").id, "discovery.reachable");
    appliance.SetClient("token_endpoint", "HTTPS" + appliance.URL("/token_endpoint").substr(5));
    EXPECT_EQ(Ask({}).Find("token_endpoint.client", "good").id, "token_endpoint.client");
}

TEST_F(ProviderCheck, NotesOtherLogoutEndpoint) {
    appliance.ChangeDiscovery(R"({"end_session_endpoint": "https://login.example/other"})");
    const Report report = Ask({});
    EXPECT_THAT(report.Findings(), IsEmpty());
    EXPECT_THAT(report.Find("discovery.end_session_endpoint", "note").found, HasSubstr("https://login.example/other"));
}

TEST_F(ProviderCheck, ReportsMissingAlgorithms) {
    appliance.ChangeDiscovery(R"({"id_token_signing_alg_values_supported": ["ES256", "PS256"]})");
    EXPECT_EQ(OnlyFinding().id, "discovery.algorithms");
}

TEST_F(ProviderCheck, ReportsMissingClientAuthentication) {
    appliance.ChangeDiscovery(R"({"token_endpoint_auth_methods_supported": ["client_secret_basic"]})");
    EXPECT_EQ(OnlyFinding().id, "discovery.client_authentication");
}

TEST_F(ProviderCheck, NotesUnusableKeysBesideUsableOne) {
    Json::Value withoutN = ProviderKey().JWK("third key");
    withoutN.removeMember("n");
    const Json::Value ofACurve = Parse(R"({"kty": "EC", "kid": "second key", "crv": "P-256", "x": "AQ", "y": "AQ"})");
    appliance.AnswerAt("/keys", KeysOf({ofACurve, withoutN, Parse("\"no key\""), GoodKey()}));
    const Report report = Ask({});
    EXPECT_THAT(report.Findings(), IsEmpty());
    EXPECT_THAT(report.Find("keys.unusable", "note").found, HasSubstr("\"second key\", EC is not an RSA key"));
    EXPECT_EQ(report.Find("keys.set", "good").found, "1 of 4 keys are usable");
}

TEST_F(ProviderCheck, ReportsWhyNoKeyIsUsable) {
    appliance.AnswerAt("/keys", KeySet(R"({"kid": null})"));
    const Check finding = OnlyFinding();
    EXPECT_EQ(finding.id, "keys.set");
    EXPECT_THAT(finding.found, AllOf(HasSubstr("0 of 1 keys are usable"), HasSubstr("has no \"kid\"")));
}

TEST_F(ProviderCheck, ReportsWeakKey) {
    const RSAKey weak(1024);
    appliance.AnswerAt("/keys", KeysOf({GoodKey(), weak.JWK("weak key")}));
    const Check finding = OnlyFinding();
    EXPECT_EQ(finding.id, "keys.weak");
    EXPECT_THAT(finding.found, AllOf(HasSubstr("\"weak key\""), HasSubstr("1024 bits")));
}

TEST_F(ProviderCheck, NotesDuplicateKeyID) {
    appliance.AnswerAt("/keys", KeysOf({GoodKey(), GoodKey()}));
    const Report report = Ask({});
    EXPECT_THAT(report.Findings(), IsEmpty());
    EXPECT_THAT(report.Find("keys.duplicate", "note").found, HasSubstr("the library uses the first key"));
}

TEST_F(ProviderCheck, ExpectsInvalidGrantForValidClient) {
    EXPECT_EQ(Ask({}).Find("token_endpoint.client", "good").library, "");
    EXPECT_THAT(appliance.Requests(), Contains(HasSubstr("code=tavosso-doctor-made-this-up")));
}

TEST_F(ProviderCheck, ReportsRejectedClient) {
    for (const char *error : {"invalid_client", "unauthorized_client"}) {
        appliance.RefuseCodes(error);
        const Check finding = OnlyFinding();
        EXPECT_EQ(finding.id, "token_endpoint.client");
        EXPECT_THAT(finding.remedy, HasSubstr("Compare azure_client_id"));
    }
}

TEST_F(ProviderCheck, NotesRejectedTestCode) {
    appliance.RefuseCodes("invalid_request");
    EXPECT_NE(Ask({}).Find("token_endpoint.client", "note").remedy, "");
}

TEST_F(ProviderCheck, ReportsOtherErrorsVerbatim) {
    appliance.RefuseCodes("temporarily_unavailable", "we are moving");
    const Check finding = OnlyFinding();
    EXPECT_EQ(finding.found, "The provider refused: temporarily_unavailable (we are moving)");
    EXPECT_EQ(finding.library, finding.found);
}

}  // namespace

}  // namespace Test
