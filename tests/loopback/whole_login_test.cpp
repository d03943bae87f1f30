#include <curl/curl.h>
#include <fcntl.h>
#include <gmock/gmock.h>
#include <syslog.h>
#include <unistd.h>

#include <cstdio>
#include <functional>
#include <memory>
#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

#include "jwt/jwt.h"
#include "sso/sso.h"
#include "tests/loopback/loopback_provider.h"
#include "tests/support/conversion.h"
#include "tests/support/encoding.h"
#include "tests/support/files.h"
#include "tests/support/server.h"
#include "tests/support/system_log.h"
#include "tests/support/token.h"

namespace Test {

namespace {

using TAVO::JWT::jwt_not_support;
using TAVO::JWT::jwt_verify_failed;
using TAVO::SSO::sso_err_resp;
using TAVO::SSO::sso_op_failed;
using ::testing::ElementsAre;
using ::testing::ElementsAreArray;
using ::testing::EndsWith;
using ::testing::IsEmpty;
using ::testing::ValuesIn;

constexpr Profile kBoth[] = {Profile::kAzure, Profile::kWebSphere};

std::string BodyOf(const std::string &request) { return request.substr(request.find("\r\n\r\n") + 4); }

LogLine TokenRequestLogged(CURLcode result) {
    return Error(std::string("sso:N request token uri ") + curl_easy_strerror(result) + ".");
}

LogLine KeyRequestLogged(const std::string &text) { return Error("azuresso:N request wellknown uri " + text + "."); }

LogLine KeyRequestLogged(CURLcode result) { return KeyRequestLogged(curl_easy_strerror(result)); }

class WholeLogin : public ::testing::TestWithParam<Profile> {};

INSTANTIATE_TEST_SUITE_P(With, WholeLogin, ValuesIn(kBoth), [](const auto &row) { return Name(row.param); });

TEST_P(WholeLogin, ReturnsUserName) {
    Provider provider(GetParam());
    provider.AnswerLogin(SignedToken(TokenHeader(GetParam()), TokenClaims(GetParam())));
    EXPECT_EQ(provider.LogIn(), LoggedIn(UserName(GetParam())));
    EXPECT_THAT(provider.RequestLines(), ElementsAreArray(AllRequestLines(GetParam())));
    EXPECT_THAT(TakeSystemLog(), IsEmpty());
}

TEST_P(WholeLogin, SendsExactTokenRequest) {
    Provider provider(GetParam());
    provider.LogIn();
    const std::string body =
        "client_id=the%20client&client_secret=a%20secret%20%26%20100%20%25%20only%20of%20this%20test&code=code%2F1"
        "&grant_type=authorization_code&redirect_uri=https%3A%2F%2Fnas.example%2Freturn";
    const std::string request = provider.Requests().at(0);
    EXPECT_TRUE(BodyOf(request) == body);
    EXPECT_TRUE(request == "POST /token HTTP/1.1\r\nHost: " + provider.URL("").substr(sizeof "https://" - 1) +
                               "\r\nAccept: */*\r\nContent-Length: " + std::to_string(body.size()) +
                               "\r\nContent-Type: application/x-www-form-urlencoded\r\n\r\n" + body);
}

TEST_P(WholeLogin, SucceedsAfterFailedLogin) {
    Provider provider(GetParam());
    provider.AnswerByteByByte(HTTPAnswer(TokenResponse("not a token")));
    provider.AnswerLogin(SignedToken(TokenHeader(GetParam()), TokenClaims(GetParam())));
    EXPECT_EQ(provider.LogIn(), Refused<std::invalid_argument>("bad jwt format!"));
    EXPECT_EQ(provider.LogIn(), LoggedIn(UserName(GetParam())));
}

/// The descriptors that a program executed by this process inherits.
std::string DescriptorsHandedOn() {
    const std::unique_ptr<FILE, int (*)(FILE *)> list(popen("exec ls /proc/self/fd", "r"), pclose);
    std::string descriptors;
    for (int c = std::getc(list.get()); c != EOF; c = std::getc(list.get())) {
        descriptors += static_cast<char>(c);
    }
    return descriptors;
}

TEST_P(WholeLogin, LeaksNoDescriptorToExecutedProgram) {
    Provider provider(GetParam());
    provider.AnswerLogin(SignedToken(TokenHeader(GetParam()), TokenClaims(GetParam())));
    const std::string before = DescriptorsHandedOn();
    ASSERT_EQ(provider.LogIn(), LoggedIn(UserName(GetParam())));
    EXPECT_EQ(DescriptorsHandedOn(), before);
    const int left = open("/dev/null", O_RDONLY);  // without O_CLOEXEC
    EXPECT_NE(DescriptorsHandedOn(), before);
    close(left);
}

TEST_P(WholeLogin, ThrowsLogicErrorForEmptyTokenPart) {
    const std::string whole = SignedToken(TokenHeader(GetParam()), TokenClaims(GetParam()));
    const std::size_t firstDot = whole.find('.');
    const std::size_t lastDot = whole.rfind('.');
    for (const std::string &token : {whole.substr(firstDot), whole.substr(0, firstDot) + "." + whole.substr(lastDot)}) {
        Provider provider(GetParam());
        provider.AnswerLogin(token);
        const Outcome outcome = provider.LogIn();
        EXPECT_EQ(outcome.exception, typeid(std::logic_error).name());
        EXPECT_EQ(outcome.userName, kUserNameBefore);
        EXPECT_THAT(provider.RequestLines(), ElementsAre("POST /token HTTP/1.1"));
    }
}

/// A login with a correctly signed token, and its expected outcome.
struct TokenCase {
    TokenCase(const std::string &caseName, Profile of, const Outcome &expected)
        : name(Name(of) + caseName), profile(of), outcome(expected) {}

