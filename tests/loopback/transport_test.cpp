#include <curl/curl.h>
#include <gmock/gmock.h>
#include <openssl/err.h>
#include <syslog.h>

#include <ostream>
#include <string>
#include <typeinfo>

#include "sso/sso.h"
#include "tests/support/authority.h"
#include "tests/support/interposed/memory.h"
#include "tests/support/openssl_errors.h"
#include "tests/support/server.h"
#include "tests/support/system_log.h"

namespace Test {

namespace {

using TAVO::SSO::httpGet;
using TAVO::SSO::httpPost;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::SizeIs;
using ::testing::StartsWith;

std::size_t Append(char *data, std::size_t size, std::size_t count, void *response) {
    static_cast<std::string *>(response)->append(data, size * count);
    return size * count;
}

struct Operation {
    const char *name;
    void (*perform)(const std::string &url, std::string &response, bool verify);
};

constexpr Operation kOperations[] = {
    {"Get", [](const std::string &url, std::string &response, bool verify) { httpGet(url, response, verify, Append); }},
    {"Post", [](const std::string &url, std::string &response,
                bool verify) { httpPost(url, "a=b", response, verify, Append); }},
};

std::string NameOfOperation(const ::testing::TestParamInfo<Operation> &info) { return info.param.name; }

void PrintTo(const Operation &operation, std::ostream *stream) { *stream << operation.name; }

/// The exception and the response of a transfer.
struct Ending {
    std::string exception;
    std::string response;
};

bool operator==(const Ending &a, const Ending &b) { return a.exception == b.exception && a.response == b.response; }

std::ostream &operator<<(std::ostream &stream, const Ending &ending) {
    return stream << "[" << ending.exception << "] \"" << ending.response << "\"";
}

Ending Arrived(const std::string &response) { return {"", response}; }

Ending Failed(CURLcode result, const std::string &response = "") {
    return {std::string("sso_err_resp ") + curl_easy_strerror(result), response};
}

class Transfer : public ::testing::TestWithParam<Operation> {
  protected:
    Transfer() { TrustAuthority(); }

