#include "frontend/session.h"

#include "frontend/cgi.h"
#include "frontend/failure.h"
#include "frontend/private_folder.h"
#include "frontend/profile.h"
#include "frontend/text.h"

namespace Frontend {

namespace {

constexpr char kCookie[] = "__Host-session";
constexpr char kFolder[] = "sessions";
constexpr std::time_t kSeconds = std::time_t{8} * 60 * 60;
constexpr char kFormat[] = "session 1";
constexpr std::size_t kMostSessions = 10000;

PrivateFolder OpenSessions() { return {kFolder, kSeconds, kMostSessions}; }

/// Accepts a session in exactly the format that StartSession writes.
std::optional<Session> ParseSession(const std::optional<std::string> &text) {
    const Json::Value session = ParseObject(text.value_or(""));
    const std::string user = StringMember(session, "user");
    if (StringMember(session, "format") != kFormat || user.empty() || !IsPrintable(user)) {
        return std::nullopt;
    }
    return Session{user, StringMember(session, "display_name"), StringMember(session, "profile")};
}

}  // namespace

std::optional<Session> FindSession(Answer &answer, const std::string &cookies) {
    const std::optional<std::string> name = FindCookie(cookies, kCookie);
    if (!name) {
        return std::nullopt;
    }
    std::optional<Session> session = ParseSession(OpenSessions().Read(*name));
    if (session && !IsInForce(session->profile)) {
        EndSession(answer, cookies);
        return std::nullopt;
    }
    return session;
}

std::optional<Session> EndSession(Answer &answer, const std::string &cookies) {
    const std::optional<std::string> name = FindCookie(cookies, kCookie);
    if (!name) {
        return std::nullopt;
    }
    answer.ExpireCookie(kCookie);
    return ParseSession(OpenSessions().Take(*name));
}

void StartSession(Answer &answer, const std::string &cookies, const Session &session) {
    PrivateFolder sessions = OpenSessions();
    if (const std::optional<std::string> earlier = FindCookie(cookies, kCookie)) {
        sessions.Take(*earlier);
    }
    Json::Value text;
    text["format"] = kFormat;
    text["user"] = session.user;
    text["display_name"] = session.displayName;
    text["profile"] = session.profile;
    const std::string name = PrivateFolder::NewName();
    if (!sessions.Keep(name, WriteCompact(text))) {
        throw Refusal("Too many users are signed in.");
    }
    answer.SetCookie(kCookie, name);
}

}  // namespace Frontend
