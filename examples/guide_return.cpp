// guide_return.cpp: the redirect URI. The browser is back from the provider, with a code or with an error.
#include <openssl/evp.h>
#include <tavosso/jwt.h>

#include <sstream>

#include "guide_request.h"

/// The state is base64 of a JSON object.
Json::Value Decode(const std::string &state) {
    std::string json(state.size(), ' ');
    EVP_DecodeBlock(reinterpret_cast<unsigned char *>(json.data()),
                    reinterpret_cast<const unsigned char *>(state.data()), static_cast<int>(state.size()));
    Json::Value object;
    std::istringstream(json) >> object;
    return object;
}

std::string Text(const Json::Value &object, const char *name) {
    return object.isObject() && object[name].isString() ? object[name].asString() : "";
}

void Require(bool condition, const char *otherwise) {
    if (!condition) {
        throw std::runtime_error(otherwise);
    }
}

int main() {
    try {
        std::cout << "Cache-Control: no-store\n"
                  << "Set-Cookie: __Host-login=; Path=/; Secure; HttpOnly; SameSite=Lax; Max-Age=0\n";
        const Json::Value state = Decode(Parameter("state"));
        const std::string started = Cookie("__Host-login");
        Require(!started.empty() && Text(state, "csrf") == started, "This sign-in was not started in this browser.");
        Require(Parameter("error").empty(), "The provider refused: unknown error");
        std::string user;
        WithClient([&](TAVO::SSO::SSOClient &client) {
            client.OpenIDConnectLogin(Parameter("code"), user);
            const std::string nonce = Text(TAVO::JWT::Jwt(client.GetToken()).GetBody(), "nonce");
            Require(!nonce.empty() && TAVO::SSO::MD5Digest(nonce) == Text(state, "nonce"),
                    "The provider's answer belongs to another sign-in.");
        });
        // Open your session for `user` here, under a new name, and send its cookie: frontend/session.cpp does.
        GoToRelayPage(TAVO::SSO::GetSSORelayURL(true, Parameter("state"), ""));
    } catch (const std::exception &failure) {
        Fail(failure.what());
    }
}
