// The exception classes of SSO and JWT, thrown by the built library.
#include <stdexcept>
#include <type_traits>

#include "jwt/jwt.h"
#include "sso/sso.h"
#include "tests/unit/fixture.h"

namespace Test {

namespace {

using namespace TAVO;

class Errors : public Library {};

template <typename Base>
bool OIDCLoginIsCaughtAs(const char *profile) {
    WriteFile(kProfileFile, profile);
    std::string userName;
    try {
        SSO::OIDCLogin("a code", userName);
    } catch (const Base &) {
        return true;
    } catch (const std::exception &) {
    }
    return false;
}

constexpr char kUnknownProfile[] = R"({"sso_enable": true, "sso_profile": "Azure"})";
constexpr char kSwitchedOff[] = R"({"sso_enable": false, "sso_profile": "azure"})";

TEST_F(Errors, DeriveFromSSOException) {
    EXPECT_TRUE(OIDCLoginIsCaughtAs<SSO::sso_exception>(kUnknownProfile));
    EXPECT_TRUE(OIDCLoginIsCaughtAs<SSO::sso_exception>(kSwitchedOff));
    EXPECT_TRUE((std::is_base_of_v<SSO::sso_exception, SSO::sso_err_resp>));
    EXPECT_TRUE((std::is_base_of_v<SSO::sso_exception, SSO::sso_not_implemented>));
    EXPECT_TRUE((std::is_base_of_v<SSO::sso_exception, SSO::sso_op_failed>));
}

TEST_F(Errors, ExcludeUnsupportedProfileFromSSOOpFailed) {
    EXPECT_FALSE(OIDCLoginIsCaughtAs<SSO::sso_op_failed>(kUnknownProfile));
    EXPECT_TRUE(OIDCLoginIsCaughtAs<SSO::sso_op_failed>(kSwitchedOff));
}

TEST_F(Errors, DeriveFromRuntimeError) {
    EXPECT_TRUE(OIDCLoginIsCaughtAs<std::runtime_error>(kSwitchedOff));
    JWT::Jwt jwt("header.body.signature");
    std::string empty;
    EXPECT_THROW(jwt.JwtHMACVerify(empty, nullptr), std::runtime_error);
    EXPECT_TRUE((std::is_base_of_v<JWT::jwt_exception, JWT::jwt_not_support>));
    EXPECT_TRUE((std::is_base_of_v<JWT::jwt_exception, JWT::jwt_verify_failed>));
}

TEST_F(Errors, KeepTokenAndSSOClassesUnrelated) {
    EXPECT_FALSE((std::is_base_of_v<SSO::sso_exception, JWT::jwt_exception>));
    EXPECT_FALSE((std::is_base_of_v<JWT::jwt_exception, SSO::sso_exception>));
}

TEST_F(Errors, ReturnMessageVerbatim) {
    EXPECT_STREQ(SSO::sso_exception("profile not support.").what(), "profile not support.");
    EXPECT_STREQ(SSO::sso_err_resp("no full stop").what(), "no full stop");
    EXPECT_STREQ(SSO::sso_not_implemented("GetUserName not implemented").what(), "GetUserName not implemented");
    EXPECT_STREQ(SSO::sso_op_failed("not specify sso profile").what(), "not specify sso profile");
    EXPECT_STREQ(JWT::jwt_exception("root").what(), "root");
    EXPECT_STREQ(JWT::jwt_not_support(" algorithm is not supported").what(), " algorithm is not supported");
    EXPECT_STREQ(JWT::jwt_verify_failed("verify rsa signature failed").what(), "verify rsa signature failed");
}

TEST_F(Errors, AddNoFieldsToRuntimeError) {
    EXPECT_EQ(sizeof(SSO::sso_exception), sizeof(std::runtime_error));
    EXPECT_EQ(sizeof(SSO::sso_err_resp), sizeof(std::runtime_error));
    EXPECT_EQ(sizeof(SSO::sso_not_implemented), sizeof(std::runtime_error));
    EXPECT_EQ(sizeof(SSO::sso_op_failed), sizeof(std::runtime_error));
    EXPECT_EQ(sizeof(JWT::jwt_not_support), sizeof(std::runtime_error));
    EXPECT_EQ(sizeof(JWT::jwt_verify_failed), sizeof(std::runtime_error));
}

}  // namespace

}  // namespace Test
