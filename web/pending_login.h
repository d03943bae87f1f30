#ifndef TAVOSSO_WEB_PENDING_LOGIN_H
#define TAVOSSO_WEB_PENDING_LOGIN_H

#include <json/json.h>

#include <cstddef>
#include <functional>
#include <string>

#include "web/web.h"

/*
 * Binds a login to the browser that started it. Otherwise anyone could send a victim's browser to the return page with
 * the attacker's code, and the victim would unknowingly work in the attacker's account.
 *
 * The browser has a random value in a cookie. Its digest is in the state and is the login's name in the store, for one
 * use within ten minutes: who reads the state in a log or a browser's history cannot derive the cookie from it. Each
 * login has its own cookie, since several tabs may sign in at once. There are 16 cookie names, so another site that
 * starts logins cannot fill the browser's request headers.
 */
namespace TAVO::Web {

/// Begins a login under the settings in force, to return to `origin`. `makeAddress` makes the provider's URL from the
/// state's object, as `GetAccessTokenReqURI` of the clients does. Returns that URL. Throws `Refusal` if the store is
/// full, and `StoreFailure`.
std::string BeginLogin(Response &response, const Request &request, LoginStore &store, const Json::Value &settings,
                       const std::string &origin, const std::function<std::string(const Json::Value &)> &makeAddress);

struct PendingLogin {
    Json::Value state;  // the state's object
    std::string profile;
};

/// Throws `Refusal` unless this browser started the login that `state` belongs to, within the last ten minutes, has not
/// completed it before, returns the state unchanged, and its settings are still in force. Sets the origin once the
/// state is known to be the one that was sent. Throws `StoreFailure`, and what `RequireSettings` throws.
PendingLogin EndLogin(Response &response, std::string &origin, const Request &request, LoginStore &store,
                      const std::string &state);

/// The JSON object in the state; null if there is none.
Json::Value DecodeState(const std::string &state);

}  // namespace TAVO::Web

#endif
