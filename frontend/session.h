#ifndef TAVOSSO_FRONTEND_SESSION_H
#define TAVOSSO_FRONTEND_SESSION_H

#include <optional>
#include <string>

#include "frontend/answer.h"

namespace Frontend {

/// Who is signed in, and through which profile.
struct Session {
    std::string user;
    std::string profile;
};

std::optional<Session> FindSession(const std::string &cookies);

/// Ends the browser's session, and gives what it was.
std::optional<Session> EndSession(Answer &answer, const std::string &cookies);

/// Starts one under a new name: one that was planted in the browser beforehand is worth nothing.
void StartSession(Answer &answer, const std::string &cookies, const Session &session);

}  // namespace Frontend

#endif