    TokenCase &Header(const std::string &changes) { return header = changes, *this; }
    TokenCase &Claims(const std::string &changes) { return claims = changes, *this; }
    TokenCase &Key(const std::string &changes) { return key = changes, *this; }
    TokenCase &Configuration(const std::string &changes) { return configuration = changes, *this; }
    TokenCase &SignedUnder(const std::string &otherSecret) { return secret = otherSecret, *this; }
    TokenCase &Then(const std::function<std::string(const std::string &)> &change) { return damage = change, *this; }
    TokenCase &WithoutKeyRequest() { return fetchesKeys = false, *this; }
    TokenCase &Logs(const std::string &text) { return log.push_back(Error(text)), *this; }

    std::string name;
    Profile profile;
    Outcome outcome;
    std::string header = "{}";
    std::string claims = "{}";
    std::string key = "{}";
    std::string configuration = "{}";
    std::string secret = kSecret;
    std::function<std::string(const std::string &)> damage = [](const std::string &token) { return token; };
    bool fetchesKeys = true;
    std::vector<LogLine> log;
};

void PrintTo(const TokenCase &row, std::ostream *stream) { *stream << row.name; }

class TokenVerification : public ::testing::TestWithParam<TokenCase> {};

TEST_P(TokenVerification, YieldsExpectedOutcome) {
    const TokenCase &row = GetParam();
    Provider provider(row.profile, row.configuration);
    provider.AnswerByteByByte(HTTPAnswer(TokenResponse(row.damage(SignedToken(
        Change(TokenHeader(row.profile), row.header), Change(TokenClaims(row.profile), row.claims), row.secret)))));
    if (row.profile == Profile::kAzure) {
        provider.Answer(R"({"jwks_uri": "$BASE/keys"})");
        provider.Answer(KeySet(row.key));
    }
    std::vector<std::string> requests = AllRequestLines(row.profile);
    requests.resize(row.fetchesKeys ? requests.size() : 1);

    EXPECT_EQ(provider.LogIn(), row.outcome);
    EXPECT_THAT(TakeSystemLog(), ElementsAreArray(row.log));
    EXPECT_THAT(provider.RequestLines(), ElementsAreArray(requests));
}

std::string NameOfTokenCase(const ::testing::TestParamInfo<TokenCase> &info) { return info.param.name; }

std::string Signature(const std::string &token) { return token.substr(token.rfind('.')); }

std::string WithoutSignature(const std::string &token) { return token.substr(0, token.rfind('.')); }

std::string WithoutHeader(const std::string &token) { return token.substr(token.find('.')); }

std::string WithOneCharacterOfTheSignatureChanged(std::string token) {
    char &character = token[token.rfind('.') + 1];
    character = character == 'A' ? 'B' : 'A';
    return token;
}

std::string NameOfFailedCheck(Profile profile) {
    return profile == Profile::kAzure ? "verify rsa signature failed" : "verify hmac signature failed";
}

std::vector<TokenCase> Malformed() {
    std::vector<TokenCase> rows;
    for (const Profile profile : kBoth) {
        const auto refused = [&](const char *name, const char *text,
                                 const std::function<std::string(const std::string &)> &damage) {
            rows.push_back(
                TokenCase(name, profile, Refused<std::invalid_argument>(text)).Then(damage).WithoutKeyRequest());
        };
        refused("Empty", "token cannot be empty", [](const std::string &) { return ""; });
        refused("OfTwoParts", "bad jwt format!", WithoutSignature);
        refused("OfFourParts", "bad jwt format!", [](const std::string &token) { return token + ".more"; });
        refused("WhoseHeaderIsNotJSON", "bad jwt header format!",
                [](const std::string &token) { return Base64Url("{\"alg\"") + WithoutHeader(token); });
        refused("WhoseHeaderIsNotBase64", "bad jwt header format!",
                [](const std::string &token) { return "!!!!" + WithoutHeader(token); });
        refused("WhoseBodyIsNotJSON", "bad jwt body format!", [](const std::string &token) {
            return token.substr(0, token.find('.')) + "." + Base64Url("{\"exp\"") + Signature(token);
        });
    }
    return rows;
}

INSTANTIATE_TEST_SUITE_P(Malformed, TokenVerification, ValuesIn(Malformed()), NameOfTokenCase);

std::vector<TokenCase> Expiry() {
    std::vector<TokenCase> rows;
    for (const Profile profile : kBoth) {
        const auto expired = [&](const char *name, const char *claims) {
            rows.push_back(TokenCase(name, profile, Refused<std::invalid_argument>("id_token expired."))
                               .Claims(claims)
                               .WithoutKeyRequest());
        };
        const auto accepted = [&](const char *name, const char *claims) {
            rows.push_back(TokenCase(name, profile, LoggedIn(UserName(profile))).Claims(claims));
        };
        accepted("ThisSecond", R"({"exp": 1700000000})");
        expired("OneSecondAgo", R"({"exp": 1699999999})");
        expired("Missing", R"({"exp": null})");
        expired("NotANumber", R"({"exp": "soon"})");
        expired("AList", R"({"exp": [1700000300]})");
        expired("BeforeTheEpoch", R"({"exp": -1})");
        accepted("WrittenAsText", R"({"exp": "1700000000"})");
        accepted("UpToFirstNonDigit", R"({"exp": "1700000000 and more"})");
        expired("UpToFirstNonDigitOneSecondAgo", R"({"exp": "1699999999.9"})");
        expired("PrecedesTheAudience", R"({"exp": 1699999999, "aud": "another client"})");
        expired("PrecedesTheTenant", R"({"exp": 1699999999, "tid": "another tenant"})");
    }
    return rows;
}

INSTANTIATE_TEST_SUITE_P(Expiry, TokenVerification, ValuesIn(Expiry()), NameOfTokenCase);

std::vector<TokenCase> TenantAndAudience() {
    std::vector<TokenCase> rows;
    const auto refused = [&](const char *name, Profile profile, const char *text, const char *claims) {
        rows.push_back(
            TokenCase(name, profile, Refused<std::invalid_argument>(text)).Claims(claims).WithoutKeyRequest());
        return &rows.back();
    };
    for (const Profile profile : kBoth) {
        refused("AudienceOfAnother", profile, "client ID invalid", R"({"aud": "another client"})");
        refused("AudienceInAnotherCase", profile, "client ID invalid", R"({"aud": "The Client"})");
        refused("AudienceLonger", profile, "client ID invalid", R"({"aud": "the client "})");
        refused("AudienceMissing", profile, "client ID invalid", R"({"aud": null})");
        refused("AudienceAList", profile, "client ID invalid", R"({"aud": ["the client"]})");
        refused("AudiencePrecedesTheAlgorithm", profile, "client ID invalid", R"({"aud": "another client"})")
            ->Header(R"({"alg": "none"})");
    }
    refused("TenantOfAnother", Profile::kAzure, "tenant ID invalid", R"({"tid": "another tenant"})");
    refused("TenantMissing", Profile::kAzure, "tenant ID invalid", R"({"tid": null})");
    refused("TenantAList", Profile::kAzure, "tenant ID invalid", R"({"tid": ["the tenant"]})");
    refused("TenantNotConfigured", Profile::kAzure, "tenant ID invalid", "{}")
        ->Configuration(R"({"azure_tenant_id": 5})");
    refused("TenantPrecedesTheAudience", Profile::kAzure, "tenant ID invalid",
            R"({"tid": "another tenant", "aud": "another client"})");
    return rows;
}

INSTANTIATE_TEST_SUITE_P(TenantAndAudience, TokenVerification, ValuesIn(TenantAndAudience()), NameOfTokenCase);

std::vector<TokenCase> Algorithm() {
    std::vector<TokenCase> rows;
    for (const Profile profile : kBoth) {
        const bool azure = profile == Profile::kAzure;
        const auto refused = [&](const char *name, const std::string &text, const char *header) {
            rows.push_back(TokenCase(name, profile, Refused<jwt_not_support>(text + " algorithm is not supported"))
                               .Header(header));
        };
        for (const char *digest : {"256", "384", "512"}) {
            const std::string own = (azure ? "RS" : "HS") + std::string(digest);
            const std::string foreign = (azure ? "HS" : "RS") + std::string(digest);
            rows.push_back(TokenCase(own, profile, LoggedIn(UserName(profile))).Header(R"({"alg": ")" + own + "\"}"));
            refused(foreign.c_str(), foreign, (R"({"alg": ")" + foreign + "\"}").c_str());
        }
        refused("None", "none", R"({"alg": "none"})");
        refused("OfAnotherFamily", "ES256", R"({"alg": "ES256"})");
        refused("InSmallLetters", azure ? "rs256" : "hs256", azure ? R"({"alg": "rs256"})" : R"({"alg": "hs256"})");
        refused("Missing", "", R"({"alg": null})");
        refused("AList", "", azure ? R"({"alg": ["RS256"]})" : R"({"alg": ["HS256"]})");
    }
    return rows;
}

