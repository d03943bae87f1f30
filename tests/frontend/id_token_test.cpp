#include "frontend/id_token.h"

#include <gmock/gmock.h>
#include <sso/sso.h>

#include "frontend/failure.h"
#include "tests/support/encoding.h"
#include "tests/support/token.h"

using namespace Frontend;

namespace {

Json::Value StateOf(const std::string &nonce) {
    Json::Value state;
    state["nonce"] = TAVO::SSO::MD5Digest(nonce);
    return state;
}

std::string TokenWith(const std::string &body) { return "e30." + Test::Base64Url(body) + ".c2ln"; }

TEST(Nonce, IsAcceptedInATokenOfThisLogin) {
    EXPECT_NO_THROW(RequireNonce(TokenWith("{\"nonce\":\"mine\"}"), StateOf("mine")));
}

TEST(Nonce, IsRefusedInATokenOfAnotherLogin) {
    EXPECT_THROW(RequireNonce(TokenWith("{\"nonce\":\"yours\"}"), StateOf("mine")), Refusal);
    // The digest itself is in the state, for everyone on the way to read.
    const std::string digest = StateOf("mine")["nonce"].asString();
    EXPECT_THROW(RequireNonce(TokenWith("{\"nonce\":\"" + digest + "\"}"), StateOf("mine")), Refusal);
}

TEST(Nonce, IsRefusedWhereItIsMissing) {
    for (const char *body : {"{}", "{\"nonce\":\"\"}", "{\"nonce\":1}", "{\"nonce\":null}", "[]", "1"}) {
        EXPECT_THROW(RequireNonce(TokenWith(body), StateOf("")), Refusal) << body;
    }
    EXPECT_THROW(RequireNonce(TokenWith("{\"nonce\":\"mine\"}"), Json::Value()), Refusal);
}

}  // namespace
