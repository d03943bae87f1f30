#include "web/pending_login.h"

#include <openssl/evp.h>

#include <algorithm>

#include "web/configured_profile.h"
#include "web/cookie.h"
#include "web/private_folder.h"
#include "web/refusal.h"
#include "web/request.h"
#include "web/text.h"

namespace TAVO::Web {

namespace {

constexpr char kFormat[] = "login 2";
constexpr std::size_t kLongestEncodedState = 2048;
constexpr char kCookieSlots[] = "0123456789abcdef";

std::string CookieName(char slot) { return std::string("__Host-login-") + slot; }

/// Returns a cookie name that the browser does not use yet, so that logins in other tabs continue. The search starts at
/// a random name, so that simultaneous logins rarely choose the same one. If all names are in use, returns one of them.
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

/// Returns the name of the login that a cookie's value identifies: the first half of its SHA-256, in hexadecimal.
std::string LoginOf(const std::string &secret) {
    unsigned char digest[EVP_MAX_MD_SIZE];
    if (EVP_Digest(secret.data(), secret.size(), digest, nullptr, EVP_sha256(), nullptr) != 1) {
        throw Refusal("The digest of a cookie cannot be computed.");
    }
    return PrivateFolder::NameOf(digest);
}

/// Returns the name of the login's cookie; empty if this browser did not start it.
std::string CookieOf(const std::string &cookies, const std::string &login) {
    for (const char slot : std::string(kCookieSlots)) {
        const std::optional<std::string> secret = FindCookie(cookies, CookieName(slot));
        if (secret && LoginOf(*secret) == login) {
            return CookieName(slot);
        }
    }
    return "";
}

/// Converts any exception of the store to `StoreFailure`.
template <typename Call>
auto CallStore(Call call) {
    try {
        return call();
    } catch (const std::exception &error) {
        throw StoreFailure(error.what());
    } catch (...) {
        throw StoreFailure("unexpected failure");
    }
}

std::string StateIn(const std::string &address) {
    const Parameters parameters = ParseQuery(address.substr(address.find('?') + 1));
    return OnlyValue(parameters, "state").value_or("");
}

std::string EncodeBase64(const std::string &bytes) {
    std::string text((bytes.size() + 2) / 3 * 4 + 1, '\0');
    text.resize(static_cast<std::size_t>(EVP_EncodeBlock(reinterpret_cast<unsigned char *>(text.data()),
                                                         reinterpret_cast<const unsigned char *>(bytes.data()),
                                                         static_cast<int>(bytes.size()))));
    return text;
}

}  // namespace

std::string BeginLogin(Response &response, const Request &request, LoginStore &store, const Json::Value &settings,
                       const std::string &origin, const std::function<std::string(const Json::Value &)> &makeAddress) {
    const std::string secret = PrivateFolder::NewName();
    const std::string login = LoginOf(secret);
    Json::Value state;
    state["origin"] = origin;
    state["csrf"] = login;
    std::string address = makeAddress(state);
    Json::Value started;
    started["format"] = kFormat;
    started["state"] = StateIn(address);
    started["settings"] = settings;
    if (!CallStore([&] { return store.Keep(login, WriteCompact(started)); })) {
        throw Refusal("Too many sign-ins are under way on this device.");
    }
    response.SetCookie(FreeCookieName(request.cookies, login), secret, "; Max-Age=" + std::to_string(kLoginSeconds));
    return address;
}

PendingLogin EndLogin(Response &response, std::string &origin, const Request &request, LoginStore &store,
                      const std::string &state) {
    const Json::Value returned = DecodeState(state);
    const std::string login = StringMember(returned, "csrf");
    const std::string cookie = CookieOf(request.cookies, login);
    if (cookie.empty()) {
        throw Refusal("This sign-in was not started in this browser.");
    }
    response.ExpireCookie(cookie);
    const Json::Value started = ParseObject(CallStore([&] { return store.Take(login).value_or(""); }));
    if (StringMember(started, "format") != kFormat) {
        throw Refusal("This sign-in took too long, or was already completed.");
    }
    // A user can return another state with a valid cookie, for example one with the digest of a stolen token's nonce.
    if (state != StringMember(started, "state")) {
        throw Refusal("This sign-in was changed on its way.");
    }
    origin = StringMember(returned, "origin");
    // Changed settings could send the code to another provider, with the client secret of that provider.
    const Json::Value settings = RequireSettings();
    if (settings != started["settings"]) {
        throw Refusal("The settings of this device were changed during this sign-in.");
    }
    return {returned, settings["profile"].asString()};
}

Json::Value DecodeState(const std::string &state) {
    std::string decoded(state.size(), '\0');
    const int length =
        state.size() > kLongestEncodedState
            ? -1
            : EVP_DecodeBlock(reinterpret_cast<unsigned char *>(decoded.data()),
                              reinterpret_cast<const unsigned char *>(state.data()), static_cast<int>(state.size()));
    if (length < 0) {
        return {};
    }
    const std::size_t padding = state.size() - (state.find_last_not_of('=') + 1);
    decoded.resize(static_cast<std::size_t>(length) - std::min<std::size_t>(padding, 2));
    // OpenSSL also decodes texts that it would not encode.
    return EncodeBase64(decoded) == state ? ParseObject(decoded) : Json::Value();
}

}  // namespace TAVO::Web
