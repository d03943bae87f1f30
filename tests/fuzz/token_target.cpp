// A compact token: its parts, header and claims. An input is accepted if both are JSON.
#include <algorithm>
#include <optional>
#include <stdexcept>

#include "jwt/jwt.h"
#include "tests/fuzz/oracle.h"
#include "tests/fuzz/target.h"
#include "tests/fuzz/token_oracle.h"

namespace Fuzz {

namespace {

/// Compares what the library reads from a part with the expected value.
bool Reads(const std::string &part, Json::Value (TAVO::JWT::Jwt::*read)(), TAVO::JWT::Jwt &token, const char *notJson) {
    Json::Value value;
    const Test::Failure failure = FailureOf([&] { value = (token.*read)(); });
    const ExpectedPart expected = ReadPart(part, notJson);
    if (expected.certain) {
        RequireSame(failure, expected.failure);
        Require(value == expected.value, "unexpected JSON");
    } else {
        RequireOneOf(failure, {Test::kNothingThrown, Test::Fails<std::invalid_argument>(notJson)});
    }
    return failure == Test::kNothingThrown;
}

}  // namespace

bool Accepts(const std::string &input) {
    std::optional<TAVO::JWT::Jwt> token;
    const Test::Failure failure = FailureOf([&] { token.emplace(input); });
    RequireSame(failure, std::count(input.begin(), input.end(), '.') == 2
                             ? Test::kNothingThrown
                             : Test::Fails<std::invalid_argument>("bad jwt format!"));
    if (!token) {
        return false;
    }
    const std::vector<std::string> parts = Split(input, '.');
    Require(token->GetSignature() == parts[2], "unexpected signature");
    const bool header = Reads(parts[0], &TAVO::JWT::Jwt::GetHeader, *token, "bad jwt header format!");
    const bool body = Reads(parts[1], &TAVO::JWT::Jwt::GetBody, *token, "bad jwt body format!");
    RequireLog({});
    return header && body;
}

}  // namespace Fuzz
