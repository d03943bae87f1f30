#include <curl/curl.h>
#include <gmock/gmock.h>

#include <functional>
#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

#include "jwt/jwt.h"
#include "tests/loopback/loopback_provider.h"
#include "tests/support/encoding.h"
#include "tests/support/files.h"
#include "tests/support/server.h"
#include "tests/support/system_log.h"
#include "tests/support/token.h"

// Discovery documents and key sets of a hostile provider.
namespace Test {

namespace {

using TAVO::JWT::jwt_verify_failed;
using ::testing::ElementsAre;
using ::testing::ElementsAreArray;
using ::testing::IsEmpty;
using ::testing::ValuesIn;

constexpr char kFile[] = "/tmp/keys.json";

Outcome UnknownKey() { return Refused<std::invalid_argument>("kid does not exist in Azure verified kyes"); }

Outcome Accepted() { return LoggedIn(UserName(Profile::kAzure)); }

LogLine KeyRequestLogged(CURLcode result) {
    return Error(std::string("azuresso:N request wellknown uri ") + curl_easy_strerror(result) + ".");
}

std::string Token(const std::string &headerChanges = "{}") {
    return SignedToken(Change(TokenHeader(Profile::kAzure), headerChanges), TokenClaims(Profile::kAzure));
}

/// The address of the key set in a discovery document.
struct AddressCase {
    std::string name;
    std::string jwksURI;  // JSON; $INSIDE is an HTTP server in the appliance's network
    Outcome outcome;
    std::vector<LogLine> log;
    std::vector<std::string> requestsInside;
};

void PrintTo(const AddressCase &row, std::ostream *stream) { *stream << row.name; }

class KeySetAddress : public ::testing::TestWithParam<AddressCase> {
  protected:
    std::string JwksURI() const {
        constexpr char kInside[] = "$INSIDE";
        std::string text = GetParam().jwksURI;
        const std::size_t start = text.find(kInside);
        const std::string address = "127.0.0.1:" + PortInside();
        return start == std::string::npos ? text : text.replace(start, sizeof kInside - 1, address);
    }

    std::string PortInside() const {
        const std::string url = inside_.URL("");
        return url.substr(url.rfind(':') + 1);
    }

