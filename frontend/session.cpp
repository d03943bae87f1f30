#include "frontend/session.h"

#include "frontend/cgi.h"
#include "frontend/private_folder.h"
#include "frontend/text.h"

namespace Frontend {

namespace {

constexpr char kCookie[] = "__Host-session";
constexpr char kFolder[] = "sessions";
constexpr std::time_t kSeconds = std::time_t{8} * 60 * 60;

std::optional<Session> ParseSession(const std::optional<std::string> &text) {
    if (!text) {
        return std::nullopt;
    }
    const Json::Value session = ParseObject(*text);
    return Session{StringMember(session, "user"), StringMember(session, "profile")};
}

}  // namespace

std::optional<Session> FindSession(const std::string &cookies) {
    const std::optional<std::string> name = FindCookie(cookies, kCookie);
    return name ? ParseSession(PrivateFolder(kFolder, kSeconds).Read(*name)) : std::nullopt;
}

std::optional<Session> EndSession(Answer &answer, const std::string &cookies) {
    const std::optional<std::string> name = FindCookie(cookies, kCookie);
    if (!name) {
        return std::nullopt;
    }
    answer.ExpireCookie(kCookie);
    return ParseSession(PrivateFolder(kFolder, kSeconds).Take(*name));
}

void StartSession(Answer &answer, const std::string &cookies, const Session &session) {
    PrivateFolder sessions(kFolder, kSeconds);
    if (const std::optional<std::string> earlier = FindCookie(cookies, kCookie)) {
        sessions.Take(*earlier);
    }
    Json::Value text;
    text["user"] = session.user;
    text["profile"] = session.profile;
    const std::string name = PrivateFolder::NewName();
    sessions.Keep(name, WriteCompact(text));
    answer.SetCookie(kCookie, name);
}

}  // namespace Frontend
