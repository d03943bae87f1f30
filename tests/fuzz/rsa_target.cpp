// An RSA signature. Input lines: the algorithm, n, e and the token. An input is accepted if the signature verifies.
#include <algorithm>

#include "jwt/jwt.h"
#include "tests/fuzz/oracle.h"
#include "tests/fuzz/target.h"

namespace Fuzz {

namespace {

struct Input {
    const EVP_MD *digest;
    std::string n;
    std::string e;
    std::string token;
};

/// Uses OpenSSL calls that the library does not use.
bool Verifies(const Input &input, bool &certain) {
    const std::vector<std::string> parts = Split(input.token, '.');
    const Decoded n = DecodeBase64(input.n);
    const Decoded e = DecodeBase64(input.e);
    const Decoded signature = DecodeBase64(parts[2]);
    certain = n.wellFormed && e.wellFormed && signature.wellFormed;
    return !n.bytes.empty() && !e.bytes.empty() && !signature.bytes.empty() &&
           RSAVerifies(n.bytes, e.bytes, signature.bytes, UpToNUL(parts[0] + "." + parts[1]), input.digest);
}

void RequireExpectedLog(bool accepted, bool anyEmpty, bool certain) {
    const std::vector<Test::LogLine> log = Test::TakeSystemLog();
    if (accepted || anyEmpty) {
        Require(log.empty(), "a line was logged for a valid signature or a missing part");
        return;
    }
    const std::vector<Test::LogLine> expected = {
        Test::Error("jwt:N EVP_DigestVerifyInit failed"),
        Test::Error("jwt:N EVP_DigestVerifyFinal failed"),
    };
    const bool isExpected = log.size() == 1 && std::find(expected.begin(), expected.end(), log[0]) != expected.end();
    Require(isExpected || (log.empty() && !certain), "unexpected log lines for an invalid signature");
}

}  // namespace

bool Accepts(const std::string &text) {
    const std::vector<std::string> lines = Lines(text, 4);
    Input input{DigestOf(lines[0], "RS"), lines[1], lines[2], lines[3]};
    if (input.digest == nullptr || std::count(input.token.begin(), input.token.end(), '.') != 2) {
        return false;
    }
    const Input before = input;
    TAVO::JWT::Jwt token(input.token);
    const Test::Failure failure = FailureOf([&] { token.JwtRSAVerify(input.n, input.e, input.digest); });
    const bool accepted = failure == Test::kNothingThrown;

    bool certain = false;
    const bool verifies = Verifies(input, certain);
    Require(verifies || !accepted, "an invalid signature was accepted");
    Require(accepted || !verifies || !certain, "a valid signature was rejected");
    RequireOneOf(failure,
                 {Test::kNothingThrown, Test::Fails<TAVO::JWT::jwt_verify_failed>("verify rsa signature failed")});
    const bool anyEmpty =
        UpToNUL(input.n).empty() || UpToNUL(input.e).empty() || UpToNUL(Split(input.token, '.')[2]).empty();
    RequireExpectedLog(accepted, anyEmpty, certain);
    Require(input.n == before.n && input.e == before.e, "the key has changed");
    return accepted;
}

}  // namespace Fuzz
