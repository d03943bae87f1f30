#include <curl/curl.h>
#include <gmock/gmock.h>
#include <openssl/rsa.h>

#include <functional>
#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

#include "tests/loopback/loopback_provider.h"
#include "tests/support/authority.h"
#include "tests/support/libcurl_version.h"
#include "tests/support/server.h"
#include "tests/support/system_log.h"
#include "tests/support/token.h"

// Server certificates at each endpoint of a login. Each server would answer correctly.
namespace Test {

namespace {

using ::testing::ElementsAre;
using ::testing::ElementsAreArray;
using ::testing::HasSubstr;
using ::testing::Not;
using ::testing::StartsWith;
using ::testing::ValuesIn;

struct CertificateCase {
    std::string name;
    std::function<Credentials()> credentials;
    CURLcode result;
    std::string host = "127.0.0.1";
    int onlyVersion = 0;
};

void PrintTo(const CertificateCase &row, std::ostream *stream) { *stream << row.name; }

std::shared_ptr<EVP_PKEY> KeyOf(unsigned int bits) {
    std::shared_ptr<EVP_PKEY> key(EVP_RSA_gen(bits), EVP_PKEY_free);
    EXPECT_NE(key, nullptr);
    return key;
}

/// Also trusted; it signs with outdated digests.
const Credentials &OldAuthority() {
    static const Credentials authority = Certify(AuthorityText("Old authority"), nullptr, KeyOf(2048));
    return authority;
}

/// Also trusted, with a key that is too short.
const Credentials &WeakAuthority() {
    static const Credentials authority = Certify(AuthorityText("Weak authority"), nullptr, KeyOf(1024));
    return authority;
}

std::string Text(CURLcode result) { return curl_easy_strerror(result); }

std::string Token(Profile profile) { return SignedToken(TokenHeader(profile), TokenClaims(profile)); }

class ServerCertificate : public ::testing::TestWithParam<CertificateCase> {
  protected:
    static void AtTheTokenEndpoint(Profile profile) {
        Server server(GetParam().credentials(), GetParam().onlyVersion);
        server.Answer(HTTPAnswer(TokenResponse(Token(profile))));
        const std::string key = profile == Profile::kAzure ? "azure_token_endpoint" : "websphere_token_endpoint";
        Provider provider(profile, "{\"" + key + "\": \"" + server.URL("/token", GetParam().host) + "\"}");
        provider.AnswerVerification();
        ExpectRequestOnlyIfValid(server, provider, profile, Refused<std::invalid_argument>("parse json falied"),
                                 {Error("sso:N request token uri " + Text(GetParam().result) + ".")});
    }

    static void AtTheDiscoveryDocument() {
        Server server(GetParam().credentials(), GetParam().onlyVersion);
        Provider provider(Profile::kAzure,
                          R"({"azure_wellknown": ")" + server.URL("/discovery", GetParam().host) + "\"}");
        server.Answer(HTTPAnswer(R"({"jwks_uri": ")" + provider.URL("/keys") + "\"}"));
        provider.Answer(TokenResponse(Token(Profile::kAzure)));
        provider.Answer(KeySet());
        ExpectRequestOnlyIfValid(server, provider, Profile::kAzure, UnknownKey(),
                                 {Error("sso:N " + Text(GetParam().result)),
                                  Error("azuresso:N request wellknown uri " + Text(CURLE_URL_MALFORMAT) + ".")});
    }

    static void AtTheKeySet() {
        Server server(GetParam().credentials(), GetParam().onlyVersion);
        server.Answer(HTTPAnswer(KeySet()));
        Provider provider(Profile::kAzure);
        provider.Answer(TokenResponse(Token(Profile::kAzure)));
        provider.Answer(R"({"jwks_uri": ")" + server.URL("/keys", GetParam().host) + "\"}");
        ExpectRequestOnlyIfValid(server, provider, Profile::kAzure, UnknownKey(),
                                 {Error("azuresso:N request wellknown uri " + Text(GetParam().result) + ".")});
    }

  private:
    static Outcome UnknownKey() { return Refused<std::invalid_argument>("kid does not exist in Azure verified kyes"); }

    static void ExpectRequestOnlyIfValid(const Server &server, Provider &provider, Profile profile,
                                         const Outcome &refusal, const std::vector<LogLine> &log) {
        const bool good = GetParam().result == CURLE_OK;
        TrustAuthority({OldAuthority(), WeakAuthority()});
        EXPECT_EQ(provider.LogIn(), good ? LoggedIn(UserName(profile)) : refusal);
        EXPECT_THAT(TakeSystemLog(), ElementsAreArray(good ? std::vector<LogLine>() : log));
        EXPECT_EQ(server.Requests().size(), good ? 1 : 0);
    }
};

