#include "bench/verification/signed_token.h"

#include <json/json.h>

#include <iterator>
#include <map>

#include "tests/support/encoding.h"
#include "tests/support/token.h"

namespace Bench {

namespace {

constexpr char kSecret[] = "0123456789abcdef0123456789abcdef0123456789abcdef0123456789abcdef";

/// Made once for each size: a key of 4096 bits takes seconds.
const Test::RSAKey &RSAKeyOf(unsigned int bits) {
    static std::map<unsigned int, Test::RSAKey> keys;
    return keys.try_emplace(bits, bits).first->second;
}

std::string KeyID(unsigned int bits) { return "the provider's key of " + std::to_string(bits) + " bits"; }

/// What a provider tells of a user. It grows as tokens do in practice: by the groups that the user is in.
Json::Value Claims(std::size_t size, const std::string &issuer) {
    Json::Value claims = Test::Parse(R"({
        "aud": "9f1c2c2e-1d0e-4a3f-8b0e-5d6f7a8b9c0d", "iat": 1700000000,
        "nbf": 1700000000, "exp": 4102444800, "name": "Alice Example", "unique_name": "alice@corp.example.net",
        "tid": "6a404290-634b-4458-b016-3eeac818f228"})");
    claims["iss"] = issuer;
    constexpr char kGroup[] = "5b1f3a60-7c9d-4e2b-a1f0-3c4d5e6f7a8b";
    for (std::size_t length = Test::Compact(claims).size(); length < size; length += std::size(kGroup) + 2) {
        claims["groups"].append(kGroup);
    }
    return claims;
}

}  // namespace

SignedToken MakeToken(const Algorithm &algorithm, std::size_t claimsSize, const std::string &issuer) {
    Json::Value header;
    header["typ"] = "JWT";
    header["alg"] = algorithm.name;
    header["kid"] = KeyID(algorithm.bits);
    const std::string input = Test::SigningInput(header, Claims(claimsSize, issuer));

    SignedToken token{algorithm, input + ".", "", "", ""};
    if (algorithm.kind == Kind::kRSA) {
        token.compact += RSAKeyOf(algorithm.bits).Sign(input, algorithm.digest());
        token.jwk = Test::Compact(PublicKey(algorithm.bits));
        token.key = RSAKeyOf(algorithm.bits).PublicPEM();
    } else {
        token.compact += Test::SignHMAC(input, kSecret, algorithm.digest());
        token.jwk = R"({"kty": "oct", "k": ")" + Test::Base64Url(kSecret) + R"("})";
        token.secret = Test::Base64(kSecret);
        token.key = kSecret;
    }
    return token;
}

Json::Value PublicKey(unsigned int bits) { return RSAKeyOf(bits).JWK(KeyID(bits)); }

}  // namespace Bench
