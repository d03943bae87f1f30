#include "tests/interposed/memory.h"

#include <gtest/gtest.h>
#include <openssl/err.h>

#include <iostream>
#include <limits>
#include <regex>
#include <string>
#include <tuple>
#include <vector>

#include "tests/faults/scenario.h"
#include "tests/support/system_log.h"

// Lets memory run out at each request for it that one use of the library makes, its own requests and those of the
// libraries that it calls.
namespace Test {

namespace {

using ::testing::Combine;
using ::testing::Values;
using ::testing::ValuesIn;

using Of = FailingAllocation::Of;
using Until = FailingAllocation::Until;

constexpr char kFailures[] =
    R"(throws (std::bad_alloc: std::bad_alloc|std::logic_error: empty jwt part)"
    R"(|std::invalid_argument: (parse json falied|bad jwt (header|body) format!)"
    R"(|kid does not exist in Azure verified kyes))"
    R"(|TAVO::SSO::sso_op_failed: (read profile file|encode base64|TAVOWinsUserNameFqdn2Netbios) failed\.)"
    R"(|TAVO::JWT::jwt_verify_failed: verify (rsa|hmac) signature failed))"
    R"((, the result is (Alice|CORP\.EXAMPLE\\Alice|on, ))?)";  // written step by step

constexpr char kLogLines[] =
    R"(sso:N (bad_alloc\. .*|request token uri .*\.|bad wellknown json format\.|Out of memory|Couldn't resolve host name)"
    R"(|Failed writing received data to disk/application|URL using bad/illegal format or missing URL))"
    R"(|azuresso:N (curl_easy_init failed\. .*|request wellknown uri .*\.))"
    R"(|jwt:N EVP_(PKEY_assign_RSA|DigestVerify(Init|Update|Final)) failed)"
    R"(|utils:N (calloc failed\.|MD5 digest failed) .*)"
    R"(|platform:N memory ran out, or domains\.conf is nested too deeply)";

struct Trial {
    std::string ending;
    std::vector<LogLine> log;
    bool ranOut;
};

class MemoryThatRunsOut : public ::testing::TestWithParam<std::tuple<Scenario, Of, Until>> {
  protected:
    static Trial Try(int n) {
        const auto &[scenario, of, until] = GetParam();
        const Use use = scenario.makeReady();
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

TEST_P(MemoryThatRunsOut, EndsAsIsDocumentedAndLeavesTheNextUseAlone) {
    const std::regex documented(Documented());
    const std::regex logged(kLogLines);
    const Trial healthy = Try(std::numeric_limits<int>::max());
    ASSERT_FALSE(healthy.ranOut);
    int n = 1;
    for (Trial trial = Try(n); trial.ranOut; trial = Try(++n)) {
        SCOPED_TRACE("request " + std::to_string(n));
        EXPECT_TRUE(std::regex_match(trial.ending, documented)) << trial.ending;
        for (const LogLine &line : trial.log) {
            EXPECT_TRUE(std::regex_match(line.text, logged)) << line.text;
        }
        EXPECT_EQ(ERR_peek_error(), 0UL);
        EXPECT_EQ(Try(std::numeric_limits<int>::max()).ending, healthy.ending);
    }
    std::cout << n - 1 << " requests for memory\n";
    EXPECT_GT(n, 10);
}

std::string NameOf(const ::testing::TestParamInfo<MemoryThatRunsOut::ParamType> &row) {
    return std::string(std::get<0>(row.param).name) + (std::get<2>(row.param) == Until::kNext ? "Once" : "ForGood");
}

INSTANTIATE_TEST_SUITE_P(During, MemoryThatRunsOut,
                         Combine(ValuesIn(Scenarios()), Values(Of::kCxx), Values(Until::kNext, Until::kEver)), NameOf);
INSTANTIATE_TEST_SUITE_P(ForAllLibrariesDuring, MemoryThatRunsOut,
                         Combine(ValuesIn(PlainLogins()), Values(Of::kEveryone), Values(Until::kNext, Until::kEver)),
                         NameOf);

}  // namespace

}  // namespace Test