INSTANTIATE_TEST_SUITE_P(Algorithm, TokenVerification, ValuesIn(Algorithm()), NameOfTokenCase);

std::vector<TokenCase> SigningKey() {
    std::vector<TokenCase> rows;
    const auto refused = [&](const char *name, const char *text) {
        rows.emplace_back(name, Profile::kAzure, Refused<std::invalid_argument>(text));
        return &rows.back();
    };
    constexpr char kUnknown[] = "kid does not exist in Azure verified kyes";
    constexpr char kNoModulus[] = "RSA public 'n' cannot be found!";
    constexpr char kNoExponent[] = "RSA public 'e' cannot be found!";
    refused("Unknown", kUnknown)->Header(R"({"kid": "second key"})");
    refused("NotNamed", kUnknown)->Header(R"({"kid": null})");
    refused("NamedByAList", kUnknown)->Header(R"({"kid": ["first key"]})");
    refused("WithoutName", kUnknown)->Key(R"({"kid": null})");
    refused("UnknownPrecedesTheAlgorithm", kUnknown)->Header(R"({"kid": "second key", "alg": "HS256"})");
    refused("WithoutModulus", kNoModulus)->Key(R"({"n": null})");
    refused("WhoseModulusIsANumber", kNoModulus)->Key(R"({"n": 65537})");
    refused("WithoutModulusAndExponent", kNoModulus)->Key(R"({"n": null, "e": null})");
    refused("WithoutExponent", kNoExponent)->Key(R"({"e": null})");
    refused("WhoseExponentIsANumber", kNoExponent)->Key(R"({"e": 65537})");
    refused("WithoutExponentPrecedesTheAlgorithm", kNoExponent)->Key(R"({"e": null})").Header(R"({"alg": "none"})");

    const auto failed = [&](const char *name) {
        rows.emplace_back(name, Profile::kAzure, Refused<jwt_verify_failed>("verify rsa signature failed"));
        return &rows.back();
    };
    failed("WhoseModulusIsEmpty")->Key(R"({"n": ""})");
    failed("WhoseExponentIsEmpty")->Key(R"({"e": ""})");
    failed("WhoseModulusIsNotBase64")->Key(R"({"n": "!!!!"})");

    const auto accepted = [&](const char *name) {
        rows.emplace_back(name, Profile::kAzure, LoggedIn(UserName(Profile::kAzure)));
        return &rows.back();
    };
    accepted("NamedByANumber")->Header(R"({"kid": 7})").Key(R"({"kid": "7"})");
    accepted("UnnamedOnBothSides")->Header(R"({"kid": null})").Key(R"({"kid": ""})");
    return rows;
}

