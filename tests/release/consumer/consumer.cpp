// Uses the installed headers and library like an external program, and catches exceptions by type.
#include <tavosso/jwt.h>
#include <tavosso/sso.h>

#include <cstdio>
#include <string>

namespace {

bool ProfileIsMissing() {
    std::string userName;
    try {
        TAVO::SSO::OIDCLogin("a code", userName);
    } catch (const TAVO::SSO::sso_op_failed &error) {
        return std::string(error.what()) == "read profile file failed.";
    }
    return false;
}

bool SignatureIsRefused() {
    std::string key = "a2V5";
    try {
        TAVO::JWT::Jwt("e30.e30.c2ln").JwtHMACVerify(key, nullptr);
    } catch (const TAVO::JWT::jwt_exception &error) {
        return std::string(error.what()) == "verify hmac signature failed";
    }
    return false;
}

/// A client whose overrides the library calls.
struct OwnClient : TAVO::SSO::SSOClient {
    std::string GetIDTokenReqParams() override { return "own"; }
    void RequestTokenEndpoint(std::string &response, const std::string &body) override { response = body; }
    void ProcessTokenResponse(std::string response) override { token = response; }
    void VerifyIDToken() override {}
    void GetUserName(std::string &userName) override { userName = token; }
};

bool OwnStepsAreCalled() {
    OwnClient client;
    std::string userName;
    client.OpenIDConnectLogin("a code", userName);
    return userName == "own";
}

}  // namespace

int main() {
    TAVO::SSO::SSOProfile profile;
    const bool good = ProfileIsMissing() && SignatureIsRefused() && OwnStepsAreCalled() && !profile.SSOIsEnable();
    std::puts(good ? "consumer: good" : "consumer: BAD");
    return good ? 0 : 1;
}
