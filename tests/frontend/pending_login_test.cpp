#include "web/pending_login.h"

#include <gmock/gmock.h>
#include <sso/sso.h>
#include <sys/stat.h>
#include <utime.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <set>

#include "frontend/session.h"
#include "platform/platform.h"
#include "tests/frontend/set_cookie.h"
#include "tests/support/failure.h"
#include "web/configured_profile.h"
#include "web/refusal.h"
#include "web/request.h"
#include "web/text.h"

using namespace Frontend;
using namespace TAVO::Web;

namespace {

std::string Encode(const std::string &text) {
    char buffer[4096];
    EXPECT_NE(TLIBCBase64SzEncodeFull(text.data(), text.size(), buffer, 1, sizeof buffer, 0, 1), 0);
    return buffer;
}

// Like GetAccessTokenReqURI, with a fixed nonce.
std::string MakeAddress(Json::Value state) {
    state["nonce"] = "digest";
    return "https://provider.example/auth?scope=openid&state=" + TAVO::SSO::URLEncode(Encode(WriteCompact(state)));
}

constexpr char kTookTooLong[] = "This sign-in took too long, or was already completed.";
const std::string kLogins = "/usr/tavo/var/logins";
const std::string kFolder = kLogins + "/";

class PendingLoginTest : public testing::Test {
  protected:
    PendingLoginTest() {
        std::filesystem::create_directory("/usr/tavo/var");
        UseProfile("azure");
        state = Start();
    }
    ~PendingLoginTest() override {
        std::filesystem::remove_all("/usr/tavo/var");
        std::filesystem::remove_all("/usr/tavo/etc");
    }

    static void UseProfile(const std::string &name, bool enable = true) {
        std::filesystem::create_directories("/usr/tavo/etc/ssoclient");
        std::ofstream("/usr/tavo/etc/ssoclient/profile.conf")
            << "{\"sso_enable\": " << std::boolalpha << enable << ", \"sso_profile\": \"" << name << "\"}";
        SetUpClient(name, "https://provider.example/token");
    }

    static void SetUpClient(const std::string &name, const std::string &tokenEndpoint) {
        Json::Value settings;
        for (const char *key : {"client_id", "client_secret", "redirect_uri", "authorization_endpoint", "wellknown"}) {
            settings[name + "_" + key] = "given";
        }
        settings[name + "_token_endpoint"] = tokenEndpoint;
        std::ofstream("/usr/tavo/etc/ssoclient/" + name + ".conf") << WriteCompact(settings);
    }

    /// Starts a login in a browser with these cookies. Returns its state.
    std::string Start(const std::string &cookies = "", std::size_t mostPending = kMostLogins) {
        FolderLoginStore store(kLogins, mostPending);
        const std::string address =
            BeginLogin(response, With(cookies), store, RequireSettings(), "/files", MakeAddress);
        const std::string set = LastSetCookie(response);
        cookie = set.substr(0, set.find(';'));
        return OnlyValue(ParseQuery(address.substr(address.find('?') + 1)), "state").value();
    }

    /// The cookie of a login that starts in a browser with these cookies.
    static std::string CookieHeader(const std::string &cookies) {
        Response other;
        FolderLoginStore store(kLogins);
        BeginLogin(other, With(cookies), store, RequireSettings(), "/files", MakeAddress);
        return LastSetCookie(other);
    }

    static std::string NameOf(const std::string &started) { return DecodeState(started)["csrf"].asString(); }
    std::string Name() { return NameOf(state); }
    std::string Cookie() { return cookie; }
    std::string Secret() { return cookie.substr(cookie.find('=') + 1); }

    static Request With(const std::string &cookies) { return {"GET", "", cookies}; }

    PendingLogin End(const std::string &cookies, const std::string &returned) {
        FolderLoginStore store(kLogins);
        return EndLogin(response, origin, With(cookies), store, returned);
    }

    std::string Refusal(const std::string &cookies, const std::string &returned) {
        return ::Test::FailureOf([&] { End(cookies, returned); }).text;
    }