TEST_P(ServerCertificate, IsVerifiedBeforeRequest) {
    for (const Profile profile : {Profile::kAzure, Profile::kWebSphere}) {
        SCOPED_TRACE("token endpoint, " + Name(profile));
        AtTheTokenEndpoint(profile);
    }
    {
        SCOPED_TRACE("discovery document");
        AtTheDiscoveryDocument();
    }
    SCOPED_TRACE("key set");
    AtTheKeySet();
}

CertificateText Named(const std::string &alternativeName, const std::string &commonName = "Server of this test run") {
    CertificateText text;
    text.alternativeName = alternativeName;
    text.commonName = commonName;
    return text;
}

CertificateText Good() { return Named("IP:127.0.0.1"); }

std::vector<CertificateCase> Names() {
    const auto row = [](const char *name, CURLcode result, const CertificateText &text,
                        const std::string &host = "127.0.0.1") {
        return CertificateCase{name, [text] { return Certify(text, &Authority()); }, result, host};
    };
    constexpr char kHost[] = "localhost";
    // One name: "localhost", a NUL and ".x".
    constexpr char kCutByANUL[] = "DER:30:0e:82:0c:6c:6f:63:61:6c:68:6f:73:74:00:2e:78";
    return {
        row("ItsAddress", CURLE_OK, Good()),
        row("ItsName", CURLE_OK, Named("DNS:localhost"), kHost),
        row("ItsNameInCapitals", CURLE_OK, Named("DNS:LOCALHOST"), kHost),
        row("ItsNameAmongOthers", CURLE_OK, Named("DNS:a.example, IP:127.0.0.2, DNS:localhost"), kHost),
        row("ItsNameOnlyAsCommonName", CURLE_OK, Named("", "localhost"), kHost),
        row("ItsAddressOnlyAsCommonName", CURLE_OK, Named("", "127.0.0.1")),
        row("AnotherName", CURLE_PEER_FAILED_VERIFICATION, Named("DNS:localhost.example"), kHost),
        row("AnotherAddress", CURLE_PEER_FAILED_VERIFICATION, Named("IP:127.0.0.2")),
        row("ItsAddressAsAName", CURLE_PEER_FAILED_VERIFICATION, Named("DNS:127.0.0.1")),
        row("AnotherNameAndItsOwnAsCommonName", CURLE_PEER_FAILED_VERIFICATION, Named("DNS:a.example", "localhost"),
            kHost),
        row("AWildcardForEveryName", CURLE_PEER_FAILED_VERIFICATION, Named("DNS:*"), kHost),
        row("ItsNameUpToNUL", CURLE_PEER_FAILED_VERIFICATION, Named(kCutByANUL), kHost),
        row("ACommonNameOfAnother", CURLE_PEER_FAILED_VERIFICATION, Named("", "a.example"), kHost),
    };
}

std::vector<CertificateCase> Issuers() {
    constexpr CURLcode kRefused = CURLE_PEER_FAILED_VERIFICATION;
    return {
        {"SelfSigned", [] { return Certify(Good(), nullptr); }, kRefused},
        {"UnknownAuthority",
         [] {
             const Credentials unknown = Certify(AuthorityText("Unknown authority"), nullptr);
             return Certify(Good(), &unknown);
         },
         kRefused},
        {"UnknownAuthorityWithTrustedName",
         [] {
             const Credentials impostor = Certify(AuthorityText("Authority of this test run"), nullptr);
             return Certify(Good(), &impostor);
         },
         LibcurlResultOfForgedAuthority()},
        {"ServerThatIsNoAuthority",
         [] {
             const Credentials server = CertificateFor("DNS:a.example");
             return Certify(Good(), &server);
         },
         kRefused},
        {"SecondTrustedAuthority", [] { return Certify(Good(), &OldAuthority()); }, CURLE_OK},
    };
}

std::vector<CertificateCase> Purposes() {
    const auto row = [](const char *name, const std::function<void(CertificateText &)> &change) {
        CertificateText text = Good();
        change(text);
        return CertificateCase{name, [text] { return Certify(text, &Authority()); }, CURLE_PEER_FAILED_VERIFICATION};
    };
    return {
        row("ForClients", [](CertificateText &text) { text.extendedKeyUsage = "clientAuth"; }),
        row("Expired", [](CertificateText &text) { text.notAfter = "20231114221319Z"; }),
        row("NotYetValid", [](CertificateText &text) { text.notBefore = "20231114221321Z"; }),
    };
}

