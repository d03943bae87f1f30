// An HMAC signature. Input lines: the algorithm, the key in base64 and the token. An input is accepted if the signature
// verifies.
#include <algorithm>

#include "jwt/jwt.h"
#include "tests/fuzz/oracle.h"
#include "tests/fuzz/target.h"

namespace Fuzz {

bool Accepts(const std::string &input) {
    const std::vector<std::string> lines = Lines(input, 3);
    const EVP_MD *digest = DigestOf(lines[0], "HS");
    if (digest == nullptr || std::count(lines[2].begin(), lines[2].end(), '.') != 2) {
        return false;
    }
    TAVO::JWT::Jwt token(lines[2]);
    std::string keyText = lines[1];
    const Test::Failure failure = FailureOf([&] { token.JwtHMACVerify(keyText, digest); });
    const bool accepted = failure == Test::kNothingThrown;

    const std::vector<std::string> parts = Split(lines[2], '.');
    const Decoded key = DecodeBase64(lines[1]);
    const bool verifies =
        !key.bytes.empty() && HMACSignature(key.bytes, UpToNUL(parts[0] + "." + parts[1]), digest) == UpToNUL(parts[2]);
    // Versions of OpenSSL decode long malformed keys differently.
    const bool isCertain = key.wellFormed || keyText.size() <= 1024;
    Require(verifies || !accepted || !isCertain, "an invalid signature was accepted");
    Require(accepted || !verifies || !key.wellFormed, "a valid signature was rejected");
    RequireOneOf(failure,
                 {Test::kNothingThrown, Test::Fails<TAVO::JWT::jwt_verify_failed>("verify hmac signature failed")});
    RequireLog({});
    Require(keyText == lines[1], "the key has changed");
    return accepted;
}

}  // namespace Fuzz
