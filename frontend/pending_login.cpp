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

}  // namespace

Json::Value StartLogin(Answer &answer, const std::string &origin) {
    Json::Value state;
    state["origin"] = SafeOrigin(origin);
    const std::string login = PrivateFolder(kFolder, kSeconds).Keep(state["origin"].asString());
    state["csrf"] = login;
    answer.SetCookie(CookieName(login), login, "; Max-Age=" + std::to_string(kSeconds));
    return state;
}

void ConcludeLogin(Answer &answer, const std::string &cookies, const std::string &state) {
    const Json::Value returned = DecodeState(state);
    const std::string login = StringMember(returned, "csrf");
    if (login.empty() || FindCookie(cookies, CookieName(login)) != login) {
        throw Refusal("This sign-in was not started in this browser.");
    }
    answer.ExpireCookie(CookieName(login));
    const std::optional<std::string> origin = PrivateFolder(kFolder, kSeconds).Take(login);
    if (!origin) {
        throw Refusal("This sign-in took too long, or was already completed.");
    }
    if (*origin != StringMember(returned, "origin")) {
        throw Refusal("This sign-in was changed on its way.");
    }
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