std::vector<CertificateCase> Strengths() {
    const auto key = [](const char *name, CURLcode result, unsigned int bits, int onlyVersion = 0) {
        return CertificateCase{name, [bits] { return Certify(Good(), &Authority(), KeyOf(bits)); }, result, "127.0.0.1",
                               onlyVersion};
    };
    const auto digest = [](const char *name, CURLcode result, const EVP_MD *(*signedWith)()) {
        return CertificateCase{
            name, [signedWith] { return Certify(Good(), &OldAuthority(), EllipticKey(), signedWith()); }, result};
    };
    return {
        key("AKeyOf512Bits", CURLE_PEER_FAILED_VERIFICATION, 512, TLS1_2_VERSION),
        key("AKeyOf1024Bits", CURLE_PEER_FAILED_VERIFICATION, 1024),
        key("AKeyOf2048Bits", CURLE_OK, 2048),
        digest("ASignatureOverMD5", CURLE_PEER_FAILED_VERIFICATION, EVP_md5),
        digest("ASignatureOverSHA1", CURLE_PEER_FAILED_VERIFICATION, EVP_sha1),
        digest("ASignatureOverSHA256", CURLE_OK, EVP_sha256),
        {"ASignatureOfAWeakAuthority", [] { return Certify(Good(), &WeakAuthority()); },
         CURLE_PEER_FAILED_VERIFICATION},
    };
}

std::vector<CertificateCase> Versions() {
    const auto row = [](const char *name, CURLcode result, int version) {
        return CertificateCase{name, [] { return CertificateFor("IP:127.0.0.1"); }, result, "127.0.0.1", version};
    };
    return {
        row("TLS10", CURLE_SSL_CONNECT_ERROR, TLS1_VERSION),
        row("TLS11", CURLE_SSL_CONNECT_ERROR, TLS1_1_VERSION),
        row("TLS12", CURLE_OK, TLS1_2_VERSION),
        row("TLS13", CURLE_OK, TLS1_3_VERSION),
    };
}

std::string NameOfCertificate(const ::testing::TestParamInfo<CertificateCase> &info) { return info.param.name; }

INSTANTIATE_TEST_SUITE_P(Name, ServerCertificate, ValuesIn(Names()), NameOfCertificate);
INSTANTIATE_TEST_SUITE_P(Issuer, ServerCertificate, ValuesIn(Issuers()), NameOfCertificate);
INSTANTIATE_TEST_SUITE_P(Purpose, ServerCertificate, ValuesIn(Purposes()), NameOfCertificate);
INSTANTIATE_TEST_SUITE_P(Strength, ServerCertificate, ValuesIn(Strengths()), NameOfCertificate);
INSTANTIATE_TEST_SUITE_P(Version, ServerCertificate, ValuesIn(Versions()), NameOfCertificate);

TEST(PlainTokenEndpoint, FailsIfServerRequiresTLS) {
    const Profile profile = Profile::kWebSphere;
    Server server(CertificateFor("IP:127.0.0.1"));
    server.Answer(HTTPAnswer(TokenResponse(Token(profile))));
    Provider provider(profile, R"({"websphere_token_endpoint": "http)" + server.URL("/token").substr(5) + "\"}");
    EXPECT_EQ(provider.LogIn(), Refused<std::invalid_argument>("parse json falied"));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("sso:N request token uri " + Text(CURLE_GOT_NOTHING) + ".")));
    EXPECT_EQ(server.Requests().size(), 0);
}

TEST(TLSTokenEndpoint, ReceivesNoSecretOverPlainHTTP) {
    const Profile profile = Profile::kWebSphere;
    std::string received;
    {
        Server server;
        server.Play([&received](Connection &connection) {
            received = connection.ReceiveRaw();
            connection.Send(HTTPAnswer(TokenResponse(Token(profile))));
        });
        Provider provider(profile, R"({"websphere_token_endpoint": "https)" + server.URL("/token").substr(4) + "\"}");
        EXPECT_EQ(provider.LogIn(), Refused<std::invalid_argument>("parse json falied"));
    }
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("sso:N request token uri " + Text(CURLE_SSL_CONNECT_ERROR) + ".")));
    EXPECT_THAT(received, StartsWith("\x16\x03\x01"));
    EXPECT_THAT(received, Not(HasSubstr("client_secret")));
}

}  // namespace

}  // namespace Test
