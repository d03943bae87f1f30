// Logins through the library, as the front end has them. The appliance is configured already, but for the profile.
//
//   login_library PROFILE LOGINS
#include <cstdio>
#include <string>

#include "bench/login/exchange.h"
#include "bench/login/logins.h"
#include "sso/sso.h"
#include "tests/support/files.h"

namespace {

void LogIn() {
    std::string userName;
    TAVO::SSO::OIDCLogin(CODE, userName);
}

}  // namespace

int main(int argc, char **argv) {
    if (argc != 3) {
        std::fputs("login_library PROFILE LOGINS\n", stderr);
        return 1;
    }
    const std::string profile = argv[1];
    Test::WriteFile(Test::kProfileFile, R"({"sso_enable": true, "sso_profile": ")" + profile + "\"}");
    MeasureLogins(std::stoul(argv[2]), LogIn);
}
