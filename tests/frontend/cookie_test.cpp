#include "web/cookie.h"

#include <gmock/gmock.h>

using namespace TAVO::Web;

namespace {

TEST(Cookie, IsFoundByFullNameIfUnique) {
    const std::string header = "other=1; __Host-session=abc=; x__Host-session=2; twice=1; twice=2";
    EXPECT_EQ(FindCookie(header, "__Host-session"), "abc=");
    EXPECT_EQ(FindCookie(header, "twice"), std::nullopt);
    EXPECT_EQ(FindCookie("", "__Host-session"), std::nullopt);
}

TEST(Cookie, IsSecureHttpOnlyAndSameSite) {
    EXPECT_EQ(MakeCookie("__Host-a", "b"), "__Host-a=b; Path=/; Secure; HttpOnly; SameSite=Lax");
    EXPECT_EQ(MakeCookie("__Host-a", "b", "; Max-Age=1"),
              "__Host-a=b; Path=/; Secure; HttpOnly; SameSite=Lax; Max-Age=1");
}

}  // namespace
