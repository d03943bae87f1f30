#include "sso/id_token.h"

#include <cstdint>
#include <ctime>
#include <locale>
#include <sstream>
#include <stdexcept>

#include "utils/json.h"

namespace TAVO::SSO {

JWT::Jwt SplitIDToken(const std::string &token) {
    if (token.empty()) {
        throw std::invalid_argument("token cannot be empty");
    }
    return JWT::Jwt(token);
}

void CheckExpiry(const Json::Value &claims) {
    std::istringstream text(Utils::MemberText(claims, "exp").value_or(""));
    text.imbue(std::locale::classic());  // another locale may read a decimal point as a digit separator
    std::int64_t expiry = 0;             // on 32-bit, a long ends in 2038
    text >> expiry;
    const std::time_t now = std::time(nullptr);
    // time() returns -1 on failure, which would be before every expiry.
    if (now == -1 || now > expiry) {
        throw std::invalid_argument("id_token expired.");
    }
}

void CheckAudience(const Json::Value &claims, const std::string &clientID) {
    if (!Utils::MemberTextIs(claims, "aud", clientID)) {
        throw std::invalid_argument("client ID invalid");
    }
}

const EVP_MD *ChooseDigest(const Json::Value &header, const Algorithm (&supported)[3]) {
    const std::string name = Utils::MemberText(header, "alg").value_or("");
    for (const Algorithm &algorithm : supported) {
        if (name == algorithm.name) {
            return algorithm.digest();
        }
    }
    throw JWT::jwt_not_support(name + " algorithm is not supported");
}

Json::Value ReadClaims(const std::string &token) {
    if (token.empty()) {
        throw std::invalid_argument("please request a id_token first.");
    }
    return JWT::Jwt(token).GetBody();
}

}  // namespace TAVO::SSO