INSTANTIATE_TEST_SUITE_P(SigningKey, TokenVerification, ValuesIn(SigningKey()), NameOfTokenCase);

std::vector<TokenCase> SignatureRows() {
    std::vector<TokenCase> rows;
    for (const Profile profile : kBoth) {
        const auto refused = [&](const char *name, bool decodes,
                                 const std::function<std::string(const std::string &)> &damage) {
            TokenCase row(name, profile, Refused<jwt_verify_failed>(NameOfFailedCheck(profile)));
            row.Then(damage);
            if (decodes && profile == Profile::kAzure) {
                row.Logs("jwt:N EVP_DigestVerifyFinal failed");
            }
            rows.push_back(row);
        };
        refused("OneCharacterChanged", true, WithOneCharacterOfTheSignatureChanged);
        refused("Missing", false, [](const std::string &token) { return WithoutSignature(token) + "."; });
        refused("NotBase64", false, [](const std::string &token) { return WithoutSignature(token) + ".!!!!"; });
        refused("OfOtherClaims", true, [profile](const std::string &token) {
            const Json::Value forged =
                Change(TokenClaims(profile), R"({"sub": "mallory", "unique_name": "mallory@corp.example"})");
            return SigningInput(TokenHeader(profile), forged) + Signature(token);
        });
        refused("OfAnotherHeader", true, [profile](const std::string &token) {
            const Json::Value forged = Change(TokenHeader(profile), R"({"typ": "jwt"})");
            return SigningInput(forged, TokenClaims(profile)) + Signature(token);
        });
        refused("UnderAnotherDigest", true, [profile](const std::string &token) {
            const Json::Value forged = Change(
                TokenHeader(profile), profile == Profile::kAzure ? R"({"alg": "RS512"})" : R"({"alg": "HS512"})");
            return SigningInput(forged, TokenClaims(profile)) + Signature(token);
        });
    }
    return rows;
}

INSTANTIATE_TEST_SUITE_P(Signature, TokenVerification, ValuesIn(SignatureRows()), NameOfTokenCase);