    Server inside_;
};

TEST_P(KeySetAddress, IsPassedToLibcurl) {
    Provider provider(Profile::kAzure);
    WriteFile(kFile, KeySet());
    inside_.Answer(HTTPAnswer(KeySet()));
    provider.Answer(TokenResponse(Token()));
    provider.Answer(R"({"jwks_uri": )" + JwksURI() + "}");
    EXPECT_EQ(provider.LogIn(), GetParam().outcome);
    EXPECT_THAT(TakeSystemLog(), ElementsAreArray(GetParam().log));
    EXPECT_THAT(inside_.RequestLines(), ElementsAreArray(GetParam().requestsInside));
}

std::vector<AddressCase> Types() {
    const auto refused = [](const char *name, const char *json, CURLcode result) {
        return AddressCase{name, json, UnknownKey(), {KeyRequestLogged(result)}, {}};
    };
    return {
        refused("Null", "null", CURLE_URL_MALFORMAT),
        refused("True", "true", CURLE_COULDNT_RESOLVE_HOST),
        refused("False", "false", CURLE_COULDNT_RESOLVE_HOST),
        refused("Number", "5", CURLE_COULDNT_CONNECT),
        refused("NumberOfLoopbackAddress", "2130706433", CURLE_COULDNT_CONNECT),
        refused("Fraction", "0.5", CURLE_COULDNT_CONNECT),
        refused("EmptyText", R"("")", CURLE_URL_MALFORMAT),
        refused("Object", R"({"uri": "http://$INSIDE/keys"})", CURLE_URL_MALFORMAT),
    };
}

std::vector<AddressCase> Addresses() {
    const auto refused = [](const char *name, const std::string &json, const LogLine &line) {
        return AddressCase{name, json, UnknownKey(), {line}, {}};
    };
    const std::vector<std::string> asked = {"GET /keys HTTP/1.1"};
    return {
        {"File", R"("file:///tmp/keys.json")", Accepted(), {}, {}},
        refused("FileOfTheAppliance", R"("file:///usr/tavo/etc/ssoclient/azure.conf")",
                Error("azuresso:N no kyes information")),
        refused("MissingFile", R"("file:///tmp/nothing")", KeyRequestLogged(CURLE_FILE_COULDNT_READ_FILE)),
        {"InsideWithoutTLS", R"("http://$INSIDE/keys")", Accepted(), {}, asked},
        {"InsideWithoutScheme", R"("$INSIDE/keys")", Accepted(), {}, asked},
        refused("OfAnUnknownScheme", R"("secret://$INSIDE/keys")", KeyRequestLogged(CURLE_UNSUPPORTED_PROTOCOL)),
        refused("WithALineBreak", R"("http://$INSIDE/keys\r\nX: y")", KeyRequestLogged(CURLE_URL_MALFORMAT)),
        refused("WithABlank", R"("http://$INSIDE/ke ys")", KeyRequestLogged(CURLE_URL_MALFORMAT)),
        {"UpToItsFirstNUL", R"("http://$INSIDE/keys\u0000\r\nX: y")", Accepted(), {}, asked},
        refused("Of9MB", "\"http://$INSIDE/" + std::string(std::size_t{9} << 20, 'k') + "\"",
                KeyRequestLogged(CURLE_URL_MALFORMAT)),
        {"RepeatedLastCounts", R"("file:///tmp/nothing", "jwks_uri": "http://$INSIDE/keys")", Accepted(), {}, asked},
    };
}

std::string NameOfAddress(const ::testing::TestParamInfo<AddressCase> &info) { return info.param.name; }

INSTANTIATE_TEST_SUITE_P(Type, KeySetAddress, ValuesIn(Types()), NameOfAddress);
INSTANTIATE_TEST_SUITE_P(Address, KeySetAddress, ValuesIn(Addresses()), NameOfAddress);

TEST(DiscoveryDocument, NamesNoKeySetUnlessObject) {
    for (const char *document : {"null", "true", "5", "0.5", R"("$BASE/keys")", R"([{"jwks_uri": "$BASE/keys"}])"}) {
        Provider provider(Profile::kAzure);
        provider.Answer(TokenResponse(Token()));
        provider.Answer(document);
        provider.Answer(KeySet());
        EXPECT_EQ(provider.LogIn(), UnknownKey()) << document;
        EXPECT_THAT(TakeSystemLog(), ElementsAre(KeyRequestLogged(CURLE_URL_MALFORMAT))) << document;
    }
}

/// A published key set. $KEY is replaced with the members of the signing key.
struct KeySetCase {
    std::string name;
    std::string keySet;
    Outcome outcome;
    std::string header = "{}";
    std::vector<LogLine> log = {};
};

void PrintTo(const KeySetCase &row, std::ostream *stream) { *stream << row.name; }

std::string MembersOfTheKey() {
    const Json::Value key = ProviderKey().JWK(kKeyID);
    return R"("n": ")" + key["n"].asString() + R"(", "e": ")" + key["e"].asString() + "\"";
}

class PublishedKeys : public ::testing::TestWithParam<KeySetCase> {};

TEST_P(PublishedKeys, YieldExpectedOutcome) {
    std::string keySet = GetParam().keySet;
    constexpr char kKey[] = "$KEY";
    for (std::size_t at; (at = keySet.find(kKey)) != std::string::npos;) {
        keySet.replace(at, sizeof kKey - 1, MembersOfTheKey());
    }
    Provider provider(Profile::kAzure);
    provider.Answer(TokenResponse(Token(GetParam().header)));
    provider.Answer(R"({"jwks_uri": "$BASE/keys"})");
    provider.Answer(keySet);
    EXPECT_EQ(provider.LogIn(), GetParam().outcome);
    EXPECT_THAT(TakeSystemLog(), ElementsAreArray(GetParam().log));
}

std::string Keys(const std::string &keys) { return R"({"keys": [)" + keys + "]}"; }

std::string Key(const std::string &members) { return Keys("{" + members + "}"); }

const std::string kNamed = R"("kid": "first key")";

std::vector<KeySetCase> Sets() {
    const std::string other = R"({"kid": "another key", "n": "AQAB", "e": "AQAB"}, )";
    const std::string right = "{" + kNamed + ", $KEY}";
    std::string many;
    for (int i = 1; i < 10'000; ++i) {
        many += other;
    }
    const std::string foreign =
        "{" + kNamed + R"(, "n": ")" + Base64Url(std::string(256, '\xff')) + R"(", "e": "AQAB"})";
    return {
        {"TenThousandLastIsCorrect", Keys(many + right), Accepted()},
        {"TenThousandNoneIsCorrect", Keys(many + R"({"kid": "last key", $KEY})"), UnknownKey()},
        {"TenThousandFirstIsCorrect", Keys(right + "," + many + foreign), Accepted()},
        {"SameNameFirstIsOfAnotherType",
         Keys("{" + kNamed + R"(, "kty": "EC", "crv": "P-256", "x": "AQAB", "y": "AQAB"}, )" + right),
         Refused<std::invalid_argument>("RSA public 'n' cannot be found!")},
        {"SymmetricKeyOfTheName", Key(kNamed + R"(, "kty": "oct", "k": "AQAB")"),
         Refused<std::invalid_argument>("RSA public 'n' cannot be found!")},
        {"KeyOfAnotherTypeAndName", Keys(R"({"kid": "x", "kty": "EC"}, )" + right), Accepted()},
        {"KeyWithAnotherDeclaredType", Key(kNamed + R"(, "kty": "EC", "use": "enc", "alg": "RS512", $KEY)"),
         Accepted()},
        {"SetsRepeatedLastCounts", R"({"keys": [], "keys": [)" + right + "]}", Accepted()},
        {"SetsRepeatedLastIsEmpty", R"({"keys": [)" + right + R"(], "keys": []})", UnknownKey()},
        {"ASetInASet", Keys("[" + right + "]"), UnknownKey()},
        {"True", R"({"keys": true})", UnknownKey()},
        {"ANumber", R"({"keys": 5})", UnknownKey()},
        {"AText", R"({"keys": "first key"})", UnknownKey()},
        {"AnEmptyObject", R"({"keys": {}})", UnknownKey()},
    };
}

std::vector<KeySetCase> Names() {
    const std::string text = "\"" + std::string(std::size_t{1} << 20, 'k') + "\"";
    const auto row = [](const char *name, const Outcome &outcome, const std::string &inHeader,
                        const std::string &inKey) {
        return KeySetCase{name, Key(R"("kid": )" + inKey + ", $KEY"), outcome, R"({"kid": )" + inHeader + "}"};
    };
    return {
        row("True", Accepted(), "true", "true"),
        row("TrueAndItsText", Accepted(), "true", R"("true")"),
        row("FalseAndItsText", Accepted(), R"("false")", "false"),
        row("NumberAndItsText", Accepted(), R"("-7")", "-7"),
        row("FractionAndItsText", Accepted(), "0.5", R"("0.5")"),
        row("NumbersOfOneValueInTwoTexts", UnknownKey(), "7", "7.0"),
        row("MissingAndNull", Accepted(), "null", "null"),
        row("MissingAndEmpty", Accepted(), R"("")", "null"),
        row("TextAndNull", UnknownKey(), R"("first key")", "null"),
        row("Objects", UnknownKey(), R"({"a": 1})", R"({"a": 1})"),
        row("Lists", UnknownKey(), R"(["first key"])", R"(["first key"])"),
        row("EmptyAndList", UnknownKey(), R"("")", "[]"),
        row("Of1MB", Accepted(), text, text),
        row("EqualUpToNUL", UnknownKey(), R"("first key")", R"("first key\u0000")"),
        row("EqualWithNUL", Accepted(), R"("first\u0000key")", R"("first\u0000key")"),
        row("RepeatedLastCounts", Accepted(), R"("second")", R"("first", "kid": "second")"),
        row("RepeatedFirstDoesNotCount", UnknownKey(), R"("first")", R"("first", "kid": "second")"),
    };
}

std::vector<KeySetCase> Members() {
    std::vector<KeySetCase> rows;
    const std::pair<const char *, const char *> values[] = {
        {"Null", "null"},
        {"True", "true"},
        {"Fraction", "0.5"},
        {"List", R"(["AQAB"])"},
        {"Object", R"({"n": "AQAB"})"},
    };
    for (const auto &[type, value] : values) {
        const std::string json = value;
        rows.push_back({std::string("ModulusOfType") + type, Key(kNamed + R"(, "e": "AQAB", "n": )" + json),
                        Refused<std::invalid_argument>("RSA public 'n' cannot be found!")});
        rows.push_back({std::string("ExponentOfType") + type, Key(kNamed + ", $KEY, \"e\": " + json),
                        Refused<std::invalid_argument>("RSA public 'e' cannot be found!")});
    }
    rows.push_back({"ExponentRepeatedLastCounts", Key(kNamed + R"(, "e": 5, $KEY)"), Accepted()});
    rows.push_back({"ModulusUpToItsFirstNUL",
                    Key(kNamed + R"(, $KEY, "n": "AQAB\u0000")"),
                    Refused<jwt_verify_failed>("verify rsa signature failed"),
                    "{}",
                    {Error("jwt:N EVP_DigestVerifyFinal failed")}});
    return rows;
}

std::string NameOfKeySet(const ::testing::TestParamInfo<KeySetCase> &info) { return info.param.name; }

INSTANTIATE_TEST_SUITE_P(Set, PublishedKeys, ValuesIn(Sets()), NameOfKeySet);
INSTANTIATE_TEST_SUITE_P(Name, PublishedKeys, ValuesIn(Names()), NameOfKeySet);
INSTANTIATE_TEST_SUITE_P(Member, PublishedKeys, ValuesIn(Members()), NameOfKeySet);

}  // namespace

}  // namespace Test
