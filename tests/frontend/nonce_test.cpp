#include "web/nonce.h"

#include <gmock/gmock.h>
#include <sso/sso.h>

#include "tests/support/token.h"
#include "web/refusal.h"

using namespace TAVO::Web;

namespace {

Json::Value StateOf(const std::string &nonce) {
    Json::Value state;
    state["nonce"] = TAVO::SSO::MD5Digest(nonce);
    return state;
}

using Test::Parse;

TEST(Nonce, AcceptsTokenOfThisLogin) { EXPECT_NO_THROW(RequireNonce(Parse("{\"nonce\":\"mine\"}"), StateOf("mine"))); }

TEST(Nonce, RejectsTokenOfAnotherLogin) {
    EXPECT_THROW(RequireNonce(Parse("{\"nonce\":\"yours\"}"), StateOf("mine")), Refusal);
    // The digest is readable in the state.
    const std::string digest = StateOf("mine")["nonce"].asString();
    EXPECT_THROW(RequireNonce(Parse("{\"nonce\":\"" + digest + "\"}"), StateOf("mine")), Refusal);
}

TEST(Nonce, RejectsMissingNonce) {
    for (const char *body : {"{}", "{\"nonce\":\"\"}", "{\"nonce\":1}", "{\"nonce\":null}", "[]", "1"}) {
        EXPECT_THROW(RequireNonce(Parse(body), StateOf("")), Refusal) << body;
    }
    EXPECT_THROW(RequireNonce(Parse("{\"nonce\":\"mine\"}"), Json::Value()), Refusal);
}

}  // namespace
