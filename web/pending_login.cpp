#include "web/pending_login.h"

#include <sso/limits.h>

#include "platform/platform.h"
#include "web/configured_profile.h"
#include "web/cookie.h"
#include "web/private_folder.h"
#include "web/refusal.h"
#include "web/request.h"
#include "web/text.h"

namespace TAVO::Web {

namespace {

constexpr char kFolder[] = "logins";
constexpr int kSeconds = 600;
constexpr char kFormat[] = "login 1";
constexpr char kCookieSlots[] = "0123456789abcdef";

std::string CookieName(char slot) { return std::string("__Host-login-") + slot; }

/// A cookie that the browser does not have, so that logins in other tabs go on. Chosen by the login's random name: tabs
/// that start at once seldom choose the same. With all names in use, one of them is replaced.
std::string FreeCookieName(const std::string &cookies, const std::string &login) {
    const std::string slots = kCookieSlots;
    const std::size_t first = slots.find(login.front());
    for (std::size_t i = 0; i < slots.size(); ++i) {
        std::string name = CookieName(slots[(first + i) % slots.size()]);
        if (!HasCookie(cookies, name)) {
            return name;
        }
    }
    return CookieName(login.front());
}

/// The cookie that has the login's value; empty if this browser did not start it.
std::string CookieOf(const std::string &cookies, const std::string &login) {
    for (const char slot : std::string(kCookieSlots)) {
        if (FindCookie(cookies, CookieName(slot)) == login) {
            return CookieName(slot);
        }
    }
    return "";
}

std::string StateIn(const std::string &address) {
    const Parameters parameters = ParseQuery(address.substr(address.find('?') + 1));
    return OnlyValue(parameters, "state").value_or("");
}

}  // namespace

std::string StartLogin(Response &response, const std::string &cookies, const std::string &profile,
                       std::size_t mostPending, const std::function<std::string(const Json::Value &)> &makeAddress) {
    const std::string login = PrivateFolder::NewName();
    Json::Value state;
    state["origin"] = SafeOrigin(response.origin);
    state["csrf"] = login;
    std::string address = makeAddress(state);
    Json::Value started;
    started["format"] = kFormat;
    started["state"] = StateIn(address);
    started["profile"] = profile;
    if (!PrivateFolder(kFolder, kSeconds, mostPending).Keep(login, WriteCompact(started))) {
        throw Refusal("Too many sign-ins are under way on this device.");
    }
    response.SetCookie(FreeCookieName(cookies, login), login, "; Max-Age=" + std::to_string(kSeconds));
    return address;
}

ConcludedLogin ConcludeLogin(Response &response, const std::string &cookies, const std::string &state) {
    const Json::Value returned = DecodeState(state);
    const std::string login = StringMember(returned, "csrf");
    const std::string cookie = CookieOf(cookies, login);
    if (login.empty() || cookie.empty()) {
        throw Refusal("This sign-in was not started in this browser.");
    }
    response.ExpireCookie(cookie);
    const Json::Value started = ParseObject(PrivateFolder(kFolder, kSeconds).Take(login).value_or(""));
    if (StringMember(started, "format") != kFormat) {
        throw Refusal("This sign-in took too long, or was already completed.");
    }
    // The browser's owner can write another state around their own value: with the digest of another login's nonce, for
    // example.
    if (state != StringMember(started, "state")) {
        throw Refusal("This sign-in was changed on its way.");
    }
    response.origin = StringMember(returned, "origin");
    // The code must not go to another provider, with that provider's client secret.
    const std::string profile = StringMember(started, "profile");
    if (profile != ProfileInForce()) {
        throw Refusal("The settings of this device were changed during this sign-in.");
    }
    return {returned, profile};
}

Json::Value DecodeState(const std::string &state) {
    char buffer[TAVO::SSO::kPlatformBuffer];
    std::size_t length = sizeof buffer;
    if (TLIBCBase64Decode(state.data(), state.size(), buffer, &length) == 0) {
        return {};
    }
    return ParseObject(std::string(buffer, length));
}

}  // namespace TAVO::Web
