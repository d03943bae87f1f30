// The relay URL. The input is the state after a success and the reason after a failure. It is accepted if the state
// contains an origin.
#include "sso/sso.h"
#include "tests/fuzz/oracle.h"
#include "tests/fuzz/target.h"

namespace Fuzz {

namespace {

constexpr char kPage[] = "ssoclient/relay.html#";
constexpr std::size_t kLongestState = 1024;

std::optional<std::string> Origin(const std::string &state) {
    const std::optional<std::string> decoded = DecodeCanonicalBase64(state);
    if (!decoded || decoded->size() > kLongestState) {
        return std::nullopt;
    }
    return StringMember(ParseJson(UpToNUL(*decoded)).value_or(Json::Value()), "origin");
}

std::string RelayURL(bool success, const std::string &state, const std::string &reason) {
    std::string url;
    const Test::Failure failure = FailureOf([&] { url = TAVO::SSO::GetSSORelayURL(success, state, reason); });
    RequireSame(failure, Test::kNothingThrown);
    RequireLog({});
    return url;
}

}  // namespace

bool Accepts(const std::string &input) {
    const std::optional<std::string> origin = Origin(input);
    Require(RelayURL(true, input, "no reason") ==
                kPage + (origin ? "origin=" + PercentEncode(*origin) + "&" : "") + "success=true",
            "unexpected relay URL of a success");
    Require(RelayURL(false, "e30=", input) == kPage + (input.empty() ? "" : "reason=" + input + "&") + "success=false",
            "unexpected relay URL of a failure");
    return origin.has_value();
}

}  // namespace Fuzz
