#include "frontend/id_token.h"

#include <jwt/jwt.h>
#include <sso/sso.h>

#include "frontend/failure.h"
#include "frontend/text.h"

namespace Frontend {

void RequireNonce(const std::string &idToken, const Json::Value &state) {
    const std::string nonce = StringMember(TAVO::JWT::Jwt(idToken).GetBody(), "nonce");
    const std::string digest = StringMember(state, "nonce");
    if (nonce.empty() || digest.empty() || TAVO::SSO::MD5Digest(nonce) != digest) {
        throw Refusal("The provider's answer belongs to another sign-in.");
    }
}

}  // namespace Frontend
