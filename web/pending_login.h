#ifndef TAVOSSO_WEB_PENDING_LOGIN_H
#define TAVOSSO_WEB_PENDING_LOGIN_H

#include <json/json.h>

#include <cstddef>
#include <functional>
#include <string>

#include "web/web.h"

/*
 * Ties a login to the browser that started it. Otherwise anyone could send a victim's browser to the return page with
 * the attacker's code, and the victim would unknowingly work in the attacker's account.
 *
 * A random value goes to the provider in the state and to the browser in a cookie. The server remembers it for one use
 * and for ten minutes. Each login has its own cookie, since several tabs may be signing in at once. There are 16 names
 * for these cookies, so that another site that starts logins cannot fill the browser's requests with them.
 */
namespace TAVO::Web {

/// Begins a login under a profile, to return to `origin`. `makeAddress` makes the provider's URL from the state's
/// object, as `GetAccessTokenReqURI` of the clients does. Returns that URL. Throws `Refusal` if the store is full.
std::string BeginLogin(Response &response, const Request &request, LoginStore &store, const std::string &profile,
                       const std::string &origin, const std::function<std::string(const Json::Value &)> &makeAddress);

struct PendingLogin {
    Json::Value state;  // the state's object
    std::string profile;
};

/// Throws `Refusal` unless this browser started the login that `state` belongs to, within the last ten minutes, has not
/// completed it before, returns the state unchanged, and the login's profile is still in force. Sets the origin as soon
/// as the state is known to be the one that was sent.
PendingLogin EndLogin(Response &response, std::string &origin, const Request &request, LoginStore &store,
                      const std::string &state);

/// The JSON object in the state; null if there is none.
Json::Value DecodeState(const std::string &state);

}  // namespace TAVO::Web

#endif