std::vector<TokenCase> Secret() {
    constexpr std::size_t kLongest = 765;  // base64 with NUL is 1024 bytes
    const auto configured = [](const std::string &secret) {
        return R"({"websphere_client_secret": ")" + secret + "\"}";
    };
    const Profile profile = Profile::kWebSphere;
    const Outcome failed = Refused<jwt_verify_failed>("verify hmac signature failed");
    const std::string longest(kLongest, 's');
    const std::string tooLong(kLongest + 1, 's');
    return {
        TokenCase("OfAnother", profile, failed).SignedUnder("another secret"),
        TokenCase("EmptyOnBothSides", profile, failed).SignedUnder("").Configuration(configured("")),
        TokenCase("InBytesBeyondASCII", profile, LoggedIn("alice"))
            .SignedUnder("\xc3\xa4\xc3\xbf\xef\xbf\xbf")
            .Configuration(configured("\xc3\xa4\xc3\xbf\xef\xbf\xbf")),
        TokenCase("OfMaximumLength", profile, LoggedIn("alice"))
            .SignedUnder(longest)
            .Configuration(configured(longest)),
        TokenCase("OneByteTooLong", profile, Refused<sso_op_failed>("encode base64 failed."))
            .SignedUnder(tooLong)
            .Configuration(configured(tooLong)),
        TokenCase("CorrectWithPaddedSignature", profile, failed).Then([](const std::string &token) {
            return token + "=";
        }),
    };
}

INSTANTIATE_TEST_SUITE_P(Secret, TokenVerification, ValuesIn(Secret()), NameOfTokenCase);

std::vector<TokenCase> Identity() {
    const Profile azure = Profile::kAzure;
    const Profile webSphere = Profile::kWebSphere;
    const Outcome notFound = Refused<std::invalid_argument>("cannot find the user name!");
    const auto noName = [](const char *left) {
        return Refused<std::invalid_argument>("cannot get the user name!", left);
    };
    return {
        TokenCase("UniqueNameBeforeEmail", azure, LoggedIn(R"(CORP\Alice)")).Claims(R"({"email": "bob@corp.example"})"),
        TokenCase("EmailWithoutUniqueName", azure, LoggedIn(R"(CORP\bob)"))
            .Claims(R"({"unique_name": null, "email": "bob@corp.example"})"),
        TokenCase("EmailWhereTheUniqueNameIsANumber", azure, LoggedIn(R"(CORP\bob)"))
            .Claims(R"({"unique_name": 5, "email": "bob@Corp.Example"})"),
        TokenCase("Neither", azure, notFound).Claims(R"({"unique_name": null})"),
        TokenCase("WithoutAtSign", azure, noName("alice")).Claims(R"({"unique_name": "alice"})"),
        TokenCase("WithTwoAtSigns", azure, noName("alice")).Claims(R"({"unique_name": "alice@x@corp.example"})"),
        TokenCase("OfAnUnknownDomain", azure,
                  Refused<sso_op_failed>("TAVOWinsUserNameFqdn2Netbios failed.", R"(ELSEWHERE.EXAMPLE\Alice)"))
            .Claims(R"({"unique_name": "Alice@elsewhere.example"})")
            .Logs(UnknownDomain("ELSEWHERE.EXAMPLE")),
        TokenCase("SubjectBeforeEmail", webSphere, LoggedIn("alice")).Claims(R"({"email": "bob@corp.example"})"),
        TokenCase("EmptySubject", webSphere, LoggedIn("")).Claims(R"({"sub": ""})"),
        TokenCase("NoSubject", webSphere, notFound).Claims(R"({"sub": null, "email": "bob@corp.example"})"),
        TokenCase("SubjectANumber", webSphere, notFound).Claims(R"({"sub": 5})"),
    };
}

INSTANTIATE_TEST_SUITE_P(Identity, TokenVerification, ValuesIn(Identity()), NameOfTokenCase);

/// The complete answers of the Azure provider, and the outcome of a login with a good token.
struct DocumentCase {
    std::string name;
    std::function<std::vector<std::string>()> answers;
    Outcome outcome;
    std::vector<LogLine> log;
};

void PrintTo(const DocumentCase &row, std::ostream *stream) { *stream << row.name; }

class PublishedDocuments : public ::testing::TestWithParam<DocumentCase> {};

TEST_P(PublishedDocuments, YieldExpectedOutcome) {
    Provider provider(Profile::kAzure);
    provider.Answer(TokenResponse(SignedToken(TokenHeader(Profile::kAzure), TokenClaims(Profile::kAzure))));
    const std::vector<std::string> answers = GetParam().answers();
    for (const std::string &answer : answers) {
        provider.Answer(answer);
    }
    std::vector<std::string> requests = AllRequestLines(Profile::kAzure);
    requests.resize(1 + answers.size());

    EXPECT_EQ(provider.LogIn(), GetParam().outcome);
    EXPECT_THAT(TakeSystemLog(), ElementsAreArray(GetParam().log));
    EXPECT_THAT(provider.RequestLines(), ElementsAreArray(requests));
}

std::string KeySetOf(const std::vector<Json::Value> &keys) {
    Json::Value keySet;
    keySet["keys"] = Json::arrayValue;
    for (const Json::Value &key : keys) {
        keySet["keys"].append(key);
    }
    return Compact(keySet);
}

Json::Value ForeignKey() { return RSAKey().JWK(kKeyID); }

