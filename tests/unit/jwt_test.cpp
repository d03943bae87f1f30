#include "jwt/jwt.h"

#include <openssl/bn.h>
#include <openssl/err.h>
#include <openssl/rand.h>

#include <fstream>
#include <sstream>

#include "tests/support/encoding.h"
#include "tests/support/interposed/calls.h"
#include "tests/support/interposed/memory.h"
#include "tests/support/openssl_errors.h"
#include "tests/support/token.h"
#include "tests/unit/fixture.h"

namespace Test {

namespace {

using namespace TAVO::JWT;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::StartsWith;

const auto kBadFormat = Fails<std::invalid_argument>("bad jwt format!");
const auto kBadHeader = Fails<std::invalid_argument>("bad jwt header format!");
const auto kBadBody = Fails<std::invalid_argument>("bad jwt body format!");
const auto kRSAFailed = Fails<jwt_verify_failed>("verify rsa signature failed");
const auto kHMACFailed = Fails<jwt_verify_failed>("verify hmac signature failed");
const Failure &kVerified = kNothingThrown;

class JwtParsing : public Library {
  protected:
    static Json::Value HeaderOf(const std::string &part) { return Jwt(part + ".e30.c2ln").GetHeader(); }
    static Json::Value BodyOf(const std::string &part) { return Jwt("e30." + part + ".c2ln").GetBody(); }
};

TEST_F(JwtParsing, RejectsTokenUnlessThreeParts) {
    for (const char *token : {"", "a", "a.b", "a.b.c.d", "...", "."}) {
        EXPECT_EQ(FailureOf([&] { Jwt jwt(token); }), kBadFormat) << token;
    }
}

TEST_F(JwtParsing, RejectsMillionPartsWithoutSplitting) {
    const std::string token(1000000, '.');
    const MemoryLimit limit(2000000);
    EXPECT_EQ(FailureOf([&] { Jwt jwt(token); }), kBadFormat);
}

TEST_F(JwtParsing, AcceptsEmptyPartsInConstructor) {
    EXPECT_EQ(Jwt("a..c").GetSignature(), "c");
    EXPECT_EQ(Jwt(".b.c").GetSignature(), "c");
    EXPECT_EQ(Jwt("a.b.").GetSignature(), "");
    EXPECT_EQ(Jwt("..").GetSignature(), "");
}

TEST_F(JwtParsing, AcceptsAnyCharactersInConstructor) { EXPECT_EQ(Jwt("?!.\xff.\n ").GetSignature(), "\n "); }

TEST_F(JwtParsing, ReturnsSignatureUndecoded) { EXPECT_EQ(Jwt("e30.e30.c2ln-_=").GetSignature(), "c2ln-_="); }

TEST_F(JwtParsing, DecodesHeaderAndBody) {
    Jwt jwt(Base64Url(R"({"alg": "RS256"})") + "." + Base64Url(R"({"sub": "alice"})") + ".");
    EXPECT_EQ(jwt.GetHeader(), Parse(R"({"alg": "RS256"})"));
    EXPECT_EQ(jwt.GetBody(), Parse(R"({"sub": "alice"})"));
}

TEST_F(JwtParsing, AcceptsBase64AndBase64Url) {
    // {"a":"???>>~"} and a blank: has both special characters and padding
    EXPECT_EQ(HeaderOf("eyJhIjoiPz8_Pj5-In0g"), Parse(R"({"a": "???>>~"})"));
    EXPECT_EQ(HeaderOf("eyJhIjoiPz8/Pj5+In0g"), Parse(R"({"a": "???>>~"})"));
    EXPECT_EQ(HeaderOf("eyJhIjoxfQ"), Parse(R"({"a": 1})"));
    EXPECT_EQ(HeaderOf("eyJhIjoxfQ=="), Parse(R"({"a": 1})"));
}

TEST_F(JwtParsing, ReturnsAnyJSONValue) {
    EXPECT_EQ(HeaderOf(Base64Url("[1, 2]")), Parse("[1, 2]"));
    EXPECT_EQ(HeaderOf(Base64Url("17")), Json::Value(17));
    EXPECT_EQ(BodyOf(Base64Url("\"text\"")), Json::Value("text"));
}

TEST_F(JwtParsing, RejectsInvalidJSON) {
    for (const char *text : {"no JSON", "{", "{\"a\": 1", "\x01"}) {
        EXPECT_EQ(FailureOf([&] { HeaderOf(Base64Url(text)); }), kBadHeader) << text;
        EXPECT_EQ(FailureOf([&] { BodyOf(Base64Url(text)); }), kBadBody) << text;
    }
}

TEST_F(JwtParsing, RejectsInvalidBase64AsInvalidJSON) {
    for (const char *part : {"!!!!", "A", "####", "\xff"}) {
        EXPECT_EQ(FailureOf([&] { HeaderOf(part); }), kBadHeader) << part;
        EXPECT_EQ(FailureOf([&] { BodyOf(part); }), kBadBody) << part;
    }
}

TEST_F(JwtParsing, RejectsDeeplyNestedJSON) {
    EXPECT_EQ(FailureOf([] { HeaderOf(Base64Url(std::string(2000, '['))); }), kBadHeader);
    EXPECT_EQ(FailureOf([] { BodyOf(Base64Url(std::string(2000, '['))); }), kBadBody);
}

TEST_F(JwtParsing, ThrowsLogicErrorForEmptyPart) {
    const std::string logicError = typeid(std::logic_error).name();
    EXPECT_EQ(FailureOf([] { HeaderOf(""); }).type, logicError);
    EXPECT_EQ(FailureOf([] { BodyOf(""); }).type, logicError);
    EXPECT_NE(FailureOf([] { HeaderOf(""); }).text, kBadHeader.text);
}

TEST_F(JwtParsing, ThrowsLogicErrorIfMemoryRunsOut) {
    for (const char *call : {"BIO_new", "BIO_new_mem_buf", "BIO_ctrl"}) {
        FailCall(call);
        EXPECT_EQ(FailureOf([] { HeaderOf("e30"); }).type, typeid(std::logic_error).name()) << call;
        FailNothing();
        EXPECT_THAT(TakeErrorQueue(), IsEmpty()) << call;
    }
    FailCall("BIO_read");
    EXPECT_EQ(FailureOf([] { HeaderOf("e30"); }), kBadHeader);
}

TEST_F(JwtParsing, IgnoresDecodedBytesAfterNUL) {
    EXPECT_EQ(BodyOf(Base64Url(std::string("{\"a\": 1}\0 no JSON", 17))), Parse(R"({"a": 1})"));
    EXPECT_EQ(FailureOf([] { BodyOf(Base64Url(std::string("\0{}", 3))); }), kBadBody);
}

TEST_F(JwtParsing, RejectsNULInsideString) {
    const std::string part = Base64Url(std::string("{\"a\": \"b\0c\"}", 12));
    EXPECT_EQ(FailureOf([&] { HeaderOf(part); }), kBadHeader);
    EXPECT_EQ(FailureOf([&] { BodyOf(part); }), kBadBody);
}

TEST_F(JwtParsing, ReadsPartUpToNUL) {
    EXPECT_EQ(HeaderOf(std::string("e30\0rest", 8)), Json::Value(Json::objectValue));
}

TEST_F(JwtParsing, ReturnsEqualValuesWhenReadTwice) {
    Jwt jwt("eyJhIjoxfQ.eyJiIjoyfQ.c2ln");
    EXPECT_EQ(jwt.GetHeader(), jwt.GetHeader());
    EXPECT_EQ(jwt.GetBody(), jwt.GetBody());
}

TEST_F(JwtParsing, CollectsComments) { EXPECT_TRUE(HeaderOf(Base64Url("// why\n{}")).hasComment(Json::commentBefore)); }

TEST_F(JwtParsing, ReadsPartsAroundBufferSize) {
    for (std::size_t size = 3040; size < 3090; ++size) {
        EXPECT_EQ(BodyOf(Base64Url("\"" + std::string(size, 'x') + "\"")), Json::Value(std::string(size, 'x')));
    }
}

TEST_F(JwtParsing, ReadsLargeParts) {
    for (const std::size_t size : {500u, 1024u, 3000u, 4092u, 100000u}) {
        Json::Value value;
        value["filler"] = std::string(size, 'x');
        EXPECT_EQ(BodyOf(Base64Url(Compact(value))), value) << size;
    }
}

class RSASignature : public Library {
  protected:
    RSASignature() {
        const Json::Value key = ProviderKey().JWK("key 1");
        n = key["n"].asString();
        e = key["e"].asString();
    }

