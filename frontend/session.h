#ifndef TAVOSSO_FRONTEND_SESSION_H
#define TAVOSSO_FRONTEND_SESSION_H

#include <optional>
#include <string>

#include "web/web.h"

namespace Frontend {

namespace Web = TAVO::Web;

/// Who is signed in, and through which profile.
struct Session {
    std::string user;         // the appliance's name; printable, never empty
    std::string displayName;  // the provider's name for the user; may be empty
    std::string profile;
};

/// The browser's session. One that was started under a profile that is no longer in force ends here.
std::optional<Session> FindSession(Web::Response &response, const std::string &cookies);

/// Ends the browser's session and returns it.
std::optional<Session> EndSession(Web::Response &response, const std::string &cookies);

/// Starts a session under a new name: one that was planted in the browser beforehand is worth nothing.
void StartSession(Web::Response &response, const std::string &cookies, const Session &session);

}  // namespace Frontend

#endif