std::vector<DocumentCase> Documents() {
    const Outcome unknownKey = Refused<std::invalid_argument>("kid does not exist in Azure verified kyes");
    const Outcome loggedIn = LoggedIn(UserName(Profile::kAzure));
    const LogLine noURL = KeyRequestLogged(CURLE_URL_MALFORMAT);
    const LogLine notJSON = KeyRequestLogged("bad wellknown json format.");
    const LogLine badDiscovery = Error("sso:N bad wellknown json format.");
    const LogLine noKeys = Error("azuresso:N no kyes information");

    std::vector<DocumentCase> rows;
    const auto discovery = [&](const char *name, const std::string &document, const std::vector<LogLine> &log) {
        rows.push_back({name, [document] { return std::vector<std::string>{document}; }, unknownKey, log});
    };
    discovery("DiscoveryEmpty", "", {badDiscovery, noURL});
    discovery("DiscoveryNotJSON", "<html>", {badDiscovery, noURL});
    discovery("DiscoveryCutOff", R"({"jwks_uri": "$BASE/keys", "issuer": )", {badDiscovery, noURL});
    discovery("DiscoveryNestedTooDeep", std::string(2000, '['), {badDiscovery, noURL});
    discovery("DiscoveryAList", R"(["$BASE/keys"])", {noURL});
    discovery("DiscoveryWithoutKeySet", R"({"issuer": "the provider"})", {noURL});
    discovery("DiscoveryWhoseKeySetIsAList", R"({"jwks_uri": ["$BASE/keys"]})", {noURL});

    const auto keySet = [&](const char *name, const std::function<std::string()> &document, const Outcome &outcome,
                            const std::vector<LogLine> &log) {
        const auto answers = [document] {
            return std::vector<std::string>{R"({"jwks_uri": "$BASE/keys"})", document()};
        };
        rows.push_back({name, answers, outcome, log});
    };
    const auto badKeySet = [&](const char *name, const std::string &document, const std::vector<LogLine> &log) {
        const auto answer = [document] { return document; };
        keySet(name, answer, unknownKey, log);
    };
    badKeySet("KeySetEmpty", "", {notJSON});
    badKeySet("KeySetNotJSON", "<html>", {notJSON});
    badKeySet("KeySetAList", "[]", {noKeys});
    badKeySet("KeySetWithoutKeys", R"({"key": []})", {noKeys});
    badKeySet("KeySetOfNoKeys", R"({"keys": []})", {});
    badKeySet("KeySetOfNullKeys", R"({"keys": null})", {});
    badKeySet("KeySetOfOtherValues", R"({"keys": [5, "first key", null, ["kid"]]})", {});
    keySet("KeySetTruncatedAfterKey", [] { return KeySet().substr(0, KeySet().size() - 1); }, unknownKey, {notJSON});

    keySet(
        "OtherValuesBeforeTheKey",
        [] {
            return KeySetOf({5, "first key", Json::nullValue, Parse(R"({"kty": "RSA"})"), ProviderKey().JWK(kKeyID)});
        },
        loggedIn, {});
    const auto rightKeyFirst = [] { return KeySetOf({ProviderKey().JWK(kKeyID), ForeignKey()}); };
    const auto wrongKeyFirst = [] { return KeySetOf({ForeignKey(), ProviderKey().JWK(kKeyID)}); };
    keySet("TwoKeysOfThatNameTheFirstIsRight", rightKeyFirst, loggedIn, {});
    keySet("TwoKeysOfThatNameTheFirstIsWrong", wrongKeyFirst, Refused<jwt_verify_failed>("verify rsa signature failed"),
           {Error("jwt:N EVP_DigestVerifyFinal failed")});
    return rows;
}

INSTANTIATE_TEST_SUITE_P(Azure, PublishedDocuments, ValuesIn(Documents()),
                         [](const auto &row) { return row.param.name; });

class AzureLogin : public ::testing::Test {
  protected:
    static std::string Token() { return SignedToken(TokenHeader(Profile::kAzure), TokenClaims(Profile::kAzure)); }

    const Outcome unknownKey_ = Refused<std::invalid_argument>("kid does not exist in Azure verified kyes");
};

TEST_F(AzureLogin, FailsIfDiscoveryIsUnreachable) {
    const Port closed;
    Provider provider(Profile::kAzure,
                      R"({"azure_wellknown": "https://127.0.0.1:)" + std::to_string(closed.number()) + "\"}");
    provider.AnswerLogin(Token());
    EXPECT_EQ(provider.LogIn(), unknownKey_);
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error(std::string("sso:N ") + curl_easy_strerror(CURLE_COULDNT_CONNECT)),
                                             KeyRequestLogged(CURLE_URL_MALFORMAT)));
    EXPECT_THAT(provider.RequestLines(), ElementsAre("POST /token HTTP/1.1"));
}

