// guide_login.cpp: sends the browser to the provider.
#include <sys/random.h>

#include "guide_request.h"

std::string RandomText() {
    unsigned char bytes[16];
    if (getrandom(bytes, sizeof bytes, 0) != sizeof bytes) {
        throw std::runtime_error("no random bytes");
    }
    std::string text;
    for (const unsigned char byte : bytes) {
        text += "0123456789abcdef"[byte >> 4];
        text += "0123456789abcdef"[byte & 15];
    }
    return text;
}

int main() {
    try {
        Json::Value state;
        state["origin"] = "/index.cgi";
        state["csrf"] = RandomText();
        const std::string attributes = "; Path=/; Secure; HttpOnly; SameSite=Lax; Max-Age=600";
        std::cout << "Cache-Control: no-store\n"
                  << "Set-Cookie: __Host-login=" << state["csrf"].asString() << attributes << "\n";
        WithClient([&](auto &client) {
            if (client.GetAuthEndpoint().empty()) {
                throw std::runtime_error("Single sign-on is not completely set up on this device.");
            }
            client.RedirectAuthEndpoint(state);
        });
    } catch (const std::exception &failure) {
        Fail(failure.what());
    }
}
