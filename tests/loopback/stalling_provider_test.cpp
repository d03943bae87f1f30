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

// Slow providers. The test sets the clock that libcurl measures its time limits with; libcurl reads it whenever data
// arrives.
namespace Test {

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::ValuesIn;

constexpr std::time_t kDay = 24 * 60 * 60;
constexpr std::time_t kLongestConnecting = 300;  // libcurl's limit, including the TLS handshake

#ifdef SYS_clock_gettime64  // on 32-bit systems
constexpr long kClockCall = sizeof(std::time_t) > sizeof(long) ? SYS_clock_gettime64 : SYS_clock_gettime;
#else
constexpr long kClockCall = SYS_clock_gettime;
#endif

std::atomic<std::time_t> timePassed{0};

}  // namespace

}  // namespace Test

extern "C" int clock_gettime(clockid_t clock, timespec *time) {
    const long result = syscall(Test::kClockCall, clock, time);
    time->tv_sec += Test::timePassed;
    return static_cast<int>(result);
}

namespace Test {

namespace {

/// A login on its own thread, with a provider that stalls until the test continues it.
class StalledLogin {
  public:
    explicit StalledLogin(Provider &provider) : provider_(provider) {}

    /// Called by the provider's script.
    void Stall() {
        stalled_.set_value();
        continue_.get_future().wait();
    }

    void Start() {
        login_ = std::async(std::launch::async, [this] { return provider_.LogIn(); });
        stalled_.get_future().wait();
    }

    bool IsWaiting() const { return login_.wait_for(std::chrono::seconds(0)) == std::future_status::timeout; }

    Outcome Continue() {
        continue_.set_value();
        return login_.get();
    }

  private:
    Provider &provider_;
    std::promise<void> stalled_;
    std::promise<void> continue_;
    std::future<Outcome> login_;
};

std::string Token(Profile profile) { return SignedToken(TokenHeader(profile), TokenClaims(profile)); }

/// The part of an answer that is sent before the stall, and the result of a transfer that ends there.
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

    /// Sends the answer up to the stall and, if `withRest`, the rest after it.
    static void Play(Provider &provider, StalledLogin &login, const std::string &document, bool withRest) {
        const std::string answer = Answer(document);
        const std::size_t sent = answer.find(GetParam().sent) + GetParam().sent.size();
        provider.Play([&login, answer, sent, withRest](Connection &connection) {
            connection.ReceiveRequest();
            connection.Send(answer.substr(0, sent));
            login.Stall();
            if (withRest) {
                connection.SendByteByByte(answer.substr(sent));  // libcurl reads the clock between the bytes
            }
        });
    }

    static std::string Text() { return curl_easy_strerror(GetParam().result); }
};

INSTANTIATE_TEST_SUITE_P(Point, Stall,
                         ValuesIn(std::vector<StallCase>{
                             {"BeforeAnswer", "", CURLE_GOT_NOTHING},
                             {"InStatusLine", "HTTP/1.1 2", CURLE_GOT_NOTHING},
                             {"InHeader", "Content-L", CURLE_OK},
                             {"BeforeBody", "\r\n\r\n", CURLE_PARTIAL_FILE},
                             {"InBody", "\r\n\r\n{", CURLE_PARTIAL_FILE},
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
        EXPECT_EQ(login.Continue(), LoggedIn(UserName(profile)));
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
        EXPECT_EQ(login.Continue(), Refused<std::invalid_argument>("parse json falied")) << Name(profile);
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
    EXPECT_EQ(login.Continue(), LoggedIn(UserName(Profile::kAzure)));
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
    EXPECT_EQ(login.Continue(), LoggedIn(UserName(Profile::kAzure)));
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
    EXPECT_EQ(login.Continue(), LoggedIn(UserName(Profile::kWebSphere)));
    EXPECT_THAT(TakeSystemLog(), IsEmpty());
}

TEST(HandshakeStall, FailsAfterConnectLimit) {
    Provider provider(Profile::kWebSphere);
    StalledLogin login(provider);
    provider.Play([&login](Connection &connection) {
        connection.ReceiveRaw();
        login.Stall();
        connection.ReceiveRaw();  // until the client disconnects
    });
    login.Start();
    EXPECT_TRUE(login.IsWaiting());
    timePassed += kLongestConnecting + 1;
    EXPECT_EQ(login.Continue(), Refused<std::invalid_argument>("parse json falied"));
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