TEST_F(AzureLogin, FailsIfKeySetIsUnreachable) {
    const Port closed;
    Provider provider(Profile::kAzure);
    provider.Answer(TokenResponse(Token()));
    provider.Answer(R"({"jwks_uri": "https://127.0.0.1:)" + std::to_string(closed.number()) + "\"}");
    EXPECT_EQ(provider.LogIn(), unknownKey_);
    EXPECT_THAT(TakeSystemLog(), ElementsAre(KeyRequestLogged(CURLE_COULDNT_CONNECT)));
}

TEST_F(AzureLogin, FailsIfKeySetServerIsUntrusted) {
    Server impostor(SelfSignedCertificateFor("IP:127.0.0.1"));
    impostor.Answer(HTTPAnswer(KeySet()));
    Provider provider(Profile::kAzure);
    provider.Answer(TokenResponse(Token()));
    provider.Answer(R"({"jwks_uri": ")" + impostor.URL("/keys") + "\"}");
    EXPECT_EQ(provider.LogIn(), unknownKey_);
    EXPECT_THAT(TakeSystemLog(), ElementsAre(KeyRequestLogged(CURLE_PEER_FAILED_VERIFICATION)));
}

TEST_F(AzureLogin, FailsIfKeySetIsTruncated) {
    Provider provider(Profile::kAzure);
    provider.Answer(TokenResponse(Token()));
    provider.Answer(R"({"jwks_uri": "$BASE/keys"})");
    provider.AnswerByteByByte(CutHTTPAnswer(KeySet(), 1));
    EXPECT_EQ(provider.LogIn(), unknownKey_);
    EXPECT_THAT(TakeSystemLog(), ElementsAre(KeyRequestLogged(CURLE_PARTIAL_FILE)));
}

TEST_F(AzureLogin, IgnoresHTTPStatus) {
    Provider provider(Profile::kAzure);
    provider.AnswerByteByByte(HTTPAnswer(TokenResponse(Token()), "500 Internal Server Error"));
    provider.AnswerByteByByte(HTTPAnswer(R"({"jwks_uri": ")" + provider.URL("/keys") + "\"}", "404 Not Found"));
    provider.AnswerByteByByte(HTTPAnswer(KeySet(), "503 Service Unavailable"));
    EXPECT_EQ(provider.LogIn(), LoggedIn(UserName(Profile::kAzure)));
}

/// An answer of the token endpoint, and the outcome of the login.
struct TokenAnswerCase {
    std::string name;
    Profile profile;
    std::string answer;
    Outcome outcome;
    std::vector<LogLine> log;
};

void PrintTo(const TokenAnswerCase &row, std::ostream *stream) { *stream << row.name; }

class TokenEndpoint : public ::testing::TestWithParam<TokenAnswerCase> {};

TEST_P(TokenEndpoint, YieldsExpectedOutcome) {
    Provider provider(GetParam().profile);
    provider.AnswerByteByByte(GetParam().answer);
    EXPECT_EQ(provider.LogIn(), GetParam().outcome);
    EXPECT_THAT(TakeSystemLog(), ElementsAreArray(GetParam().log));
    EXPECT_THAT(provider.RequestLines(), ElementsAre("POST /token HTTP/1.1"));
}

std::vector<TokenAnswerCase> TokenAnswers() {
    const Outcome notJSON = Refused<std::invalid_argument>("parse json falied");
    const Outcome noToken = Refused<sso_err_resp>("we cannot find key 'id_token' in response!");
    std::vector<TokenAnswerCase> rows;
    for (const Profile profile : kBoth) {
        const auto row = [&](const char *name, const std::string &answer, const Outcome &outcome,
                             const std::vector<LogLine> &log = {}) {
            rows.push_back({Name(profile) + name, profile, answer, outcome, log});
        };
        const auto error = [&](const char *text) {
            return profile == Profile::kAzure ? Refused<sso_err_resp>(text) : noToken;
        };
        row("Empty", HTTPAnswer(""), notJSON);
        row("NoAnswer", "", notJSON, {TokenRequestLogged(CURLE_GOT_NOTHING)});
        row("NotJSON", HTTPAnswer("<html>", "502 Bad Gateway"), notJSON);
        row("CutOffJSON", HTTPAnswer(R"({"id_token": "a.b.c")"), notJSON);
        row("CutOffOnTheWay", CutHTTPAnswer(R"({"id_token": "a.b)", 9), notJSON,
            {TokenRequestLogged(CURLE_PARTIAL_FILE)});
        row("NestedTooDeep", HTTPAnswer(std::string(2000, '[')), notJSON);
        row("NoToken", HTTPAnswer(R"({"access_token": "a"})"), noToken);
        row("TokenNull", HTTPAnswer(R"({"id_token": null})"), noToken);
        row("TokenANumber", HTTPAnswer(R"({"id_token": 5})"), noToken);
        row("AList", HTTPAnswer(R"(["id_token"])"), noToken);
        row("Null", HTTPAnswer("null"), noToken);
        row("AText", HTTPAnswer(R"("id_token")"), noToken);
        row("Error",
            HTTPAnswer(R"({"error_description": "gone", "error": "invalid_grant", "error_codes": [ 70008 ]})",
                       "400 Bad Request"),
            error("{\"error\":\"invalid_grant\",\"error_codes\":[70008],\"error_description\":\"gone\"}\n"));
        row("ErrorNull", HTTPAnswer(R"({"error": null})"), error("{\"error\":null}\n"));
    }
    rows.push_back({"AzureErrorNextToToken",
                    Profile::kAzure,
                    HTTPAnswer(R"({"id_token": "a.b.c", "error": 0})"),
                    Refused<sso_err_resp>("{\"error\":0,\"id_token\":\"a.b.c\"}\n"),
                    {}});
    return rows;
}

