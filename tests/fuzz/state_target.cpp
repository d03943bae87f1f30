// The state that came back from the provider, as the relay page's address is made of it. It is good when it tells where
// the user came from. What comes instead of it after a failure, the reason, is put in as it stands.
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
            "after a success the address has the state's origin");
    Require(RelayURL(false, "e30=", input) == kPage + (input.empty() ? "" : "reason=" + input + "&") + "success=false",
            "after a failure the address has the reason");
    return origin.has_value();
}

}  // namespace Fuzz
