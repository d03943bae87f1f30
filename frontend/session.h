#ifndef TAVOSSO_FRONTEND_SESSION_H
#define TAVOSSO_FRONTEND_SESSION_H

#include <optional>
#include <string>

#include "web/web.h"

namespace Frontend {

namespace Web = TAVO::Web;

/// A signed-in user.
struct Session {
    std::string user;         // the appliance's name; printable, never empty
    std::string displayName;  // the provider's name for the user; may be empty
    std::string profile;
};

/// Returns the browser's session. Ends it if its profile is no longer configured.
std::optional<Session> FindSession(Web::Response &response, const std::string &cookies);

/// Ends the browser's session and returns it.
std::optional<Session> EndSession(Web::Response &response, const std::string &cookies);

/// Starts a session under a new random name. Removes an earlier one, so that an attacker cannot plant a session.
void StartSession(Web::Response &response, const std::string &cookies, const Session &session);

}  // namespace Frontend

#endif
