#include "web/nonce.h"

#include <sso/sso.h>

#include "web/refusal.h"
#include "web/text.h"

namespace TAVO::Web {

void RequireNonce(const Json::Value &claims, const Json::Value &state) {
    const std::string nonce = StringMember(claims, "nonce");
    const std::string digest = StringMember(state, "nonce");
    if (nonce.empty() || digest.empty() || TAVO::SSO::MD5Digest(nonce) != digest) {
        throw Refusal("The provider's answer belongs to another sign-in.");
    }
}

}  // namespace TAVO::Web
