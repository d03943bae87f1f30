#include <json/json.h>
#include <openssl/evp.h>

#include "bench/verification/verifiers.h"
#include "jwt/jwt.h"

#pragma GCC diagnostic ignored "-Wdeprecated-declarations"  // the library parses with Json::Reader

namespace Bench {

bool VerifyByLibrary(const SignedToken &token) {
    TAVO::JWT::Jwt jwt(token.compact);
    const Json::Value header = jwt.GetHeader();
    const Json::Value claims = jwt.GetBody();
    try {
        if (token.algorithm == Algorithm::kHS256) {
            jwt.JwtHMACVerify(token.secret, EVP_sha256());
            return true;
        }
        Json::Value jwk;
        Json::Reader().parse(token.jwk.data(), token.jwk.data() + token.jwk.size(), jwk, true);
        std::string n = jwk["n"].asString();
        std::string e = jwk["e"].asString();
        jwt.JwtRSAVerify(n, e, EVP_sha256());
        return true;
    } catch (const TAVO::JWT::jwt_verify_failed &) {
        return false;
    }
}

}  // namespace Bench
