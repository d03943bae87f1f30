#include "tests/support/interposed/memory.h"

#include <curl/curl.h>
#include <gtest/gtest.h>
#include <openssl/err.h>

#include <algorithm>
#include <iostream>
#include <limits>
#include <regex>
#include <string>
#include <tuple>
#include <vector>

#include "tests/faults/scenario.h"
#include "tests/support/system_log.h"

// Makes each request for memory fail during one use of the library, including those of other libraries.
namespace Test {

namespace {

using ::testing::Combine;
using ::testing::Values;
using ::testing::ValuesIn;

using Of = FailingAllocation::Of;
using Until = FailingAllocation::Until;

constexpr char kFailures[] =
    R"(throws (std::bad_alloc: std::bad_alloc|std::logic_error: empty jwt part)"
    R"(|std::invalid_argument: (parse json falied|kid does not exist in Azure verified kyes))"
    R"(|TAVO::SSO::sso_op_failed: (read profile file|encode base64|TAVOWinsUserNameFqdn2Netbios) failed\.)"
    R"(|TAVO::JWT::jwt_verify_failed: verify (rsa|hmac) signature failed))"
    R"((, the result is (Alice|CORP\.EXAMPLE\\Alice|on, ))?)";  // userName is changed in steps

/// libcurl's texts for transfers that run out of memory, as a regular expression.
std::string TransferFailures() {
    std::string texts;
    for (const CURLcode result :
         {CURLE_OUT_OF_MEMORY, CURLE_COULDNT_RESOLVE_HOST, CURLE_WRITE_ERROR, CURLE_URL_MALFORMAT}) {
        texts += (texts.empty() ? "" : "|") + std::string(curl_easy_strerror(result));
    }
    return "(" + texts + ")";
}

/// Failed requests. A received answer is never reported as malformed because memory ran out.
std::string FailedRequests() {
    return R"(sso:N (bad_alloc\. .*|(request token uri )?)" + TransferFailures() + R"(\.?))" +
           R"(|azuresso:N (curl_easy_init failed\. .*|request wellknown uri )" + TransferFailures() + R"(\.))";
}

std::string LogLines() {
    return FailedRequests() + R"(|jwt:N EVP_(PKEY_assign_RSA|DigestVerify(Init|Update|Final)) failed)" +
           R"(|utils:N (calloc failed\.|MD5 digest failed) .*)" +
           R"(|platform:N memory ran out, or domains\.conf is nested too deeply)";
}

struct Trial {
    std::string ending;
    std::vector<LogLine> log;
    bool ranOut;
};

class ExhaustedMemory : public ::testing::TestWithParam<std::tuple<Scenario, Of, Until>> {
  protected:
    static Trial Try(int n) {
        const auto &[scenario, of, until] = GetParam();
        const Use use = scenario.prepare();
        Ending ending{scenario.before, nullptr};
        FailingAllocation failing(n, of, until);
        ::Test::Run(use, ending);
        failing.Stop();
        return {Describe(scenario, ending), TakeSystemLog(), failing.Happened()};
    }

    static std::string Documented() {
        const char *mayReturn = std::get<0>(GetParam()).mayReturn;
        return mayReturn == nullptr ? kFailures : std::string(kFailures) + "|returns (" + mayReturn + ")";
    }
};

TEST_P(ExhaustedMemory, FailsAsDocumentedAndNextUseSucceeds) {
    const std::regex documented(Documented());
    const std::regex logged(LogLines());
    const std::regex failedRequest(FailedRequests());
    const Trial healthy = Try(std::numeric_limits<int>::max());
    ASSERT_FALSE(healthy.ranOut);
    int n = 1;
    for (Trial trial = Try(n); trial.ranOut; trial = Try(++n)) {
        SCOPED_TRACE("request " + std::to_string(n));
        EXPECT_TRUE(std::regex_match(trial.ending, documented)) << trial.ending;
        for (const LogLine &line : trial.log) {
            EXPECT_TRUE(std::regex_match(line.text, logged)) << line.text;
        }
        if (trial.ending.find("parse json falied") != std::string::npos ||
            trial.ending.find("kid does not exist") != std::string::npos) {
            EXPECT_TRUE(std::any_of(trial.log.begin(), trial.log.end(),
                                    [&](const LogLine &line) { return std::regex_match(line.text, failedRequest); }));
        }
        EXPECT_EQ(ERR_peek_error(), 0UL);
        EXPECT_EQ(Try(std::numeric_limits<int>::max()).ending, healthy.ending);
    }
    std::cout << n - 1 << " requests for memory\n";
    EXPECT_GT(n, 10);
}

std::string NameOf(const ::testing::TestParamInfo<ExhaustedMemory::ParamType> &row) {
    return std::string(std::get<0>(row.param).name) + (std::get<2>(row.param) == Until::kNext ? "Once" : "ForGood");
}

INSTANTIATE_TEST_SUITE_P(During, ExhaustedMemory,
                         Combine(ValuesIn(Scenarios()), Values(Of::kCxx), Values(Until::kNext, Until::kEver)), NameOf);
INSTANTIATE_TEST_SUITE_P(ForAllLibrariesDuring, ExhaustedMemory,
                         Combine(ValuesIn(PlainLogins()), Values(Of::kEveryone), Values(Until::kNext, Until::kEver)),
                         NameOf);

}  // namespace

}  // namespace Test
