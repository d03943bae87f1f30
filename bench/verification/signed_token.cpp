#include "bench/verification/signed_token.h"

#include <iterator>

#include "tests/support/encoding.h"
#include "tests/support/token.h"

namespace Bench {

namespace {

constexpr char kSecret[] = "0123456789abcdef0123456789abcdef0123456789abcdef0123456789abcdef";
constexpr char kKeyID[] = "the provider's key of 2048 bits";

/// Real tokens grow with the number of the user's groups; this one does, too.
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

SignedToken MakeToken(Algorithm algorithm, std::size_t claimsSize, const std::string &issuer) {
    const bool isRSA = algorithm == Algorithm::kRS256;
    Json::Value header;
    header["typ"] = "JWT";
    header["alg"] = isRSA ? "RS256" : "HS256";
    header["kid"] = kKeyID;
    const std::string input = Test::SigningInput(header, Claims(claimsSize, issuer));

    SignedToken token{algorithm, input + ".", "", "", ""};
    if (isRSA) {
        token.compact += Test::ProviderKey().Sign(input, EVP_sha256());
        token.jwk = Test::Compact(PublicKey());
        token.key = Test::ProviderKey().PublicPEM();
    } else {
        token.compact += Test::SignHMAC(input, kSecret, EVP_sha256());
        token.key = kSecret;
        token.secret = Test::Base64(kSecret);
    }
    return token;
}

Json::Value PublicKey() { return Test::ProviderKey().JWK(kKeyID); }

}  // namespace Bench
