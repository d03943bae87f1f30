#include "frontend/session.h"

#include "frontend/folders.h"
#include "web/configured_profile.h"
#include "web/cookie.h"
#include "web/refusal.h"
#include "web/text.h"

namespace Frontend {

namespace {

constexpr char kCookie[] = "__Host-session";
constexpr char kFormat[] = "session 1";

/// Accepts only the format that StartSession writes.
std::optional<Session> ParseSession(const std::optional<std::string> &text) {
    const Json::Value session = Web::ParseObject(text.value_or(""));
    const std::string user = Web::StringMember(session, "user");
    if (Web::StringMember(session, "format") != kFormat || user.empty() || !Web::IsPrintable(user)) {
        return std::nullopt;
    }
    return Session{user, Web::StringMember(session, "display_name"), Web::StringMember(session, "profile")};
}

}  // namespace

std::optional<Session> FindSession(Web::Response &response, const std::string &cookies) {
    const std::optional<std::string> name = Web::FindCookie(cookies, kCookie);
    if (!name) {
        return std::nullopt;
    }
    std::optional<Session> session = ParseSession(OpenSessions().Read(*name));
    if (session && !Web::IsInForce(session->profile)) {
        EndSession(response, cookies);
        return std::nullopt;
    }
    return session;
}

std::optional<Session> EndSession(Web::Response &response, const std::string &cookies) {
    const std::optional<std::string> name = Web::FindCookie(cookies, kCookie);
    if (!name) {
        return std::nullopt;
    }
    response.ExpireCookie(kCookie);
    return ParseSession(OpenSessions().Take(*name));
}

void StartSession(Web::Response &response, const std::string &cookies, const Session &session) {
    Web::PrivateFolder sessions = OpenSessions();
    if (const std::optional<std::string> earlier = Web::FindCookie(cookies, kCookie)) {
        sessions.Take(*earlier);
    }
    Json::Value text;
    text["format"] = kFormat;
    text["user"] = session.user;
    text["display_name"] = session.displayName;
    text["profile"] = session.profile;
    const std::string name = Web::PrivateFolder::NewName();
    if (!sessions.Keep(name, Web::WriteCompact(text))) {
        throw Web::Refusal("Too many users are signed in.");
    }
    response.SetCookie(kCookie, name);
}

}  // namespace Frontend
