#include "tests/fuzz/token_oracle.h"

#include <algorithm>
#include <sstream>
#include <stdexcept>

#include "jwt/jwt.h"
#include "tests/fuzz/oracle.h"
#include "tests/fuzz/target.h"

namespace Fuzz {

namespace {

constexpr char kHeaderNotJson[] = "bad jwt header format!";
constexpr char kClaimsNotJson[] = "bad jwt body format!";

/// The value of the part. Throws the expected exception.
Json::Value Read(const std::string &part, const char *notJson) {
    const ExpectedPart read = ReadPart(part, notJson);
    if (read.failure == Test::Fails<std::logic_error>("empty jwt part")) {
        throw std::logic_error("empty jwt part");
    }
    if (!(read.failure == Test::kNothingThrown)) {
        throw std::invalid_argument(notJson);
    }
    return read.value;
}

/// Whether a client may reject a token with this failure. Some texts contain the algorithm; an empty part has no fixed
/// text.
bool IsReason(const Test::Failure &failure, const std::vector<Test::Failure> &reasons) {
    for (const char *text : {"token cannot be empty", "bad jwt format!", kHeaderNotJson, kClaimsNotJson,
                             "id_token expired.", "client ID invalid"}) {
        if (failure == Test::Fails<std::invalid_argument>(text)) {
            return true;
        }
    }
    return failure.type == typeid(TAVO::JWT::jwt_not_support).name() ||
           failure.type == typeid(std::logic_error).name() ||
           std::find(reasons.begin(), reasons.end(), failure) != reasons.end();
}

}  // namespace

ExpectedPart ReadPart(const std::string &part, const char *notJson) {
    ExpectedPart read;
    if (UpToNUL(part).empty()) {
        read.failure = Test::Fails<std::logic_error>("empty jwt part");
        return read;
    }
    const Decoded decoded = DecodeBase64(part);
    read.certain = decoded.wellFormed;
    if (const std::optional<Json::Value> value = ParseJson(UpToNUL(decoded.bytes))) {
        read.value = *value;
    } else {
        read.failure = Test::Fails<std::invalid_argument>(notJson);
    }
    return read;
}

bool IsCertain(const std::string &token) {
    const std::vector<std::string> parts = Split(token, '.');
    return parts.size() != 3 || (ReadPart(parts[0], "").certain && ReadPart(parts[1], "").certain);
}

ExpectedToken::ExpectedToken(const std::string &token) {
    if (token.empty()) {
        throw std::invalid_argument("token cannot be empty");
    }
    const std::vector<std::string> parts = Split(token, '.');
    if (parts.size() != 3) {
        throw std::invalid_argument("bad jwt format!");
    }
    header = Read(parts[0], kHeaderNotJson);
    claims = Read(parts[1], kClaimsNotJson);
    signature = parts[2];
    signingInput = UpToNUL(parts[0] + "." + parts[1]);
}

void ExpectedToken::CheckExpiry() const {
    std::istringstream text(TextMember(claims, "exp").value_or(""));
    long expiry = 0;
    text >> expiry;
    if (kNow > expiry) {
        throw std::invalid_argument("id_token expired.");
    }
}

void ExpectedToken::CheckMember(const std::string &name, const std::string &expected, const char *failure) const {
    if (TextMember(claims, name) != expected) {
        throw std::invalid_argument(failure);
    }
}

const EVP_MD *ExpectedToken::ChooseDigest(const std::string &family) const {
    const std::string algorithm = TextMember(header, "alg").value_or("");
    const EVP_MD *digest = DigestOf(algorithm, family);
    if (digest == nullptr) {
        throw TAVO::JWT::jwt_not_support(algorithm + " algorithm is not supported");
    }
    return digest;
}

void RequireVerdict(const Test::Failure &failure, const Test::Failure &expected, bool certain,
                    const std::vector<Test::Failure> &reasons) {
    if (certain) {
        RequireSame(failure, expected);
    } else if (failure == Test::kNothingThrown) {
        Require(expected == Test::kNothingThrown, "an invalid token was trusted");
    } else {
        Require(IsReason(failure, reasons), "unexpected failure");
    }
}

}  // namespace Fuzz
