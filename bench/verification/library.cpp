#include <json/json.h>

#include "bench/verification/subjects.h"
#include "jwt/jwt.h"

#pragma GCC diagnostic ignored "-Wdeprecated-declarations"  // the reader that the library parses with

namespace Bench {

bool VerifyByLibrary(const SignedToken &token) {
    TAVO::JWT::Jwt jwt(token.compact);
    const Json::Value header = jwt.GetHeader();
    const Json::Value claims = jwt.GetBody();
    try {
        if (token.algorithm.kind == Kind::kHMAC) {
            jwt.JwtHMACVerify(token.secret, token.algorithm.digest());
            return true;
        }
        Json::Value jwk;
        Json::Reader().parse(token.jwk.data(), token.jwk.data() + token.jwk.size(), jwk, true);
        std::string n = jwk["n"].asString();
        std::string e = jwk["e"].asString();
        jwt.JwtRSAVerify(n, e, token.algorithm.digest());
        return true;
    } catch (const TAVO::JWT::jwt_verify_failed &) {
        return false;
    }
}

}  // namespace Bench