    static Ending Perform(const std::string &url, bool verify = true) {
        Ending ending;
        try {
            GetParam().perform(url, ending.response, verify);
        } catch (const std::exception &error) {
            ending.exception = (typeid(error) == typeid(TAVO::SSO::sso_err_resp) ? "sso_err_resp " : "another class ");
            ending.exception += error.what();
        }
        return ending;
    }
};

INSTANTIATE_TEST_SUITE_P(Http, Transfer, ::testing::ValuesIn(kOperations), NameOfOperation);

TEST_P(Transfer, ReturnsAnswerOverHTTP) {
    Server server;
    server.Answer(HTTPAnswer("the answer"));
    EXPECT_EQ(Perform(server.URL("/")), Arrived("the answer"));
}

TEST_P(Transfer, ReturnsAnswerOfTrustedServerOverTLS) {
    Server server(CertificateFor("IP:127.0.0.1"));
    server.Answer(HTTPAnswer("the answer"));
    EXPECT_EQ(Perform(server.URL("/")), Arrived("the answer"));
}

TEST_P(Transfer, AcceptsCertificateForHostName) {
    Server server(CertificateFor("DNS:localhost"));
    server.Answer(HTTPAnswer("the answer"));
    EXPECT_EQ(Perform(server.URL("/", "localhost")), Arrived("the answer"));
}

TEST_P(Transfer, SendsNothingOnHostNameMismatch) {
    Server server(CertificateFor("DNS:localhost"));
    server.Answer(HTTPAnswer("the answer"));
    EXPECT_EQ(Perform(server.URL("/", "127.0.0.1")), Failed(CURLE_PEER_FAILED_VERIFICATION));
    EXPECT_THAT(server.Requests(), IsEmpty());
}

TEST_P(Transfer, SendsNothingToServerWithExpiredCertificate) {
    Server server(ExpiredCertificateFor("IP:127.0.0.1"));
    server.Answer(HTTPAnswer("the answer"));
    EXPECT_EQ(Perform(server.URL("/")), Failed(CURLE_PEER_FAILED_VERIFICATION));
    EXPECT_THAT(server.Requests(), IsEmpty());
}

TEST_P(Transfer, SendsNothingToSelfSignedServer) {
    Server server(SelfSignedCertificateFor("IP:127.0.0.1"));
    server.Answer(HTTPAnswer("the answer"));
    EXPECT_EQ(Perform(server.URL("/")), Failed(CURLE_PEER_FAILED_VERIFICATION));
    EXPECT_THAT(server.Requests(), IsEmpty());
}

TEST_P(Transfer, AcceptsAnyCertificateWithoutVerification) {
    for (const Credentials &credentials :
         {SelfSignedCertificateFor("IP:127.0.0.1"), ExpiredCertificateFor("IP:127.0.0.1"),
          CertificateFor("DNS:elsewhere.example")}) {
        Server server(credentials);
        server.Answer(HTTPAnswer("the answer"));
        EXPECT_EQ(Perform(server.URL("/"), false), Arrived("the answer"));
    }
}

TEST_P(Transfer, ClearsErrorQueueOverTLS) {
    Server server(CertificateFor("IP:127.0.0.1"));
    server.Answer(HTTPAnswer("the answer"));
    ERR_raise(ERR_LIB_USER, 1);
    EXPECT_EQ(Perform(server.URL("/")), Arrived("the answer"));
    EXPECT_THAT(TakeErrorQueue(), IsEmpty());
}

TEST_P(Transfer, ReturnsBodyOfErrorPage) {
    for (const char *status : {"404 Not Found", "500 Internal Server Error"}) {
        Server server;
        server.Answer(HTTPAnswer("an error page", status));
        EXPECT_EQ(Perform(server.URL("/")), Arrived("an error page")) << status;
    }
}

TEST_P(Transfer, FollowsNoRedirect) {
    Server elsewhere;
    elsewhere.Answer(HTTPAnswer("elsewhere"));
    Server server;
    server.Answer("HTTP/1.1 302 Found\r\nLocation: " + elsewhere.URL("/") + "\r\nContent-Length: 5\r\n\r\nmoved");
    EXPECT_EQ(Perform(server.URL("/")), Arrived("moved"));
    EXPECT_THAT(elsewhere.Requests(), IsEmpty());
}

TEST_P(Transfer, AcceptsEmptyAnswer) {
    Server server;
    server.Answer(HTTPAnswer(""));
    EXPECT_EQ(Perform(server.URL("/")), Arrived(""));
    EXPECT_THAT(server.Requests(), SizeIs(1));
}

TEST_P(Transfer, FailsIfServerClosesWithoutAnswer) {
    Server server;
    EXPECT_EQ(Perform(server.URL("/")), Failed(CURLE_GOT_NOTHING));
    EXPECT_THAT(server.Requests(), SizeIs(1));
}

TEST_P(Transfer, FailsIfAnswerIsNotHTTP) {
    Server server;
    server.Answer("220 mail.example ESMTP\r\n");
    EXPECT_EQ(Perform(server.URL("/")), Failed(CURLE_UNSUPPORTED_PROTOCOL));
}

TEST_P(Transfer, KeepsPartialBodyOfFailedTransfer) {
    Server plain;
    plain.Answer(CutHTTPAnswer("the first half", 14));
    EXPECT_EQ(Perform(plain.URL("/")), Failed(CURLE_PARTIAL_FILE, "the first half"));

    Server tls(CertificateFor("IP:127.0.0.1"));
    tls.Answer(CutHTTPAnswer("the first half", 14));
    EXPECT_EQ(Perform(tls.URL("/")), Failed(CURLE_PARTIAL_FILE, "the first half"));
}

TEST_P(Transfer, FailsIfConnectionIsRefused) {
    const Port closed;
    EXPECT_EQ(Perform("http://127.0.0.1:" + std::to_string(closed.number()) + "/"), Failed(CURLE_COULDNT_CONNECT));
}

TEST_P(Transfer, FailsWithoutURL) { EXPECT_EQ(Perform(""), Failed(CURLE_URL_MALFORMAT)); }

TEST_P(Transfer, AppendsToResponseThroughCallback) {
    Server server;
    server.Answer(HTTPAnswer("second"));
    std::string response = "first, ";
    GetParam().perform(server.URL("/"), response, true);
    EXPECT_EQ(response, "first, second");
}

TEST_P(Transfer, SucceedsAfterFailedTransfer) {
    Server server;
    server.Answer("220 mail.example ESMTP\r\n");
    server.Answer(HTTPAnswer("the answer"));
    EXPECT_EQ(Perform(server.URL("/")), Failed(CURLE_UNSUPPORTED_PROTOCOL));
    EXPECT_EQ(Perform(server.URL("/")), Arrived("the answer"));
}

TEST_P(Transfer, PassesNULBytesToCallback) {
    Server server;
    server.Answer(ChunkedHTTPAnswer({std::string("ab\0cd", 5), "ef"}));
    EXPECT_EQ(Perform(server.URL("/")), Arrived(std::string("ab\0cdef", 7)));
}

TEST(Get, SendsExactRequest) {
    Server server;
    std::string response;
    server.Answer(HTTPAnswer(""));
    httpGet(server.URL("/where?a=b%20c"), response, true, Append);
    const std::string host = server.URL("").substr(sizeof "http://" - 1);
    EXPECT_THAT(server.Requests(),
                ElementsAre("GET /where?a=b%20c HTTP/1.1\r\nHost: " + host + "\r\nAccept: */*\r\n\r\n"));
}

class Post : public ::testing::Test {
  protected:
    std::string RequestFor(const std::string &body) {
        Server server;
        server.Answer(HTTPAnswer(""));
        std::string response;
        httpPost(server.URL("/token"), body, response, true, Append);
        host_ = server.URL("").substr(sizeof "http://" - 1);
        return server.Requests().at(0);
    }

