// Input of the front end. Input lines: the query, the Cookie header and any other text. An input is accepted if it
// finishes the pending login with a code.
#include <algorithm>
#include <filesystem>
#include <fstream>
#include <stdexcept>

#include "frontend/catalogues.h"
#include "frontend/language.h"
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
constexpr char kLoginCookie[] = "__Host-login-";  // followed by a hexadecimal digit
constexpr char kState[] = "eyJjc3JmIjoiM2ViMWJkNDM5OTQ3ZWI3NjI5OThlNTY2Y2NjMmUwOTkiLCJvcmlnaW4iOiIvcGFnZSJ9";
constexpr char kSession[] = "fedcba9876543210fedcba9876543210";
constexpr char kSessionCookie[] = "__Host-session";
constexpr char kUser[] = "CORP\\alice";
constexpr std::time_t kSeconds = 600;
constexpr char kFolder[] = "/usr/tavo/var/frontend";
constexpr char kLogins[] = "/usr/tavo/var/frontend/logins";

/// Creates one pending login and one session.
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
    Require(logins.Keep(kLogin, TAVO::Web::WriteCompact(login)), "cannot store the login");
    TAVO::Web::PrivateFolder sessions("/usr/tavo/var/frontend/sessions", kSeconds);
    sessions.Take(kSession);
    Require(sessions.Keep(kSession, R"({"format": "session 1", "user": "CORP\\alice", "profile": "websphere"})"),
            "cannot store the session");
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

/// The values of a cookie in the header.
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
    Require(session.has_value() == HasOnly(cookies, kSessionCookie, kSession), "the session does not match the cookie");
    Require(!session || session->user == kUser, "the session has another user");
}

void RequireOneLine(const std::string &line) {
    Require(TAVO::Web::IsPrintable(line) && line.size() <= 200, "not a short printable line");
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
    Require(html.find_first_of("<>\"'") == std::string::npos && UnescapeHtml(html) == text,
            "the text is not escaped correctly");
    RequireOneLine(TAVO::Web::OneLine(text));

    const std::string origin = TAVO::Web::SafeOrigin(text);
    Require(origin == text || origin == "/index.cgi", "the origin was changed");
    Require(origin[0] == '/' && origin[1] != '/' && origin.find('\\') == std::string::npos && origin.size() <= 512 &&
                origin.find_first_of(" \"") == std::string::npos && TAVO::Web::IsPrintable(origin),
            "the origin is not a local path");
    Require(Frontend::FindCatalogue(Frontend::PreferredLanguage(text)) != nullptr, "the language has no catalogue");
}

/// Of a provider's answer, only the error and its description may be shown.
void RequireOnlyErrorShown(const std::string &text) {
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
                "the reason is not the provider's error");
    }
}

void RequireDecoded(const std::string &text) {
    const Json::Value state = TAVO::Web::DecodeState(text);
    const std::optional<std::string> decoded = DecodeCanonicalBase64(text);
    Require(state.isNull() || (state.isObject() && decoded && ParseJson(*decoded) == state),
            "the state is decoded incorrectly");
}

bool Finishes(const std::string &cookies, const std::string &state) {
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
    Require(parameters == ExpectedParameters(lines[0]), "the query is parsed incorrectly");
    RequireSession(cookies);
    RequireHarmless(lines[2]);
    RequireOnlyErrorShown(lines[2]);
    RequireDecoded(lines[2]);

    const std::string state = TAVO::Web::OnlyValue(parameters, "state").value_or("");
    const bool finished = Finishes(cookies, state);
    Require(finished == (state == kState && HasLoginCookie(cookies)),
            "the login was finished with another state or browser, or was rejected");
    Require(!finished || !Finishes(cookies, state), "the login was finished twice");
    RequireLog({});
    return finished && parameters.count("code") == 1;
}

}  // namespace Fuzz
