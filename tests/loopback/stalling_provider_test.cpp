#include <curl/curl.h>
#include <gmock/gmock.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <ctime>
#include <future>
#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

#include "tests/loopback/loopback_provider.h"
#include "tests/support/server.h"
#include "tests/support/system_log.h"
#include "tests/support/token.h"

// Providers that take their time. It passes at the test's word: libcurl measures its limits on a clock that can be put
// forward here, and looks at it whenever something arrives.
namespace Test {

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::ValuesIn;

constexpr std::time_t kDay = 24 * 60 * 60;
constexpr std::time_t kLongestConnecting = 300;  // libcurl's own limit, up to the end of TLS's handshake

std::atomic<std::time_t> timePassed{0};

}  // namespace

}  // namespace Test

extern "C" int clock_gettime(clockid_t clock, timespec *time) {
    const long result = syscall(SYS_clock_gettime, clock, time);
    time->tv_sec += Test::timePassed;
    return static_cast<int>(result);
}

namespace Test {

namespace {

/// A login on a thread of its own, at a provider that stops on its way until it is told to go on.
class StalledLogin {
  public:
    explicit StalledLogin(Provider &provider) : provider_(provider) {}

    /// For the provider's script.
    void Stall() {
        stalled_.set_value();
        goOn_.get_future().wait();
    }

    void Start() {
        login_ = std::async(std::launch::async, [this] { return provider_.LogIn(); });
        stalled_.get_future().wait();
    }

    bool IsWaiting() const { return login_.wait_for(std::chrono::seconds(0)) == std::future_status::timeout; }

    Outcome GoOn() {
        goOn_.set_value();
        return login_.get();
    }

  private:
    Provider &provider_;
    std::promise<void> stalled_;
    std::promise<void> goOn_;
    std::future<Outcome> login_;
};

std::string Token(Profile profile) { return SignedToken(TokenHeader(profile), TokenClaims(profile)); }

/// What has gone out of an answer when the provider stalls, and how a transfer ends there if nothing more comes.
struct StallCase {
    std::string name;
    std::string sent;
    CURLcode result;
};

void PrintTo(const StallCase &row, std::ostream *stream) { *stream << row.name; }

class Stall : public ::testing::TestWithParam<StallCase> {
  protected:
    static std::string Answer(const std::string &document) {
        return "HTTP/1.1 200 OK\r\nContent-Length: " + std::to_string(document.size()) + "\r\n\r\n" + document;
    }

    /// The answer up to where this row stalls, and the rest if there is to be one.
    static void Play(Provider &provider, StalledLogin &login, const std::string &document, bool withRest) {
        const std::string answer = Answer(document);
        const std::size_t sent = answer.find(GetParam().sent) + GetParam().sent.size();
        provider.Play([&login, answer, sent, withRest](Connection &connection) {
            connection.ReceiveRequest();
            connection.Send(answer.substr(0, sent));
            login.Stall();
            if (withRest) {
                connection.SendByteByByte(answer.substr(sent));  // libcurl looks at the clock in between
            }
        });
    }

