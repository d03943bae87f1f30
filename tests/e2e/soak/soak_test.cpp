#include <gmock/gmock.h>
#include <syslog.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <functional>
#include <string>
#include <vector>

#include "jwt/jwt.h"
#include "sso/sso.h"
#include "tests/e2e/soak/figures.h"
#include "tests/e2e/soak/provider_process.h"
#include "tests/loopback/loopback_provider.h"
#include "tests/support/files.h"
#include "tests/support/interposed/clock.h"
#include "tests/support/openssl_errors.h"
#include "tests/support/system_log.h"
#include "tests/support/token.h"

// Verifies that many logins in one process leak nothing.
namespace Test {

namespace {

using ::testing::ElementsAreArray;
using ::testing::HasSubstr;
using ::testing::SizeIs;
using ::testing::StartsWith;

constexpr int kWarmUp = 500;  // until one-time allocations are done
constexpr int kLogins = 20'000;
constexpr int kCompared = 1'000;  // first and last logins compared
constexpr double kGrowth = 0.01;

constexpr uid_t kUser = 1024;
constexpr gid_t kGroup = 100;

std::vector<unsigned int> CurrentIDs() {
    std::vector<unsigned int> ids(6);
    EXPECT_EQ(getresuid(&ids[0], &ids[1], &ids[2]), 0);
    EXPECT_EQ(getresgid(&ids[3], &ids[4], &ids[5]), 0);
    return ids;
}

/// A process with other effective ids than root's, which also uses OpenSSL.
class Soak : public ::testing::Test {
  protected:
    Soak() {
        SetClock(kNow);
        setenv("no_proxy", "*", 1);  // a proxy from the environment cannot reach the loopback
        WriteFile(kProfileFile, "");
        // The user may read all files except those of the clients.
        for (const char *file : {kProfileFile, kDomainTable, kTrustedAuthorities}) {
            otherIDs_ = otherIDs_ && chown(file, kUser, kGroup) == 0;
        }
        otherIDs_ = otherIDs_ && setegid(kGroup) == 0 && seteuid(kUser) == 0;
        TakeSystemLog();
        TakeErrorQueue();
    }
    ~Soak() override {
        EXPECT_EQ(seteuid(0), 0);
        EXPECT_EQ(setegid(0), 0);
    }

    /// Uses the library and verifies ids, error queue and log.
    void Use(Profile profile, const std::vector<LogLine> &logged, const std::function<void()> &use) {
        const std::vector<unsigned int> ids = CurrentIDs();
        use();
        EXPECT_EQ(TakeErrorQueue(), std::vector<std::string>());
        EXPECT_EQ(CurrentIDs(), ids);
        std::vector<LogLine> log = LinesOfAReading(profile);
        log.insert(log.end(), logged.begin(), logged.end());
        EXPECT_THAT(TakeSystemLog(), ElementsAreArray(log));
    }

    void LogIn(Profile profile, const char *code, const Outcome &expected, const std::vector<LogLine> &logged = {}) {
        WriteFile(kProfileFile, profile == Profile::kAzure ? R"({"sso_enable": true, "sso_profile": "azure"})"
                                                           : R"({"sso_enable": true, "sso_profile": "websphere"})");
        Use(profile, logged, [&] { EXPECT_EQ(::Test::LogIn(code), expected); });
    }

    void FailToLogIn(Profile profile) {
        const bool azure = profile == Profile::kAzure;
        LogIn(profile, kRefusedCode, Refused<TAVO::SSO::sso_err_resp>("we cannot find key 'id_token' in response!"));
        LogIn(profile, kForgedCode,
              Refused<TAVO::JWT::jwt_verify_failed>(azure ? "verify rsa signature failed"
                                                          : "verify hmac signature failed"),
              azure ? std::vector<LogLine>{Error("jwt:N EVP_DigestVerifyFinal failed")} : std::vector<LogLine>());
    }

    void BuildAuthorizationURL(Profile profile) {
        Use(profile, {}, [profile] {
            const Json::Value state = Parse(R"({"origin": "/desktop"})");
            const std::string url = profile == Profile::kAzure
                                        ? TAVO::SSO::AzureSSOClient().GetAccessTokenReqURI(state)
                                        : TAVO::SSO::WebSphereSSOClient().GetAccessTokenReqURI(state);
            EXPECT_THAT(url, StartsWith(std::string(kAuthorizationEndpoint) + "?client_id=the%20client&nonce="));
            EXPECT_THAT(url, HasSubstr("&state="));
        });
    }

    /// The n-th login. Every tenth is followed by failed logins and an authorization URL.
    void LogIn(int n) {
        const Profile profile = n % 2 == 0 ? Profile::kAzure : Profile::kWebSphere;
        LogIn(profile, kGoodCode, LoggedIn(UserName(profile)));
        if (n % 10 == 0) {
            const Profile other = n % 20 == 0 ? Profile::kAzure : Profile::kWebSphere;
            FailToLogIn(other);
            BuildAuthorizationURL(other);
        }
    }

  private:
    /// The lines of reading a configuration file of root.
    std::vector<LogLine> LinesOfAReading(Profile profile) const {
        if (!otherIDs_) {
            return {};
        }
        const std::string source = profile == Profile::kAzure ? "azuresso" : "webspheresso";
        const LogLine group{LOG_AUTH | LOG_INFO, source + ":N WARNING: setresgid(-1, 0, -1)"};
        const LogLine user{LOG_AUTH | LOG_INFO, source + ":N WARNING: setresuid(-1, 0, -1)"};
        return {group, user, user};
    }

    ProviderProcess providers_;
    bool otherIDs_ = true;  // needs root
};

void Print(const char *name, double first, double last) {
    std::printf("%-16s %14.0f %14.0f  %+.3f %%\n", name, first, last, (last / first - 1) * 100);
}

void Print(const Figures &first, const Figures &last) {
    std::printf("%-16s %14s %14s\n", "", "first logins", "last logins");
    Print("heap in use", first.Heap(), last.Heap());
    Print("private memory", first.Resident(), last.Resident());
    Print("descriptors", static_cast<double>(*first.Descriptors().rbegin()),
          static_cast<double>(*last.Descriptors().rbegin()));
}

TEST_F(Soak, LeavesHostUnchanged) {
    for (int n = 0; n < kWarmUp; ++n) {
        LogIn(n);
        ASSERT_FALSE(HasFailure()) << "login " << n << " of the warm-up";
    }
    Figures first;
    Figures last;
    for (int n = 0; n < kLogins; ++n) {
        LogIn(n);
        ASSERT_FALSE(HasFailure()) << "login " << n;
        if (n < kCompared) {
            first.Note();
        } else if (n >= kLogins - kCompared) {
            last.Note();
        }
    }
    Print(first, last);
    EXPECT_NEAR(last.Heap(), first.Heap(), first.Heap() * kGrowth);
    EXPECT_NEAR(last.Resident(), first.Resident(), first.Resident() * kGrowth);
    EXPECT_THAT(first.Descriptors(), SizeIs(1));
    EXPECT_EQ(last.Descriptors(), first.Descriptors());
}

}  // namespace

}  // namespace Test