    std::string Expected(const std::string &body) const {
        return "POST /token HTTP/1.1\r\nHost: " + host_ +
               "\r\nAccept: */*\r\nContent-Length: " + std::to_string(body.size()) +
               "\r\nContent-Type: application/x-www-form-urlencoded\r\n\r\n" + body;
    }

  private:
    std::string host_;
};

TEST_F(Post, SendsExactRequest) {
    const std::string body = "a=1&b=%20+&c=\r\n%%";
    const std::string request = RequestFor(body);
    EXPECT_EQ(request, Expected(body));
}

TEST_F(Post, SendsPostWithEmptyBody) {
    const std::string request = RequestFor("");
    EXPECT_EQ(request, Expected(""));
}

TEST_F(Post, SendsBodyUpToFirstNUL) {
    const std::string request = RequestFor(std::string("a=1\0b=2", 7));
    EXPECT_EQ(request, Expected("a=1"));
}

/// The base client with the endpoints that derived clients read from a file.
struct PlainClient : TAVO::SSO::SSOClient {
    using SSOClient::tokenEndpoint;
    using SSOClient::wellknownEndpoint;

    std::string RequestToken(const std::string &endpoint) {
        tokenEndpoint = endpoint;
        std::string response = "before ";
        RequestTokenEndpoint(response, "a=b");
        return response;
    }