    Failure Verify(const std::string &compact, const EVP_MD *digest = EVP_sha256()) {
        return FailureOf([&] { Jwt(compact).JwtRSAVerify(n, e, digest); });
    }

    std::string n;
    std::string e;
    const std::string token = ProviderKey().RS256Token(Parse(R"({"sub": "alice"})"), "key 1");
};

constexpr char kFinalFailed[] = "jwt:N EVP_DigestVerifyFinal failed";

TEST_F(RSASignature, VerifiesWithItsKeyAndDigest) {
    const std::string nBefore = n;
    const std::string eBefore = e;
    EXPECT_EQ(Verify(token), kVerified);
    EXPECT_EQ(n, nBefore);
    EXPECT_EQ(e, eBefore);
}

TEST_F(RSASignature, LogsOneLineForAnotherDigest) {
    EXPECT_EQ(Verify(token, EVP_sha384()), kRSAFailed);
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error(kFinalFailed)));
}

TEST_F(RSASignature, FailsIfAnyCharacterChanges) {
    const std::size_t length = token.rfind('.');
    int tried = 0;
    for (std::size_t i = 0; i < length; ++i) {
        if (token[i] != '.') {
            std::string changed = token;
            changed[i] = changed[i] == 'A' ? 'B' : 'A';
            EXPECT_EQ(Verify(changed), kRSAFailed) << i;
            ++tried;
        }
    }
    EXPECT_GT(tried, 30);
    EXPECT_EQ(TakeSystemLog().size(), static_cast<std::size_t>(tried));
}

