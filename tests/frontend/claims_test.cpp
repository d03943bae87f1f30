#include "web/claims.h"

#include <gmock/gmock.h>
#include <sso/sso.h>

#include "tests/support/failure.h"
#include "tests/support/token.h"
#include "web/refusal.h"

using namespace TAVO::Web;

namespace {

using Test::Parse;

class NameClaim : public testing::Test {
  protected:
    static std::string Failure(const std::string &claims, const std::string &profile = "azure",
                               bool acceptsUnverifiedEmail = false) {
        return ::Test::FailureOf([&] { RequireTrustworthyName(Parse(claims), profile, acceptsUnverifiedEmail); }).text;
    }
};

constexpr char kUnusable[] = "The provider's name for this user cannot be used.";
constexpr char kUnverified[] = "The provider has not verified this user's e-mail address.";

TEST_F(NameClaim, AcceptsPrintableName) {
    EXPECT_EQ(Failure(R"({"unique_name": "alice@corp.example"})"), "");
    EXPECT_EQ(Failure(R"({"unique_name": "zoë@corp.example"})"), "");
    EXPECT_EQ(Failure(R"({"sub": "alice"})", "websphere"), "");
}

TEST_F(NameClaim, RejectsUnprintableCharacters) {
    for (const char *character : {"\\u0000", "\\n", "\\u007f", "\\u0085", "\\u202e", "\\u200b", "\\u2028"}) {
        EXPECT_EQ(Failure("{\"unique_name\": \"alice" + std::string(character) + "mallory@corp.example\"}"), kUnusable);
        EXPECT_EQ(Failure("{\"sub\": \"alice" + std::string(character) + "\"}", "websphere"), kUnusable);
    }
}

TEST_F(NameClaim, RejectsMissingOrEmptyName) {
    for (const char *claims : {"{}", R"({"unique_name": ""})", R"({"unique_name": 1})", R"({"sub": "alice"})"}) {
        EXPECT_EQ(Failure(claims), kUnusable) << claims;
    }
    EXPECT_EQ(Failure(R"({"unique_name": "alice@corp.example"})", "websphere"), kUnusable);
}

TEST_F(NameClaim, AcceptsOnlyVerifiedEmail) {
    EXPECT_EQ(Failure(R"({"email": "alice@corp.example", "email_verified": true})"), "");
    for (const char *verified : {"false", "null", "1", "\"true\""}) {
        EXPECT_EQ(Failure(R"({"email": "alice@corp.example", "email_verified": )" + std::string(verified) + "}"),
                  kUnverified);
    }
    EXPECT_EQ(Failure(R"({"email": "alice@corp.example"})"), kUnverified);
    EXPECT_EQ(Failure(R"({"unique_name": 1, "email": "alice@corp.example"})"), kUnverified);
}

TEST_F(NameClaim, AcceptsUnverifiedEmailIfConfigured) {
    EXPECT_EQ(Failure(R"({"email": "alice@corp.example"})", "azure", true), "");
    EXPECT_EQ(Failure(R"({"email": "alice\u0000@corp.example"})", "azure", true), kUnusable);
}

TEST(DisplayName, UsesNameClaimIfPrintable) {
    EXPECT_EQ(DisplayName(Parse(R"({"name": "Alice Example"})")), "Alice Example");
    for (const char *claims : {"{}", R"({"name": 1})", R"({"name": "a\u202eb"})"}) {
        EXPECT_EQ(DisplayName(Parse(claims)), "") << claims;
    }
}

}  // namespace