    Json::Value RequestWellknown(const std::string &endpoint) {
        wellknownEndpoint = endpoint;
        Json::Value document;
        RequestWellknownInfo(document);
        return document;
    }
};

LogLine Logged(const std::string &text) { return {LOG_ERR, "sso:N " + text}; }

class ProviderExchange : public ::testing::Test {
  protected:
    ProviderExchange() {
        TakeSystemLog();  // left by another test
        TrustAuthority();
    }
    PlainClient client_;
};

TEST_F(ProviderExchange, CutsTokenResponseChunksAtFirstNUL) {
    Server server;
    server.Answer(ChunkedHTTPAnswer({std::string("ab\0cd\0", 6), "efg", std::string("\0h", 2), "i"}));
    EXPECT_EQ(client_.RequestToken(server.URL("/")), "before abefgi");
    EXPECT_THAT(TakeSystemLog(), IsEmpty());
}

TEST_F(ProviderExchange, CutsDiscoveryChunksAtFirstNUL) {
    Server server;
    server.Answer(ChunkedHTTPAnswer({std::string("{\"a\"\0!!", 7), ": 1}"}));
    EXPECT_EQ(client_.RequestWellknown(server.URL("/"))["a"], 1);
    EXPECT_THAT(TakeSystemLog(), IsEmpty());
}

TEST_F(ProviderExchange, RejectsChunkIfMemoryRunsOut) {
    const std::string large(std::size_t{4} << 20, 'x');
    Server server;
    server.Answer(HTTPAnswer(large));
    const std::string response = [&] {
        const MemoryLimit limit(std::size_t{1} << 20);
        return client_.RequestToken(server.URL("/"));
    }();
    EXPECT_THAT(response, StartsWith("before xxx"));
    EXPECT_LT(response.size(), large.size());
    EXPECT_THAT(TakeSystemLog(),
                ElementsAre(Logged(std::string("request token uri ") + curl_easy_strerror(CURLE_WRITE_ERROR) + ".")));
}

TEST_F(ProviderExchange, VerifiesServerOfTokenEndpoint) {
    Server server(SelfSignedCertificateFor("IP:127.0.0.1"));
    EXPECT_EQ(client_.RequestToken(server.URL("/")), "before ");
    EXPECT_THAT(server.Requests(), IsEmpty());
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Logged(std::string("request token uri ") +
                                                    curl_easy_strerror(CURLE_PEER_FAILED_VERIFICATION) + ".")));
}

TEST_F(ProviderExchange, VerifiesServerOfDiscoveryDocument) {
    Server server(SelfSignedCertificateFor("IP:127.0.0.1"));
    EXPECT_TRUE(client_.RequestWellknown(server.URL("/")).isNull());
    EXPECT_THAT(server.Requests(), IsEmpty());
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Logged(curl_easy_strerror(CURLE_PEER_FAILED_VERIFICATION))));
}

TEST_F(ProviderExchange, LogsAndKeepsPartialTokenResponse) {
    Server server;
    server.Answer(CutHTTPAnswer("half", 4));
    EXPECT_EQ(client_.RequestToken(server.URL("/")), "before half");
    EXPECT_THAT(TakeSystemLog(),
                ElementsAre(Logged(std::string("request token uri ") + curl_easy_strerror(CURLE_PARTIAL_FILE) + ".")));
}

TEST_F(ProviderExchange, LogsAndDiscardsPartialDiscoveryDocument) {
    Server server;
    server.Answer(CutHTTPAnswer(R"({"jwks_uri": "a whole document"})", 4));
    EXPECT_TRUE(client_.RequestWellknown(server.URL("/")).isNull());
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Logged(curl_easy_strerror(CURLE_PARTIAL_FILE))));
}

TEST_F(ProviderExchange, LogsAndDiscardsInvalidDiscoveryDocument) {
    for (const char *body : {"<html>", "", R"({"jwks_uri": "cut off")"}) {
        Server server;
        server.Answer(HTTPAnswer(body));
        EXPECT_TRUE(client_.RequestWellknown(server.URL("/")).isNull()) << body;
        EXPECT_THAT(TakeSystemLog(), ElementsAre(Logged("bad wellknown json format."))) << body;
    }
}

TEST_F(ProviderExchange, LogsOneLineIfConnectionIsRefused) {
    const Port closed;
    const std::string url = "https://127.0.0.1:" + std::to_string(closed.number()) + "/";
    const std::string refused = curl_easy_strerror(CURLE_COULDNT_CONNECT);
    EXPECT_EQ(client_.RequestToken(url), "before ");
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Logged("request token uri " + refused + ".")));
    EXPECT_TRUE(client_.RequestWellknown(url).isNull());
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Logged(refused)));
}

}  // namespace

}  // namespace Test