TEST_F(RSASignature, FailsSilentlyIfPartIsNotBase64) {
    const std::string good = n;
    for (const char *part : {"", "!!!!", "####AQAB"}) {
        n = part;
        EXPECT_EQ(Verify(token), kRSAFailed) << part;
        n = good;
        e = part;
        EXPECT_EQ(Verify(token), kRSAFailed) << part;
        e = "AQAB";
        EXPECT_EQ(Verify("e30.e30." + std::string(part)), kRSAFailed) << part;
    }
    EXPECT_THAT(TakeSystemLog(), IsEmpty());
}

TEST_F(RSASignature, LogsOneLineForInvalidKey) {
    for (const auto &[modulus, exponent] : std::vector<std::pair<std::string, std::string>>{
             {"AQ", "AQAB"}, {"AA", "AQAB"}, {n, "AA"}, {n, "AQ"}, {n, "Ag"}, {n, n}, {n + n, "AQAB"}}) {
        EXPECT_EQ(FailureOf([&, m = modulus, x = exponent]() mutable { Jwt(token).JwtRSAVerify(m, x, EVP_sha256()); }),
                  kRSAFailed);
        EXPECT_EQ(TakeSystemLog().size(), 1u);
    }
}

TEST_F(RSASignature, ReadsEachPartUpToNUL) {
    const std::size_t dot = token.rfind('.');
    const std::string junk("\0junk", 5);
    EXPECT_EQ(Verify(token.substr(0, dot) + junk + token.substr(dot) + junk), kVerified);
}

TEST_F(RSASignature, AcceptsPadding) { EXPECT_EQ(Verify(token + "=="), kVerified); }

struct FailingCall {
    const char *function;
    int call;
    const char *line;  // null: nothing is logged
};

/// By default GoogleTest prints the bytes of the object, including uninitialised padding.
void PrintTo(const FailingCall &row, std::ostream *stream) { *stream << row.function << "Number" << row.call; }

std::string Named(const testing::TestParamInfo<FailingCall> &info) { return testing::PrintToString(info.param); }

class FailingRSACall : public RSASignature, public testing::WithParamInterface<FailingCall> {};

TEST_P(FailingRSACall, FailsVerificationAndLogsExpectedLine) {
    FailCall(GetParam().function, GetParam().call);
    EXPECT_EQ(Verify(token), kRSAFailed);
    if (GetParam().line != nullptr) {
        EXPECT_THAT(TakeSystemLog(), ElementsAre(Error(GetParam().line)));
    } else {
        EXPECT_THAT(TakeSystemLog(), IsEmpty());
    }
    FailNothing();
    EXPECT_THAT(TakeErrorQueue(), IsEmpty());
    EXPECT_EQ(Verify(token), kVerified);
}

