#ifndef TAVOSSO_FRONTEND_PENDING_LOGIN_H
#define TAVOSSO_FRONTEND_PENDING_LOGIN_H

#include <json/json.h>

#include <functional>
#include <string>

#include "frontend/answer.h"

/*
 * Ties a login to the browser that started it. Without that, anyone could send a victim's browser to the return page
 * with a code of their own, and the victim would work, unknowingly, in the attacker's account.
 *
 * A random value goes to the provider in the state and to the browser in a cookie; the server remembers it too, so that
 * it serves once and not for long. Each login has a cookie of its own, since two tabs may be signing in at once.
 */
namespace Frontend {

/// Starts a login, to come back to the answer's origin. `makeAddress` makes the provider's address from the state's
/// object, as `GetAccessTokenReqURI` of the clients does; gives that address. The state in it is remembered as it
/// stands.
std::string StartLogin(Answer &answer, const std::function<std::string(const Json::Value &)> &makeAddress);

/// Throws `Refusal` unless this browser started the login that `state` (as it came back) belongs to, not long ago, has
/// not come back from it before, and brings the state unchanged. Gives the state's object, and its origin to the
/// answer.
Json::Value ConcludeLogin(Answer &answer, const std::string &cookies, const std::string &state);

/// The JSON object that the state holds, null where it holds none.
Json::Value DecodeState(const std::string &state);

}  // namespace Frontend

#endif