    static std::string Text() { return curl_easy_strerror(GetParam().result); }
};

INSTANTIATE_TEST_SUITE_P(Of, Stall,
                         ValuesIn(std::vector<StallCase>{
                             {"TheWholeAnswer", "", CURLE_GOT_NOTHING},
                             {"TheStatusLine", "HTTP/1.1 2", CURLE_GOT_NOTHING},
                             {"TheHeader", "Content-L", CURLE_OK},
                             {"TheBody", "\r\n\r\n", CURLE_PARTIAL_FILE},
                             {"TheBodysRest", "\r\n\r\n{", CURLE_PARTIAL_FILE},
                         }),
                         [](const auto &row) { return row.param.name; });

TEST_P(Stall, IsWaitedForAtTokenEndpoint) {
    for (const Profile profile : {Profile::kAzure, Profile::kWebSphere}) {
        Provider provider(profile);
        StalledLogin login(provider);
        Play(provider, login, TokenResponse(Token(profile)), true);
        provider.AnswerVerification();
        login.Start();
        timePassed += kDay;
        EXPECT_TRUE(login.IsWaiting()) << Name(profile);
        EXPECT_EQ(login.GoOn(), LoggedIn(UserName(profile)));
        EXPECT_THAT(TakeSystemLog(), IsEmpty()) << Name(profile);
    }
}

TEST_P(Stall, EndsWhenTokenEndpointCloses) {
    for (const Profile profile : {Profile::kAzure, Profile::kWebSphere}) {
        Provider provider(profile);
        StalledLogin login(provider);
        Play(provider, login, TokenResponse(Token(profile)), false);
        login.Start();
        timePassed += kDay;
        EXPECT_TRUE(login.IsWaiting()) << Name(profile);
        EXPECT_EQ(login.GoOn(), Refused<std::invalid_argument>("parse json falied")) << Name(profile);
        std::vector<LogLine> log;
        if (GetParam().result != CURLE_OK) {
            log.push_back(Error("sso:N request token uri " + Text() + "."));
        }
        EXPECT_EQ(TakeSystemLog(), log) << Name(profile);
    }
}

TEST_P(Stall, IsWaitedForAtDiscoveryDocument) {
    Provider provider(Profile::kAzure);
    StalledLogin login(provider);
    provider.Answer(TokenResponse(Token(Profile::kAzure)));
    Play(provider, login, R"({"jwks_uri": ")" + provider.URL("/keys") + "\"}", true);
    provider.Answer(KeySet());
    login.Start();
    timePassed += kDay;
    EXPECT_TRUE(login.IsWaiting());
    EXPECT_EQ(login.GoOn(), LoggedIn(UserName(Profile::kAzure)));
    EXPECT_THAT(TakeSystemLog(), IsEmpty());
}

TEST_P(Stall, IsWaitedForAtKeySet) {
    Provider provider(Profile::kAzure);
    StalledLogin login(provider);
    provider.Answer(TokenResponse(Token(Profile::kAzure)));
    provider.Answer(R"({"jwks_uri": "$BASE/keys"})");
    Play(provider, login, KeySet(), true);
    login.Start();
    timePassed += kDay;
    EXPECT_TRUE(login.IsWaiting());
    EXPECT_EQ(login.GoOn(), LoggedIn(UserName(Profile::kAzure)));
    EXPECT_THAT(TakeSystemLog(), IsEmpty());
}

TEST(HandshakeStall, IsWaitedForUpToConnectLimit) {
    Provider provider(Profile::kWebSphere);
    StalledLogin login(provider);
    provider.Play([&login](Connection &connection) {
        login.Stall();
        connection.ReceiveRequest();
        connection.Send(HTTPAnswer(TokenResponse(Token(Profile::kWebSphere))));
    });
    login.Start();
    timePassed += kLongestConnecting - 60;
    EXPECT_TRUE(login.IsWaiting());
    EXPECT_EQ(login.GoOn(), LoggedIn(UserName(Profile::kWebSphere)));
    EXPECT_THAT(TakeSystemLog(), IsEmpty());
}

TEST(HandshakeStall, FailsAfterConnectLimit) {
    Provider provider(Profile::kWebSphere);
    StalledLogin login(provider);
    provider.Play([&login](Connection &connection) {
        connection.ReceiveRaw();
        login.Stall();
        connection.ReceiveRaw();  // until the client goes
    });
    login.Start();
    EXPECT_TRUE(login.IsWaiting());
    timePassed += kLongestConnecting + 1;
    EXPECT_EQ(login.GoOn(), Refused<std::invalid_argument>("parse json falied"));
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error(std::string("sso:N request token uri ") +
                                                   curl_easy_strerror(CURLE_OPERATION_TIMEDOUT) + ".")));
}

TEST(SlowAnswer, AcceptsOneBytePerMinute) {
    Provider provider(Profile::kWebSphere);
    provider.Play([](Connection &connection) {
        connection.ReceiveRequest();
        for (const char byte : HTTPAnswer(TokenResponse(Token(Profile::kWebSphere)))) {
            timePassed += 60;
            connection.Send(std::string(1, byte));
        }
    });
    EXPECT_EQ(provider.LogIn(), LoggedIn(UserName(Profile::kWebSphere)));
    EXPECT_THAT(TakeSystemLog(), IsEmpty());
}

}  // namespace

}  // namespace Test
