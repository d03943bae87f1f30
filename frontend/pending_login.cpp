#include "frontend/pending_login.h"

#include <optional>

#include "frontend/cgi.h"
#include "frontend/failure.h"
#include "frontend/private_folder.h"
#include "frontend/text.h"
#include "platform/platform.h"

namespace Frontend {

namespace {

constexpr char kFolder[] = "logins";
constexpr int kSeconds = 600;
constexpr std::size_t kDecodedState = 1024;

std::string CookieName(const std::string &login) { return "__Host-login-" + login.substr(0, 8); }

std::string StateIn(const std::string &address) {
    const Parameters parameters = ParseQuery(address.substr(address.find('?') + 1));
    return OnlyValue(parameters, "state").value_or("");
}

}  // namespace

std::string StartLogin(Answer &answer, const std::function<std::string(const Json::Value &)> &makeAddress) {
    const std::string login = PrivateFolder::NewName();
    Json::Value state;
    state["origin"] = SafeOrigin(answer.origin);
    state["csrf"] = login;
    std::string address = makeAddress(state);
    PrivateFolder(kFolder, kSeconds).Keep(login, StateIn(address));
    answer.SetCookie(CookieName(login), login, "; Max-Age=" + std::to_string(kSeconds));
    return address;
}

Json::Value ConcludeLogin(Answer &answer, const std::string &cookies, const std::string &state) {
    Json::Value returned = DecodeState(state);
    const std::string login = StringMember(returned, "csrf");
    if (login.empty() || FindCookie(cookies, CookieName(login)) != login) {
        throw Refusal("This sign-in was not started in this browser.");
    }
    answer.ExpireCookie(CookieName(login));
    const std::optional<std::string> started = PrivateFolder(kFolder, kSeconds).Take(login);
    if (!started) {
        throw Refusal("This sign-in took too long, or was already completed.");
    }
    // The browser's owner can write a state around a value that is theirs: with the digest of another login's nonce,
    // say.
    if (state != *started) {
        throw Refusal("This sign-in was changed on its way.");
    }
    answer.origin = StringMember(returned, "origin");
    return returned;
}

Json::Value DecodeState(const std::string &state) {
    char buffer[kDecodedState];
    std::size_t length = sizeof buffer;
    if (TLIBCBase64Decode(state.data(), state.size(), buffer, &length) == 0) {
        return {};
    }
    return ParseObject(std::string(buffer, length));
}

}  // namespace Frontend
