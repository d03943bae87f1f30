// An RSA signature: the lines of an input are the algorithm, n, e and the token. It is good when it verifies.
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

/// By other calls of OpenSSL's than the library's.
bool Verifies(const Input &input, bool &certain) {
    const std::vector<std::string> parts = Split(input.token, '.');
    const Decoded n = DecodeBase64(input.n);
    const Decoded e = DecodeBase64(input.e);
    const Decoded signature = DecodeBase64(parts[2]);
    certain = n.wellFormed && e.wellFormed && signature.wellFormed;
    return !n.bytes.empty() && !e.bytes.empty() && !signature.bytes.empty() &&
           RSAVerifies(n.bytes, e.bytes, signature.bytes, UpToNUL(parts[0] + "." + parts[1]), input.digest);
}

void RequireToldLog(bool accepted, bool anyEmpty, bool certain) {
    const std::vector<Test::LogLine> log = Test::TakeSystemLog();
    if (accepted || anyEmpty) {
        Require(log.empty(), "nothing is logged of a good signature, nor where a part is missing");
        return;
    }
    const std::vector<Test::LogLine> told = {
        Test::Error("jwt:N EVP_DigestVerifyInit failed"),
        Test::Error("jwt:N EVP_DigestVerifyFinal failed"),
    };
    const bool isTold = log.size() == 1 && std::find(told.begin(), told.end(), log[0]) != told.end();
    Require(isTold || (log.empty() && !certain), "a wrong signature is one told line");
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
    Require(verifies || !accepted, "no signature is taken that does not verify");
    Require(accepted || !verifies || !certain, "a signature that verifies is taken");
    RequireOneOf(failure,
                 {Test::kNothingThrown, Test::Fails<TAVO::JWT::jwt_verify_failed>("verify rsa signature failed")});
    const bool anyEmpty =
        UpToNUL(input.n).empty() || UpToNUL(input.e).empty() || UpToNUL(Split(input.token, '.')[2]).empty();
    RequireToldLog(accepted, anyEmpty, certain);
    Require(input.n == before.n && input.e == before.e, "the key is unchanged");
    return accepted;
}

}  // namespace Fuzz
