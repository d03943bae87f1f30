#include "tests/support/interposed/calls.h"

#include <curl/curl.h>
#include <dirent.h>
#include <dlfcn.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <openssl/err.h>

#include <algorithm>
#include <boost/algorithm/string/replace.hpp>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <map>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "sso/sso.h"
#include "tests/faults/call_table.h"
#include "tests/faults/scenario.h"
#include "tests/support/command_output.h"
#include "tests/support/interposed/process.h"
#include "tests/support/system_log.h"

// Makes each call of the library fail, one at a time, and compares the outcome with a table.

/// A leak of Boost 1.74, documented in call_table.h at getrandom.
extern "C" const char *__lsan_default_suppressions() { return "leak:boost::uuids::basic_random_generator"; }

namespace Test {

namespace {

namespace fs = std::filesystem;

/// The outcome of one use of the library, without a failure or with one failing call.
struct Trial {
    std::string ending;
    std::vector<LogLine> log;
    std::map<std::string, int> calls;
};

std::string DescribeIDs() {
    const bool restored = EffectiveUID() == kUser && EffectiveGID() == kGroup;
    return restored ? ""
                    : ", the process stays user " + std::to_string(EffectiveUID()) + " of group " +
                          std::to_string(EffectiveGID());
}

Trial Try(const Scenario &scenario, const std::string &function = "", int n = 0) {
    const Use use = scenario.prepare();
    Ending ending{scenario.before, nullptr};
    SetEffectiveIDs(kUser, kGroup);
    FailNothing();
    if (n > 0) {
        FailCall(function, n);
    }
    Run(use, ending);
    Trial trial{Describe(scenario, ending) + DescribeIDs(), TakeSystemLog(), CallCounts()};
    FailNothing();
    RestoreProcess();
    return trial;
}

/// Replaces libcurl's texts, which differ between versions, by their numbers.
std::string NumberTransferErrors(std::string text) {
    std::map<std::string, int, std::greater<>> codes;  // a text before its own beginning
    for (int code = CURL_LAST - 1; code > CURLE_OK; --code) {
        codes[curl_easy_strerror(static_cast<CURLcode>(code))] = code;
    }
    for (const auto &[words, code] : codes) {
        boost::replace_all(text, words, "libcurl's error " + std::to_string(code));
    }
    return text;
}

/// The ending, and what was logged. Where that begins with the usual lines, only the others.
std::string Describe(const Trial &trial, const std::vector<LogLine> &usualLog) {
    std::ostringstream text;
    text << trial.ending << "\n";
    const bool usual =
        std::equal(usualLog.begin(), usualLog.end(), trial.log.begin(),
                   trial.log.begin() + static_cast<std::ptrdiff_t>(std::min(usualLog.size(), trial.log.size())));
    for (std::size_t i = usual ? usualLog.size() : 0; i < trial.log.size(); ++i) {
        text << (usual ? "    " : "    only ") << trial.log[i] << "\n";
    }
    return NumberTransferErrors(text.str());
}

/// Includes the descriptor of this directory iterator.
std::ptrdiff_t OpenDescriptors() {
    return std::distance(fs::directory_iterator("/proc/self/fd"), fs::directory_iterator());
}

void ExpectEverythingReleased(const Trial &trial, const std::string &failing) {
    std::map<std::string, int> calls = trial.calls;
    EXPECT_EQ(calls["curl_easy_init"], calls["curl_easy_cleanup"]);  // also called with a null handle
    EXPECT_EQ(calls["fopen"] - (failing == "fopen" ? 1 : 0), calls["fclose"]);
    EXPECT_EQ(ERR_peek_error(), 0UL) << "OpenSSL's error queue is not empty";
}

/// Makes one call fail, and then repeats the use without failure.
std::string TryOne(const Scenario &scenario, const Trial &healthy, const std::string &function, int n) {
    SCOPED_TRACE(function + " " + std::to_string(n));
    const std::ptrdiff_t descriptors = OpenDescriptors();
    const Trial trial = Try(scenario, function, n);
    ExpectEverythingReleased(trial, function);
    EXPECT_EQ(OpenDescriptors(), descriptors);
    const Trial next = Try(scenario);
    EXPECT_EQ(next.ending, healthy.ending);
    EXPECT_EQ(next.log, healthy.log);
    return Describe(trial, healthy.log);
}

/// Lines "FUNCTION N: outcome"; "FUNCTION N to M" for consecutive calls with the same outcome.
std::string TryEachCall(const Scenario &scenario) {
    const Trial healthy = Try(scenario);
    std::string table = "nothing: " + Describe(healthy, {});
    for (const auto &[function, calls] : healthy.calls) {
        if (function == "curl_easy_cleanup" || function == "curl_global_cleanup") {
            continue;  // counted only; has no result
        }
        std::vector<std::string> outcomes;
        for (int n = 1; n <= calls; ++n) {
            outcomes.push_back(TryOne(scenario, healthy, function, n));
        }
        if (function == "getrandom") {
            EXPECT_THAT(outcomes, testing::Each(testing::AnyOf(testing::StartsWith("throws boost::wrapexcept<"),
                                                               testing::StartsWith("throws std::runtime_error"))));
            table += "getrandom, each: throws a std::runtime_error\n";
            continue;  // versions of Boost read different amounts and throw different classes
        }
        for (std::size_t first = 0, last = 0; first < outcomes.size(); first = last + 1) {
            last = first;
            while (last + 1 < outcomes.size() && outcomes[last + 1] == outcomes[first]) {
                ++last;
            }
            table += function + " " + std::to_string(first + 1) +
                     (last > first ? " to " + std::to_string(last + 1) : "") + ": " + outcomes[first];
        }
    }
    return table;
}

std::string Read(const fs::path &path) {
    std::ifstream file(path);
    return {std::istreambuf_iterator<char>(file), {}};
}

class FailingCall : public ::testing::TestWithParam<Scenario> {};

TEST_P(FailingCall, MatchesOutcomeTable) {
    const std::string table = TryEachCall(GetParam());
    const std::string file = std::string(GetParam().name) + ".txt";
    std::ofstream(TAVOSSO_OUTCOMES_FOUND "/" + file) << table;
    EXPECT_EQ(table, Read(TAVOSSO_OUTCOMES "/" + file))
        << "the actual outcomes are in " TAVOSSO_OUTCOMES_FOUND "/" << file;
}

INSTANTIATE_TEST_SUITE_P(Of, FailingCall, ::testing::ValuesIn(Scenarios()),
                         [](const auto &row) { return row.param.name; });

/// The undefined symbols of the library, without those of C++ and of sanitizers.
std::set<std::string> UndefinedSymbols() {
    Dl_info library;
    EXPECT_NE(dladdr(reinterpret_cast<void *>(TAVO::SSO::OIDCLogin), &library), 0);
    const std::string command = std::string("nm -D --undefined-only --format=just-symbols ") + library.dli_fname;
    std::istringstream lines(OutputOf(command));
    std::set<std::string> names;
    for (std::string line; std::getline(lines, line);) {
        const std::string symbol = line.substr(0, line.find('@'));
        if (symbol.rfind("_Z", 0) != 0 && symbol.rfind("__asan", 0) != 0 && symbol.rfind("__ubsan", 0) != 0) {
            names.insert(symbol);
        }
    }
    return names;
}

TEST(CallTable, ListsEachFunctionTheLibraryCalls) {
    std::set<std::string> rows;
    for (const CalledFunction &function : kCalledFunctions) {
        rows.insert(function.name);
    }
    const std::set<std::string> called = UndefinedSymbols();
    EXPECT_THAT(called, ::testing::Contains("curl_easy_perform"));
    std::set<std::string> withoutRow;
    std::set_difference(called.begin(), called.end(), rows.begin(), rows.end(),
                        std::inserter(withoutRow, withoutRow.end()));
    EXPECT_THAT(withoutRow, ::testing::IsEmpty());
}

TEST(CallTable, CoversEachCallThatCanFail) {
    std::set<std::string> seen;
    for (const Scenario &scenario : Scenarios()) {
        for (const auto &[function, calls] : Try(scenario).calls) {
            seen.insert(function);
        }
    }
    for (const CalledFunction &function : kCalledFunctions) {
        if (function.whyItCannotFail == nullptr) {
            EXPECT_THAT(seen, ::testing::Contains(function.name));
        }
    }
}

}  // namespace

}  // namespace Test