INSTANTIATE_TEST_SUITE_P(Answer, TokenEndpoint, ValuesIn(TokenAnswers()),
                         [](const auto &row) { return row.param.name; });

TEST(WebSphereTokenEndpoint, IgnoresErrorNextToToken) {
    const Profile profile = Profile::kWebSphere;
    Provider provider(profile);
    Json::Value answer = Parse(R"({"error": "ignored"})");
    answer["id_token"] = SignedToken(TokenHeader(profile), TokenClaims(profile));
    provider.AnswerByteByByte(HTTPAnswer(Compact(answer)));
    EXPECT_EQ(provider.LogIn(), LoggedIn("alice"));
}

TEST_P(WholeLogin, AcceptsCompleteTokenInTruncatedResponse) {
    Provider provider(GetParam());
    provider.AnswerByteByByte(
        CutHTTPAnswer(TokenResponse(SignedToken(TokenHeader(GetParam()), TokenClaims(GetParam()))), 9));
    provider.AnswerVerification();
    EXPECT_EQ(provider.LogIn(), LoggedIn(UserName(GetParam())));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(TokenRequestLogged(CURLE_PARTIAL_FILE)));
}

/// The key of the token endpoint in the client's file, with this URL.
std::string TokenEndpointAt(Profile profile, const std::string &url) {
    return std::string(profile == Profile::kAzure ? R"({"azure)" : R"({"websphere)") + R"(_token_endpoint": ")" + url +
           "\"}";
}

TEST_P(WholeLogin, FailsIfTokenEndpointRefusesConnection) {
    const Port closed;
    Provider provider(GetParam(),
                      TokenEndpointAt(GetParam(), "https://127.0.0.1:" + std::to_string(closed.number()) + "/token"));
    EXPECT_EQ(provider.LogIn(), Refused<std::invalid_argument>("parse json falied"));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(TokenRequestLogged(CURLE_COULDNT_CONNECT)));
    EXPECT_THAT(provider.Requests(), IsEmpty());
}

TEST_P(WholeLogin, SendsNothingToUntrustedServer) {
    Server impostor(SelfSignedCertificateFor("IP:127.0.0.1"));
    Provider provider(GetParam(), TokenEndpointAt(GetParam(), impostor.URL("/token")));
    EXPECT_EQ(provider.LogIn(), Refused<std::invalid_argument>("parse json falied"));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(TokenRequestLogged(CURLE_PEER_FAILED_VERIFICATION)));
    EXPECT_TRUE(impostor.Requests().empty());
}

TEST_P(WholeLogin, SendsNoRequestWithoutConfiguration) {
    Provider provider(GetParam());
    WriteFile(GetParam() == Profile::kAzure ? kAzureFile : kWebSphereFile, "");
    EXPECT_EQ(provider.LogIn(), Refused<std::invalid_argument>("parse json falied"));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(TokenRequestLogged(CURLE_URL_MALFORMAT)));
    EXPECT_THAT(provider.Requests(), IsEmpty());
}

TEST_P(WholeLogin, IsNotImplementedByClientOfProfile) {
    Provider provider(GetParam());
    TAVO::SSO::SSOProfile profile;
    std::string userName = kUserNameBefore;
    EXPECT_THROW(profile.GetSSOClient()->OpenIDConnectLogin("a code", userName), TAVO::SSO::sso_not_implemented);
    EXPECT_EQ(userName, kUserNameBefore);
    EXPECT_THAT(provider.Requests(), IsEmpty());
}

TEST(WithoutNetwork, ReadsProfile) {
    Provider provider(Profile::kAzure);
    TAVO::SSO::SSOProfile profile;
    EXPECT_TRUE(profile.SSOIsEnable());
    EXPECT_EQ(profile.GetSSOClient()->GetTokenEndpoint(), provider.URL("/token"));
    EXPECT_EQ(profile.GetSSOClient()->GetWellknownEndpoint(), provider.URL("/discovery"));
    EXPECT_THAT(provider.Requests(), IsEmpty());
    EXPECT_THAT(TakeSystemLog(), IsEmpty());
}

TEST(WithoutNetwork, BuildsLogoutURL) {
    Provider provider(Profile::kAzure, R"({"azure_logout_endpoint": "$BASE/logout"})");
    EXPECT_EQ(TAVO::SSO::GetAzureSSOLogoutURL(""), provider.URL("/logout"));
    EXPECT_THAT(
        TAVO::SSO::GetAzureSSOLogoutURL("https://nas.example/index.cgi"),
        EndsWith("/logout?post_logout_redirect_uri=https%3A%2F%2Fnas.example%2Fwebman%2Fssoclient%2Frelay.html"));
    EXPECT_THAT(provider.Requests(), IsEmpty());
}

}  // namespace

}  // namespace Test
