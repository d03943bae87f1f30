#include <gmock/gmock.h>
#include <openssl/bn.h>
#include <openssl/evp.h>

#include <functional>
#include <memory>
#include <ostream>
#include <string>
#include <vector>

#include "jwt/jwt.h"
#include "tests/loopback/loopback_provider.h"
#include "tests/support/encoding.h"
#include "tests/support/system_log.h"
#include "tests/support/token.h"

// RSA keys that no provider should publish. A token is accepted with any published key, because a provider that
// publishes keys can also sign. These keys must not let anyone else sign, or harm the process.
namespace Test {

namespace {

using TAVO::JWT::jwt_verify_failed;
using ::testing::ElementsAreArray;
using ::testing::ValuesIn;

constexpr int kLargestModulus = 16384;  // in bits: the maximum of libcrypto

using Number = std::shared_ptr<BIGNUM>;

Number MakeNumber(unsigned long value = 0) {
    Number number(BN_new(), BN_free);
    BN_set_word(number.get(), value);
    return number;
}

Number FromBytes(const std::string &bytes) {
    const auto *data = reinterpret_cast<const unsigned char *>(bytes.data());
    return {BN_bin2bn(data, static_cast<int>(bytes.size()), nullptr), BN_free};
}

/// With leading zeros up to `length`.
std::string ToBytes(const Number &number, std::size_t length) {
    std::string bytes(length, '\0');
    BN_bn2binpad(number.get(), reinterpret_cast<unsigned char *>(bytes.data()), static_cast<int>(length));
    return bytes;
}

std::string Encode(const Number &number) {
    return Base64Url(ToBytes(number, static_cast<std::size_t>(BN_num_bytes(number.get()))));
}

/// The padded SHA-256 digest to which a valid signature decrypts (RFC 8017, section 9.2).
Number PaddedDigest(const std::string &signingInput, std::size_t length) {
    constexpr char kDigestInfo[] = "\x30\x31\x30\x0d\x06\x09\x60\x86\x48\x01\x65\x03\x04\x02\x01\x05\x00\x04\x20";
    std::string digest(32, '\0');
    EVP_Digest(signingInput.data(), signingInput.size(), reinterpret_cast<unsigned char *>(digest.data()), nullptr,
               EVP_sha256(), nullptr);
    const std::string tail = '\0' + std::string(kDigestInfo, sizeof kDigestInfo - 1) + digest;
    return FromBytes(std::string("\0\1", 2) + std::string(length - 2 - tail.size(), '\xff') + tail);
}

std::string SigningInputOfALogin() { return SigningInput(TokenHeader(Profile::kAzure), TokenClaims(Profile::kAzure)); }

/// A key and a signature of a login's token, encoded.
struct SignedKey {
    std::string n;
    std::string e;
    std::string signature;
};

/// A modulus for one chosen signature s: n = s^e - padded digest. `exponent` must divide `bits`.
SignedKey ModulusForSignature(int bits, unsigned long exponent) {
    const std::shared_ptr<BN_CTX> context(BN_CTX_new(), BN_CTX_free);
    const auto length = static_cast<std::size_t>(bits / 8);
    const Number padded = PaddedDigest(SigningInputOfALogin(), length);
    const Number signature = MakeNumber();
    BN_set_bit(signature.get(), bits / static_cast<int>(exponent));
    BN_sub_word(signature.get(), BN_is_odd(padded.get()) ? 2 : 1);  // makes the modulus odd
    const Number power = MakeNumber();
    BN_exp(power.get(), signature.get(), MakeNumber(exponent).get(), context.get());
    const Number modulus = MakeNumber();
    BN_sub(modulus.get(), power.get(), padded.get());
    return {Encode(modulus), Encode(MakeNumber(exponent)), Base64Url(ToBytes(signature, length))};
}

/// With exponent 1, the signature is the padded digest itself.
SignedKey UnderExponentOne(const std::string &modulus) {
    const Number padded = PaddedDigest(SigningInputOfALogin(), 256);
    return {modulus, Encode(MakeNumber(1)), Base64Url(ToBytes(padded, 256))};
}

/// The provider's signature and key.
SignedKey Own() {
    const Json::Value key = ProviderKey().JWK(kKeyID);
    return {key["n"].asString(), key["e"].asString(), ProviderKey().Sign(SigningInputOfALogin(), EVP_sha256())};
}

SignedKey OwnWithModulus(const std::string &n) { return {n, Own().e, Own().signature}; }

SignedKey OwnWithExponent(const std::string &e) { return {Own().n, e, Own().signature}; }

SignedKey OfBits(unsigned int bits) {
    const RSAKey key(bits);
    const Json::Value published = key.JWK(kKeyID);
    return {published["n"].asString(), published["e"].asString(), key.Sign(SigningInputOfALogin(), EVP_sha256())};
}

/// The last base64 letter of 256 bytes has two significant bits; an odd modulus becomes even.
std::string OwnModulusLessOne() {
    std::string n = Own().n;
    n.back() = n.back() == 'Q' ? 'A' : 'g';
    return n;
}

struct KeyCase {
    std::string name;
    std::function<SignedKey()> key;
    bool accepted;
};

void PrintTo(const KeyCase &row, std::ostream *stream) { *stream << row.name; }

class PublishedKey : public ::testing::TestWithParam<KeyCase> {};

TEST_P(PublishedKey, YieldsExpectedOutcome) {
    const SignedKey key = GetParam().key();
    Provider provider(Profile::kAzure);
    provider.Answer(TokenResponse(SigningInputOfALogin() + "." + key.signature));
    provider.Answer(R"({"jwks_uri": "$BASE/keys"})");
    provider.Answer(KeySet(R"({"n": ")" + key.n + R"(", "e": ")" + key.e + "\"}"));
    EXPECT_EQ(provider.LogIn(), GetParam().accepted ? LoggedIn(UserName(Profile::kAzure))
                                                    : Refused<jwt_verify_failed>("verify rsa signature failed"));
    std::vector<LogLine> log;
    if (!GetParam().accepted) {
        log.push_back(Error("jwt:N EVP_DigestVerifyFinal failed"));
    }
    EXPECT_THAT(TakeSystemLog(), ElementsAreArray(log));
}

std::vector<KeyCase> Exponents() {
    const auto own = [](const char *name, const std::string &e, bool accepted) {
        return KeyCase{name, [e] { return OwnWithExponent(e); }, accepted};
    };
    return {
        own("ItsOwn", "AQAB", true),
        own("ItsOwnWithLeadingZeros", "AAAAAQAB", true),
        own("Zero", "AA", false),
        own("One", "AQ", false),
        own("OneLess", Encode(MakeNumber(65536)), false),
        own("TwoMore", Encode(MakeNumber(65539)), false),
        own("Of8KB", Base64Url(std::string(8192, '\xff')), false),
        {"OneAcceptsForgery", [] { return UnderExponentOne(Own().n); }, true},
        {"EvenWithMatchingModulus", [] { return ModulusForSignature(2048, 2); }, true},
        {"ThreeWithMatchingModulus", [] { return ModulusForSignature(3072, 3); }, true},
        {"AsLargeAsTheModulus", [] { return OwnWithExponent(Own().n); }, false},
    };
}

std::vector<KeyCase> Moduli() {
    const auto own = [](const char *name, const std::string &n) {
        return KeyCase{name, [n] { return OwnWithModulus(n); }, false};
    };
    const auto small = [](const char *name, const char *n, const char *e, const std::string &signature) {
        return KeyCase{name, [=] { return SignedKey{n, e, Base64Url(signature)}; }, false};
    };
    return {
        own("Zero", "AA"),
        own("OfOneBit", "AQ"),
        own("OfTwoBits", "Aw"),
        {"Even", [] { return OwnWithModulus(OwnModulusLessOne()); }, false},
        {"EvenUnderExponentOne", [] { return UnderExponentOne(OwnModulusLessOne()); }, false},
        own("OfAnother", Base64Url(std::string(256, '\xff'))),
        own("Of1MB", Base64Url(std::string(std::size_t{1} << 20, '\xff'))),
        small("ZeroWithASignatureOfZero", "AA", "AQAB", std::string(1, '\0')),
        small("ZeroUnderExponentZero", "AA", "AA", std::string(1, '\0')),
        small("OfOneBitWithASignatureOfZero", "AQ", "AQAB", std::string(1, '\0')),
        small("OfOneBitUnderExponentZero", "AQ", "AA", std::string(1, '\0')),
        small("OfOneBitUnderExponentOne", "AQ", "AQ", std::string(1, '\0')),
        small("OfTwoBitsUnderExponentOne", "Aw", "AQ", "\1"),
        {"Of512BitsIsEnough", [] { return OfBits(512); }, true},
        {"Of1024BitsIsEnough", [] { return OfBits(1024); }, true},
        {"OfTheLargestSize", [] { return ModulusForSignature(kLargestModulus, 2); }, true},
        {"BeyondTheLargestSize", [] { return ModulusForSignature(kLargestModulus + 16, 2); }, false},
        {"OfTheLargestSizeWithLargeExponent",
         [] {
             const SignedKey key = ModulusForSignature(kLargestModulus, 2);
             return SignedKey{key.n, Base64Url(std::string(kLargestModulus / 8, '\x7f')), key.signature};
         },
         false},
    };
}

std::string NameOfKey(const ::testing::TestParamInfo<KeyCase> &info) { return info.param.name; }

INSTANTIATE_TEST_SUITE_P(Exponent, PublishedKey, ValuesIn(Exponents()), NameOfKey);
INSTANTIATE_TEST_SUITE_P(Modulus, PublishedKey, ValuesIn(Moduli()), NameOfKey);

}  // namespace

}  // namespace Test