INSTANTIATE_TEST_SUITE_P(, FailingRSACall,
                         testing::Values(FailingCall{"BIO_new", 1, nullptr}, FailingCall{"BIO_new", 2, nullptr},
                                         FailingCall{"BIO_new", 3, nullptr}, FailingCall{"BIO_new_mem_buf", 1, nullptr},
                                         FailingCall{"BIO_ctrl", 1, nullptr}, FailingCall{"BIO_read", 1, nullptr},
                                         FailingCall{"BIO_read", 2, nullptr}, FailingCall{"BIO_read", 3, nullptr},
                                         FailingCall{"BN_bin2bn", 1, nullptr}, FailingCall{"BN_bin2bn", 2, nullptr},
                                         FailingCall{"RSA_new", 1, nullptr}, FailingCall{"RSA_set0_key", 1, nullptr},
                                         FailingCall{"EVP_PKEY_new", 1, nullptr},
                                         FailingCall{"EVP_PKEY_assign", 1, "jwt:N EVP_PKEY_assign_RSA failed"},
                                         FailingCall{"EVP_PKEY_get_id", 1, "jwt:N check key type failed"},
                                         FailingCall{"EVP_MD_CTX_new", 1, nullptr},
                                         FailingCall{"EVP_DigestVerifyInit", 1, "jwt:N EVP_DigestVerifyInit failed"},
                                         FailingCall{"EVP_DigestUpdate", 1, "jwt:N EVP_DigestVerifyUpdate failed"},
                                         FailingCall{"EVP_DigestVerifyFinal", 1, kFinalFailed}),
                         Named);

class HMACSignature : public Library {
  protected:
    static std::string Sign(const std::string &secret, const EVP_MD *digest = EVP_sha256()) {
        return kSigningInput + "." + SignHMAC(kSigningInput, secret, digest);
    }

    static Failure Verify(const std::string &token, std::string key, const EVP_MD *digest = EVP_sha256()) {
        return FailureOf([&] { Jwt(token).JwtHMACVerify(key, digest); });
    }

    void TearDown() override {
        EXPECT_THAT(TakeSystemLog(), IsEmpty()) << "the HMAC check logs nothing";
        Library::TearDown();
    }

    static inline const std::string kSigningInput = "eyJhbGciOiJIUzI1NiJ9.eyJzdWIiOiJhbGljZSJ9";
};

TEST_F(HMACSignature, VerifiesWithKeyAndEachDigest) {
    EXPECT_EQ(Verify(Sign("key"), "a2V5"), kVerified);
    EXPECT_EQ(Verify(Sign("key", EVP_sha384()), "a2V5", EVP_sha384()), kVerified);
    EXPECT_EQ(Verify(Sign("key", EVP_sha512()), "a2V5", EVP_sha512()), kVerified);
}

TEST_F(HMACSignature, KeepsKeyUnchanged) {
    std::string key = "a2V5";
    Jwt(Sign("key")).JwtHMACVerify(key, EVP_sha256());
    EXPECT_EQ(key, "a2V5");
}

TEST_F(HMACSignature, FailsWithAnotherKeyOrDigest) {
    EXPECT_EQ(Verify(Sign("key"), "a2V6"), kHMACFailed);
    EXPECT_EQ(Verify(Sign("key"), "a2V5", EVP_sha384()), kHMACFailed);
}

TEST_F(HMACSignature, FailsIfAnyCharacterChanges) {
    const std::string token = Sign("key");
    for (std::size_t i = 0; i < token.size(); ++i) {
        if (token[i] != '.') {
            std::string changed = token;
            changed[i] = changed[i] == 'A' ? 'B' : 'A';
            EXPECT_EQ(Verify(changed, "a2V5"), kHMACFailed) << i;
        }
    }
}

TEST_F(HMACSignature, FailsWithPaddingOrStandardBase64) {
    EXPECT_EQ(Verify(Sign("key") + "=", "a2V5"), kHMACFailed);
    std::string standard;
    for (int i = 0; standard.empty(); ++i) {  // searches for a signature with both special characters
        const std::string secret = std::to_string(i);
        std::string token = Sign(secret);
        if (token.find('-') != std::string::npos && token.find('_') != std::string::npos) {
            EXPECT_EQ(Verify(token, Base64Url(secret)), kVerified);
            std::replace(token.begin(), token.end(), '-', '+');
            std::replace(token.begin(), token.end(), '_', '/');
            EXPECT_EQ(Verify(token, Base64Url(secret)), kHMACFailed);
            standard = token;
        }
    }
}

TEST_F(HMACSignature, ReadsEachPartUpToNUL) {
    const std::string token = Sign("key");
    const std::size_t dot = token.rfind('.');
    const std::string junk("\0junk", 5);
    EXPECT_EQ(Verify(token.substr(0, dot) + junk + token.substr(dot) + junk, "a2V5"), kVerified);
}

