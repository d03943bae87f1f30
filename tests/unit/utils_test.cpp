#include <openssl/err.h>

#include <cerrno>
#include <cstring>
#include <new>

#include "sso/sso.h"
#include "tests/support/interposed/calls.h"
#include "tests/support/interposed/platform_calls.h"
#include "tests/support/interposed/process.h"
#include "tests/support/interposed/transport.h"
#include "tests/support/openssl_errors.h"
#include "tests/unit/fixture.h"

namespace Test {

namespace {

using namespace TAVO::SSO;
using testing::Contains;
using testing::ElementsAre;

constexpr char kURL[] = "https://provider.example/";

std::size_t Append(char *data, std::size_t size, std::size_t count, void *response) {
    static_cast<std::string *>(response)->append(data, size * count);
    return size * count;
}

class Transfer : public Library {};

TEST_F(Transfer, SetsExactOptionsForGet) {
    CurrentTransport().answers[kURL] = Whole("answer");
    std::string response;
    httpGet(kURL, response, true, Append);
    EXPECT_EQ(response, "answer");
    EXPECT_THAT(
        CurrentTransport().calls,
        ElementsAre("curl_global_init 3", "curl_easy_init", "curl_easy_setopt CURLOPT_URL https://provider.example/",
                    "curl_easy_setopt CURLOPT_WRITEFUNCTION", "curl_easy_setopt CURLOPT_WRITEDATA", "curl_easy_perform",
                    "curl_easy_cleanup", "curl_global_cleanup"));
}

TEST_F(Transfer, SetsExactOptionsForPost) {
    CurrentTransport().answers[kURL] = Whole("answer");
    std::string response;
    httpPost(kURL, "a=b&c=%20", response, true, Append);
    EXPECT_EQ(response, "answer");
    EXPECT_THAT(
        CurrentTransport().calls,
        ElementsAre("curl_global_init 3", "curl_easy_init", "curl_easy_setopt CURLOPT_URL https://provider.example/",
                    "curl_easy_setopt CURLOPT_POSTFIELDS a=b&c=%20", "curl_easy_setopt CURLOPT_WRITEFUNCTION",
                    "curl_easy_setopt CURLOPT_WRITEDATA", "curl_easy_perform", "curl_easy_cleanup",
                    "curl_global_cleanup"));
}

TEST_F(Transfer, SetsEmptyBodyForPost) {
    CurrentTransport().answers[kURL] = Whole("");
    std::string response;
    httpPost(kURL, "", response, true, Append);
    EXPECT_THAT(CurrentTransport().calls, testing::Contains("curl_easy_setopt CURLOPT_POSTFIELDS "));
}

TEST_F(Transfer, DisablesHostCheckBeforePeerCheck) {
    CurrentTransport().answers[kURL] = Whole("");
    std::string response;
    httpGet(kURL, response, false, Append);
    EXPECT_THAT(
        CurrentTransport().calls,
        ElementsAre("curl_global_init 3", "curl_easy_init", "curl_easy_setopt CURLOPT_URL https://provider.example/",
                    "curl_easy_setopt CURLOPT_WRITEFUNCTION", "curl_easy_setopt CURLOPT_WRITEDATA",
                    "curl_easy_setopt CURLOPT_SSL_VERIFYHOST 0", "curl_easy_setopt CURLOPT_SSL_VERIFYPEER 0",
                    "curl_easy_perform", "curl_easy_cleanup", "curl_global_cleanup"));
    ResetTransport();
    CurrentTransport().answers[kURL] = Whole("");
    httpPost(kURL, "a=b", response, false, Append);
    EXPECT_THAT(CurrentTransport().calls, testing::IsSupersetOf({"curl_easy_setopt CURLOPT_SSL_VERIFYHOST 0",
                                                                 "curl_easy_setopt CURLOPT_SSL_VERIFYPEER 0"}));
}

TEST_F(Transfer, ThrowsLibcurlTextAfterCleanup) {
    CurrentTransport().answers[kURL] = {CURLE_PEER_FAILED_VERIFICATION, {}};
    std::string response;
    EXPECT_EQ(FailureOf([&] { httpGet(kURL, response, true, Append); }),
              Fails<sso_err_resp>(curl_easy_strerror(CURLE_PEER_FAILED_VERIFICATION)));
    EXPECT_EQ(FailureOf([&] { httpPost("http://unreachable.example/", "", response, true, Append); }),
              Fails<sso_err_resp>(curl_easy_strerror(CURLE_COULDNT_CONNECT)));
    const auto &calls = CurrentTransport().calls;
    EXPECT_EQ(std::vector<std::string>(calls.end() - 3, calls.end()),
              (std::vector<std::string>{"curl_easy_perform", "curl_easy_cleanup", "curl_global_cleanup"}));
}

TEST_F(Transfer, ThrowsBadAllocWithoutHandleAfterCleanup) {
    CurrentTransport().noHandle = true;
    std::string response;
    EXPECT_THROW(httpGet(kURL, response, true, Append), std::bad_alloc);
    EXPECT_THROW(httpPost(kURL, "", response, true, Append), std::bad_alloc);
    EXPECT_THAT(CurrentTransport().calls,
                ElementsAre("curl_global_init 3", "curl_easy_init", "curl_easy_cleanup", "curl_global_cleanup",
                            "curl_global_init 3", "curl_easy_init", "curl_easy_cleanup", "curl_global_cleanup"));
}

TEST_F(Transfer, LeavesResponseToCallback) {
    CurrentTransport().answers[kURL] = Whole("answer");
    std::string response = "earlier ";
    httpGet(kURL, response, true, Append);
    EXPECT_EQ(response, "earlier answer");
}

class Encoding : public Library {};

TEST_F(Encoding, EscapesAllButUnreservedCharacters) {
    EXPECT_EQ(URLEncode("https://a.example/b?c=d e&f"), "https%3A%2F%2Fa.example%2Fb%3Fc%3Dd%20e%26f");
    EXPECT_EQ(URLEncode("A-z_0.9~"), "A-z_0.9~");
    EXPECT_EQ(URLEncode(""), "");
}

TEST_F(Encoding, EscapesEveryByteOfValue) { EXPECT_EQ(URLEncode("&=\xc3\xa4"), "%26%3D%C3%A4"); }

TEST_F(Encoding, PassesThreeTimesTheLengthToEncoder) {
    Platform platform;
    platform.urlEncode = [](const char *src, char *dst, std::size_t size) {
        EXPECT_EQ(size, 3 * std::strlen(src));
        EXPECT_EQ(std::string(dst, size + 1), std::string(size + 1, '\0'));
        std::fill_n(dst, size, 'x');
        return 0;
    };
    ReplacePlatform(platform);
    EXPECT_EQ(URLEncode("four"), "xxxxxxxxxxxx");
    EXPECT_EQ(URLEncode(std::string(1000, 'a')), std::string(3000, 'x'));
}

TEST_F(Encoding, ReturnsValueUnchangedIfEncoderFails) {
    Platform platform;
    platform.urlEncode = [](const char *, char *dst, std::size_t) {
        *dst = 'x';
        return -1;
    };
    ReplacePlatform(platform);
    EXPECT_EQ(URLEncode("a b"), "a b");
}

TEST_F(Encoding, ReturnsValueUnchangedWithoutMemory) {
    FailCall("calloc");
    EXPECT_EQ(URLEncode("a b"), "a b");
}

TEST_F(Encoding, TreatsNonZeroResultOfEncoderAsFailure) {
    Platform platform;
    platform.urlEncode = [](const char *, char *, std::size_t) { return 1; };
    ReplacePlatform(platform);
    EXPECT_EQ(URLEncode("a b"), "a b");
}

TEST_F(Encoding, EncodesUpToFirstNUL) { EXPECT_EQ(URLEncode(std::string("a b\0c d", 7)), "a%20b"); }

TEST_F(Encoding, OverwritesEncodedTextBeforeRelease) {
    TakeCleansed();
    URLEncode("a secret");
    EXPECT_THAT(TakeCleansed(), Contains(testing::StartsWith("a%20secret")));
}

TEST_F(Encoding, ComputesStandardMD5Digests) {
    EXPECT_EQ(MD5Digest(""), "d41d8cd98f00b204e9800998ecf8427e");
    EXPECT_EQ(MD5Digest("message digest"), "f96b697d7cb7938d525a2f31aaf161d0");
}

TEST_F(Encoding, IncludesBytesAfterNULInMD5) {
    EXPECT_EQ(MD5Digest(std::string("\0", 1)), "93b885adfe0da089cdf634904fd59f71");
    EXPECT_NE(MD5Digest(std::string("a\0b", 3)), MD5Digest("a"));
}

TEST_F(Encoding, KeepsErrorQueueOfHostInMD5) {
    const auto hostFails = [] { ERR_raise(ERR_LIB_USER, 1); };
    ERR_clear_error();
    hostFails();
    const std::vector<std::string> before = TakeErrorQueue();
    hostFails();
    MD5Digest("text");
    EXPECT_EQ(TakeErrorQueue(), before);
}

TEST_F(Encoding, LogsFailedMD5AndReturnsEmptyString) {
    ERR_clear_error();
    FailCall("MD5");
    errno = EPERM;
    EXPECT_EQ(MD5Digest("text"), "");
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("utils:N MD5 digest failed Operation not permitted")));
    EXPECT_EQ(TakeErrorQueue(), std::vector<std::string>());
}

TEST_F(Encoding, LogsFailedAllocationInMD5) {
    FailCall("calloc");
    EXPECT_EQ(MD5Digest("text"), "");
    EXPECT_THAT(TakeSystemLog(), ElementsAre(Error("utils:N calloc failed. Cannot allocate memory")));
}

}  // namespace

}  // namespace Test
