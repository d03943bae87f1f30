#ifndef TAVOSSO_WEB_PENDING_LOGIN_H
#define TAVOSSO_WEB_PENDING_LOGIN_H

#include <json/json.h>

#include <cstddef>
#include <functional>
#include <string>

#include "web/web.h"

/*
 * Binds a login to the browser that started it. Otherwise an attacker could send a victim's browser to the return page
 * with the attacker's code, and the victim would work in the attacker's account.
 *
 * A cookie contains a random value. Its digest is in the state and is the login's name in the store, for one use within
 * ten minutes. The cookie cannot be derived from a state in a log or in the browser's history. Each login has its own
 * cookie, so several tabs can sign in at once. There are 16 cookie names, so another site that starts logins cannot
 * fill the browser's request headers.
 */
namespace TAVO::Web {

/// Begins a login with these settings. Returns the provider's URL, which `makeAddress` makes from the state as
/// `GetAccessTokenReqURI` does. Throws `Refusal` if the store is full, and `StoreFailure`.
std::string BeginLogin(Response &response, const Request &request, LoginStore &store, const Json::Value &settings,
                       const std::string &origin, const std::function<std::string(const Json::Value &)> &makeAddress);

struct PendingLogin {
    Json::Value state;  // decoded
    std::string profile;
};

/// Throws `Refusal` unless this browser started the login within the last ten minutes, has not completed it before, and
/// returns the state unchanged, and the settings are the same. Sets the origin only after it has verified the state.
/// Throws `StoreFailure`, and as `RequireSettings`.
PendingLogin EndLogin(Response &response, std::string &origin, const Request &request, LoginStore &store,
                      const std::string &state);

/// Returns the JSON object in the state, or null.
Json::Value DecodeState(const std::string &state);

}  // namespace TAVO::Web

#endif