TEST_F(HMACSignature, FailsIfEmptyOrTruncated) {
    EXPECT_EQ(Verify(kSigningInput + ".", "a2V5"), kHMACFailed);
    const std::string token = Sign("key");
    EXPECT_EQ(Verify(token.substr(0, token.size() - 1), "a2V5"), kHMACFailed);
}

TEST_F(HMACSignature, AcceptsBase64AndBase64UrlKey) {
    const std::string secret = "\xfb\xff\xbf?>";
    EXPECT_EQ(Verify(Sign(secret), "+/+/Pz4="), kVerified);
    EXPECT_EQ(Verify(Sign(secret), "-_-_Pz4"), kVerified);
}

TEST_F(HMACSignature, RejectsEmptyOrUndecodableKey) {
    for (const char *key : {"", "!!!!", "!", "####a2V5"}) {
        EXPECT_EQ(Verify(Sign(""), key), kHMACFailed) << key;
    }
}

class FailingHMACCall : public HMACSignature, public testing::WithParamInterface<FailingCall> {};

TEST_P(FailingHMACCall, FailsVerificationSilently) {
    const std::string token = Sign("key");
    FailCall(GetParam().function, GetParam().call);
    EXPECT_EQ(Verify(token, "a2V5"), kHMACFailed);
    FailCall(GetParam().function, GetParam().call);
    EXPECT_EQ(Verify(kSigningInput + ".", "a2V5"), kHMACFailed) << "an empty signature must not match a missing MAC";
    FailNothing();
    EXPECT_THAT(TakeErrorQueue(), IsEmpty());
    EXPECT_EQ(Verify(token, "a2V5"), kVerified);
}

INSTANTIATE_TEST_SUITE_P(, FailingHMACCall,
                         testing::Values(FailingCall{"BIO_new", 1, nullptr}, FailingCall{"BIO_new_mem_buf", 1, nullptr},
                                         FailingCall{"BIO_ctrl", 1, nullptr}, FailingCall{"BIO_read", 1, nullptr},
                                         FailingCall{"BIO_new", 2, nullptr}, FailingCall{"BIO_new", 3, nullptr},
                                         FailingCall{"HMAC", 1, nullptr}, FailingCall{"BIO_write", 1, nullptr},
                                         FailingCall{"BIO_ctrl", 2, nullptr}, FailingCall{"BIO_ctrl", 3, nullptr},
                                         FailingCall{"BIO_read", 2, nullptr}),
                         Named);

TEST_F(RSASignature, KeepsErrorQueueOfHost) {
    TakeErrorQueue();
    ERR_raise(ERR_LIB_USER, 17);
    const std::string other = RSAKey().RS256Token(Parse("{}"), "key 1");
    EXPECT_EQ(Verify(other), kRSAFailed);
    EXPECT_EQ(Verify(token), kVerified);
    EXPECT_THAT(TakeErrorQueue(), ElementsAre(StartsWith("17 ")));

    EXPECT_EQ(Verify(other), kRSAFailed);
    EXPECT_THAT(TakeErrorQueue(), IsEmpty());
    TakeSystemLog();
}

class PublishedVectors : public Library, public testing::WithParamInterface<Json::Value> {
  public:
    static std::vector<Json::Value> All() {
        std::ifstream file(TAVOSSO_VECTORS);
        Json::Value vectors;
        file >> vectors;
        return {vectors.begin(), vectors.end()};
    }

  protected:
    static Failure Verify(const std::string &token) {
        const Json::Value &vector = GetParam();
        std::string n = vector["n"].asString();
        std::string e = vector["e"].asString();
        std::string k = vector["k"].asString();
        return FailureOf([&] {
            Jwt jwt(token);
            vector["alg"] == "RS256" ? jwt.JwtRSAVerify(n, e, EVP_sha256()) : jwt.JwtHMACVerify(k, EVP_sha256());
        });
    }
};

TEST_P(PublishedVectors, VerifyUnlessBodyChanges) {
    const std::string token = GetParam()["token"].asString();
    EXPECT_EQ(Verify(token), kVerified);
    EXPECT_EQ(Jwt(token).GetHeader()["alg"], GetParam()["alg"]);
    std::string changed = token;
    changed[token.find('.') + 5] ^= 1;
    EXPECT_FALSE(Verify(changed) == kVerified);
    TakeSystemLog();
}

INSTANTIATE_TEST_SUITE_P(, PublishedVectors, testing::ValuesIn(PublishedVectors::All()),
                         [](const auto &vector) { return vector.param["name"].asString(); });

}  // namespace

}  // namespace Test
