// What reaches the front end from outside: the lines of an input are the query, the Cookie header and any other text.
// It is good when it concludes the login that was started, with a code.
#include <algorithm>
#include <filesystem>
#include <fstream>
#include <stdexcept>

#include "frontend/session.h"
#include "tests/fuzz/oracle.h"
#include "tests/fuzz/target.h"
#include "web/configured_profile.h"
#include "web/pending_login.h"
#include "web/private_folder.h"
#include "web/refusal.h"
#include "web/request.h"
#include "web/text.h"

namespace Fuzz {

namespace {

constexpr char kLogin[] = "3eb1bd439947eb762998e566ccc2e099";  // the first half of the SHA-256 of kSecret
constexpr char kSecret[] = "0123456789abcdef0123456789abcdef";
constexpr char kLoginCookie[] = "__Host-login-";  // and a hexadecimal digit
constexpr char kState[] = "eyJjc3JmIjoiM2ViMWJkNDM5OTQ3ZWI3NjI5OThlNTY2Y2NjMmUwOTkiLCJvcmlnaW4iOiIvcGFnZSJ9";
constexpr char kSession[] = "fedcba9876543210fedcba9876543210";
constexpr char kSessionCookie[] = "__Host-session";
constexpr char kUser[] = "CORP\\alice";
constexpr std::time_t kSeconds = 600;
constexpr char kFolder[] = "/usr/tavo/var/frontend";
constexpr char kLogins[] = "/usr/tavo/var/frontend/logins";

/// One login under way and one session open, whatever the last input made of them.
void Prepare() {
    std::filesystem::create_directories("/usr/tavo/var");
    std::filesystem::create_directories("/usr/tavo/etc/ssoclient");
    std::ofstream("/usr/tavo/etc/ssoclient/profile.conf") << R"({"sso_enable": true, "sso_profile": "websphere"})";
    std::ofstream("/usr/tavo/etc/ssoclient/websphere.conf")
        << R"({"websphere_client_id": "nas", "websphere_client_secret": "secret", "websphere_redirect_uri": "r",)"
        << R"("websphere_authorization_endpoint": "a", "websphere_token_endpoint": "t"})";
    TAVO::Web::PrivateFolder(kFolder, kSeconds);
    TAVO::Web::PrivateFolder logins(kLogins, kSeconds);
    logins.Take(kLogin);
    Json::Value login;
    login["format"] = "login 2";
    login["settings"] = TAVO::Web::RequireSettings();
    login["state"] = kState;
    Require(logins.Keep(kLogin, TAVO::Web::WriteCompact(login)), "there is room for a login");
    TAVO::Web::PrivateFolder sessions("/usr/tavo/var/frontend/sessions", kSeconds);
    sessions.Take(kSession);
    Require(sessions.Keep(kSession, R"({"format": "session 1", "user": "CORP\\alice", "profile": "websphere"})"),
            "there is room for a session");
}

bool IsHexDigit(char c) { return c != '\0' && std::string("0123456789abcdefABCDEF").find(c) != std::string::npos; }

std::string DecodePercent(const std::string &text) {
    std::string decoded;
    std::size_t i = 0;
    while (i < text.size()) {
        const std::string escape = text.substr(i, 3);
        if (escape.size() == 3 && escape[0] == '%' && IsHexDigit(escape[1]) && IsHexDigit(escape[2])) {
            decoded += static_cast<char>(std::stoi(escape.substr(1), nullptr, 16));
            i += 3;
        } else {
            decoded += text[i] == '+' ? ' ' : text[i];
            ++i;
        }
    }
    return decoded;
}

TAVO::Web::Parameters ExpectedParameters(const std::string &query) {
    TAVO::Web::Parameters parameters;
    for (const std::string &piece : Split(query, '&')) {
        if (!piece.empty()) {
            const std::size_t sign = std::min(piece.find('='), piece.size());
            const std::string value = piece.substr(std::min(sign + 1, piece.size()));
            parameters.emplace(DecodePercent(piece.substr(0, sign)), DecodePercent(value));
        }
    }
    return parameters;
}

/// Every value that the header gives to a cookie.
std::vector<std::string> CookieValues(const std::string &header, const std::string &name) {
    std::vector<std::string> values;
    for (std::string piece : Split(header, ';')) {
        piece.erase(0, std::min(piece.find_first_not_of(' '), piece.size()));
        const std::size_t sign = std::min(piece.find('='), piece.size());
        if (!piece.empty() && piece.substr(0, sign) == name) {
            values.push_back(piece.substr(std::min(sign + 1, piece.size())));
        }
    }
    return values;
}

bool HasOnly(const std::string &cookies, const char *name, const char *value) {
    return CookieValues(cookies, name) == std::vector<std::string>{value};
}

bool HasLoginCookie(const std::string &cookies) {
    const std::string digits = "0123456789abcdef";
    return std::any_of(digits.begin(), digits.end(), [&](char digit) {
        return HasOnly(cookies, (std::string(kLoginCookie) + digit).c_str(), kSecret);
    });
}

void RequireSession(const std::string &cookies) {
    TAVO::Web::Response response;
    std::optional<Frontend::Session> session;
    RequireSame(FailureOf([&] { session = Frontend::FindSession(response, cookies); }), Test::kNothingThrown);
    Require(session.has_value() == HasOnly(cookies, kSessionCookie, kSession), "a session is its cookie's");
    Require(!session || session->user == kUser, "a session is its user's");
}

void RequireOneLine(const std::string &line) {
    Require(TAVO::Web::IsPrintable(line) && line.size() <= 200, "a line is one, and not a long one");
}

std::string UnescapeHtml(std::string text) {
    const std::pair<const char *, const char *> escapes[] = {
        {"&lt;", "<"}, {"&gt;", ">"}, {"&quot;", "\""}, {"&#39;", "'"}, {"&amp;", "&"}};
    for (const auto &[escape, character] : escapes) {
        for (std::size_t at = 0; (at = text.find(escape, at)) != std::string::npos; ++at) {
            text.replace(at, std::string(escape).size(), character);
        }
    }
    return text;
}

void RequireHarmless(const std::string &text) {
    const std::string html = TAVO::Web::EscapeHtml(text);
    Require(html.find_first_of("<>\"'") == std::string::npos && UnescapeHtml(html) == text, "a text is escaped, whole");
    RequireOneLine(TAVO::Web::OneLine(text));

    const std::string origin = TAVO::Web::SafeOrigin(text);
    Require(origin == text || origin == "/index.cgi", "an origin is kept or replaced");
    Require(origin[0] == '/' && origin[1] != '/' && origin.find('\\') == std::string::npos && origin.size() <= 512 &&
                origin.find_first_of(" \"") == std::string::npos && TAVO::Web::IsPrintable(origin),
            "an origin is a path on this site");
}

/// What a user is told of a provider's answer is the error that it names, and nothing else of it.
void RequireDiscreet(const std::string &text) {
    const std::string reason = TAVO::Web::ReasonOf(std::runtime_error(text));
    RequireOneLine(reason);
    const std::string shown = UpToNUL(text);
    const std::size_t begin = shown.find_first_not_of(" \t\r\n");
    if (begin != std::string::npos && (shown[begin] == '{' || shown[begin] == '[')) {
        const Json::Value answer = TAVO::Web::ParseObject(shown);
        const std::string error = StringMember(answer, "error").value_or("");
        const std::string description = StringMember(answer, "error_description").value_or("");
        Require(reason == TAVO::Web::OneLine("The provider refused: " + (error.empty() ? "unknown error" : error) +
                                             (description.empty() ? "" : " (" + description + ")")),
                "a reason is the error that the provider names");
    }
}

void RequireDecoded(const std::string &text) {
    const Json::Value state = TAVO::Web::DecodeState(text);
    const std::optional<std::string> decoded = DecodeCanonicalBase64(text);
    Require(state.isNull() || (state.isObject() && decoded && ParseJson(*decoded) == state),
            "a state's object is what it encodes");
}

bool Concludes(const std::string &cookies, const std::string &state) {
    TAVO::Web::Response response;
    TAVO::Web::FolderLoginStore store(kLogins);
    std::string origin;
    const TAVO::Web::Request request = {"GET", "", cookies};
    const Test::Failure failure = FailureOf([&] { TAVO::Web::EndLogin(response, origin, request, store, state); });
    RequireOneOf(failure, {Test::kNothingThrown,
                           Test::Fails<TAVO::Web::Refusal>("This sign-in was not started in this browser."),
                           Test::Fails<TAVO::Web::Refusal>("This sign-in took too long, or was already completed."),
                           Test::Fails<TAVO::Web::Refusal>("This sign-in was changed on its way.")});
    return failure == Test::kNothingThrown;
}

}  // namespace

bool Accepts(const std::string &input) {
    const std::vector<std::string> lines = Lines(input, 3);
    const std::string &cookies = lines[1];
    Prepare();
    const TAVO::Web::Parameters parameters = TAVO::Web::ParseQuery(lines[0]);
    Require(parameters == ExpectedParameters(lines[0]), "parameters are the query's");
    RequireSession(cookies);
    RequireHarmless(lines[2]);
    RequireDiscreet(lines[2]);
    RequireDecoded(lines[2]);

    const std::string state = TAVO::Web::OnlyValue(parameters, "state").value_or("");
    const bool concluded = Concludes(cookies, state);
    Require(concluded == (state == kState && HasLoginCookie(cookies)),
            "a login is concluded by its own state, in its own browser");
    Require(!concluded || !Concludes(cookies, state), "a login is concluded once");
    RequireLog({});
    return concluded && parameters.count("code") == 1;
}

}  // namespace Fuzz