    Response response;
    std::string origin;
    std::string cookie;
    std::string state;
};

TEST_F(PendingLoginTest, EndsOnceInBrowserThatStartedIt) {
    EXPECT_EQ(Refusal(Cookie(), state), "");
    EXPECT_EQ(Refusal(Cookie(), state), kTookTooLong);
}

TEST_F(PendingLoginTest, ReturnsMembersOfState) {
    const Json::Value object = End(Cookie(), state).state;
    EXPECT_EQ(object["origin"].asString(), "/files");
    EXPECT_EQ(object["nonce"].asString(), "digest");
}

TEST_F(PendingLoginTest, RejectsAnotherBrowserAndStaysPending) {
    const std::string reason = "This sign-in was not started in this browser.";
    EXPECT_EQ(Refusal("", state), reason);
    EXPECT_EQ(Refusal("__Host-login-" + Name().substr(0, 1) + "=" + std::string(32, '0'), state), reason);
    EXPECT_EQ(Refusal(Cookie() + "; " + Cookie(), state), reason);
    EXPECT_EQ(Refusal(Cookie(), state), "");
}

TEST_F(PendingLoginTest, RejectsCookieDerivedFromState) {
    EXPECT_EQ(Refusal("__Host-login-" + Name().substr(0, 1) + "=" + Name(), state),
              "This sign-in was not started in this browser.");
}

TEST_F(PendingLoginTest, ExpiresAfterTenMinutes) {
    for (const auto &[age, reason] : {std::pair(598, ""), std::pair(602, kTookTooLong), std::pair(-60, kTookTooLong)}) {
        state = Start();
        const utimbuf past{std::time(nullptr) - age, std::time(nullptr) - age};
        ASSERT_EQ(utime((kFolder + Name()).c_str(), &past), 0);
        EXPECT_EQ(Refusal(Cookie(), state), reason) << age;
    }
}

TEST_F(PendingLoginTest, SetsCookieWithSameLifetime) {
    EXPECT_THAT(CookieHeader(""), testing::MatchesRegex("__Host-login-[0-9a-f]=[0-9a-f]{32}; Path=/; "
                                                        "Secure; HttpOnly; SameSite=Lax; Max-Age=600"));
}

TEST_F(PendingLoginTest, ExpiresCookieWhenFinishedOrTooLate) {
    const utimbuf past{std::time(nullptr) - 602, std::time(nullptr) - 602};
    for (const bool isLate : {false, true}) {
        state = Start();
        if (isLate) {
            ASSERT_EQ(utime((kFolder + Name()).c_str(), &past), 0);
        }
        response = Response();
        EXPECT_EQ(Refusal(Cookie(), state), isLate ? kTookTooLong : "");
        EXPECT_EQ(LastSetCookie(response),
                  "__Host-login-" + Name().substr(0, 1) + "=; Path=/; Secure; HttpOnly; SameSite=Lax; Max-Age=0");
    }
}

TEST_F(PendingLoginTest, PrefersUnusedOfSixteenCookieNames) {
    std::string cookies;
    std::set<std::string> names;
    for (int i = 0; i < 16; ++i) {
        const std::string set = CookieHeader(cookies);
        const std::string first = set.substr(0, set.find(';'));
        EXPECT_TRUE(names.insert(first.substr(0, first.find('='))).second) << "a tab lost its cookie";
        cookies += (cookies.empty() ? "" : "; ") + first;
    }
    for (int i = 0; i < 100; ++i) {
        const std::string set = CookieHeader(cookies);
        EXPECT_EQ(names.count(set.substr(0, set.find('='))), 1u);
    }
}

TEST_F(PendingLoginTest, AcceptsCookieUnderAnyName) {
    EXPECT_EQ(Refusal("__Host-login-" + std::string(Name()[0] == '0' ? "1" : "0") + "=" + Secret(), state), "");
}

TEST_F(PendingLoginTest, FailsIfProfileChangesOrIsDisabled) {
    UseProfile("websphere");
    EXPECT_EQ(Refusal(Cookie(), state), "The settings of this device were changed during this sign-in.");
    state = Start();
    UseProfile("websphere", false);
    EXPECT_THROW(End(Cookie(), state), TAVO::SSO::sso_op_failed);
}

TEST_F(PendingLoginTest, FailsIfTokenEndpointChanges) {
    SetUpClient("azure", "https://elsewhere.example/token");
    EXPECT_EQ(Refusal(Cookie(), state), "The settings of this device were changed during this sign-in.");
}

class FailingStore : public LoginStore {
  public:
    bool Keep(const std::string &, const std::string &) override { throw std::runtime_error("disk on fire"); }
    std::optional<std::string> Take(const std::string &) override { throw 1; }
};

TEST_F(PendingLoginTest, ConvertsAnyExceptionOfStore) {
    FailingStore store;
    EXPECT_THAT([&] { BeginLogin(response, With(""), store, RequireSettings(), "/files", MakeAddress); },
                testing::ThrowsMessage<StoreFailure>("disk on fire"));
    EXPECT_THROW(EndLogin(response, origin, With(Cookie()), store, state), StoreFailure);
}

TEST_F(PendingLoginTest, IsNotAcceptedAsSession) {
    std::filesystem::create_directories("/usr/tavo/var/frontend/sessions");
    ASSERT_EQ(chmod("/usr/tavo/var/frontend", 0700), 0);
    ASSERT_EQ(chmod("/usr/tavo/var/frontend/sessions", 0700), 0);
    std::filesystem::copy_file(kFolder + Name(), "/usr/tavo/var/frontend/sessions/" + Name());
    EXPECT_FALSE(FindSession(response, "__Host-session=" + Name()));
}

TEST_F(PendingLoginTest, RejectsLoginsAboveLimit) {
    constexpr std::size_t kMost = 3;
    Start("", kMost);
    Start("", kMost);
    EXPECT_THAT([this] { Start("", kMost); },
                testing::ThrowsMessage<TAVO::Web::Refusal>("Too many sign-ins are under way on this device."));
    std::filesystem::remove(kFolder + Name());
    Start("", kMost);
}

TEST_F(PendingLoginTest, RejectsChangedOrigin) {
    Json::Value changed = DecodeState(state);
    changed["origin"] = "/elsewhere";
    EXPECT_EQ(Refusal(Cookie(), Encode(WriteCompact(changed))), "This sign-in was changed on its way.");
}

TEST_F(PendingLoginTest, RejectsChangedNonce) {
    Json::Value changed = DecodeState(state);
    changed["nonce"] = "another digest";
    EXPECT_EQ(Refusal(Cookie(), Encode(WriteCompact(changed))), "This sign-in was changed on its way.");
}

TEST_F(PendingLoginTest, RejectsUnreadableState) {
    const std::string reason = "This sign-in was not started in this browser.";
    for (const std::string &text : {std::string(), std::string("[1]"), std::string("{\"csrf\":1}"),
                                    std::string("{\"csrf\":\"../sessions\"}"), std::string("not JSON")}) {
        EXPECT_EQ(Refusal("__Host-login-=", Encode(text)), reason);
    }
    EXPECT_EQ(Refusal(Cookie(), "not base64"), reason);
}

TEST(State, IsReadUpToMaximumLength) {
    const std::string name(1013, 'a');
    EXPECT_EQ(DecodeState(Encode("{\"csrf\":\"" + name + "\"}"))["csrf"].asString(), name);
    EXPECT_TRUE(DecodeState(Encode("{\"csrf\":\"" + std::string(2000, 'a') + "\"}")).isNull());
}

TEST(State, RejectsNonCanonicalBase64) {
    const std::string text = Encode("{\"a\":1}");
    EXPECT_FALSE(DecodeState(text).isNull());
    for (const std::string &other : {" " + text, text + "\n", text + "====", "=" + text, text.substr(1)}) {
        EXPECT_TRUE(DecodeState(other).isNull()) << other;
    }
}

}  // namespace
