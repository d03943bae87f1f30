#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

#include "tests/support/command_output.h"
#include "tests/support/files.h"

namespace Test {

namespace {

using testing::AllOf;
using testing::Each;
using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;
using testing::StartsWith;

using Lines = std::vector<std::string>;

constexpr char kKnownName[] = R"( --lookup 'CORP.EXAMPLE.NET\alice=ACME\alice')";

struct Findings {
    int status;
    std::string output;  // also of standard error

    Lines LinesWith(const std::string &mark) const {
        Lines lines;
        std::istringstream stream(output);
        for (std::string line; std::getline(stream, line);) {
            if (line.rfind(mark, 0) == 0) {
                lines.push_back(line.substr(mark.size()));
            }
        }
        return lines;
    }
    Lines Kept() const { return LinesWith("ok      "); }
    Lines Broken() const { return LinesWith("BROKEN  "); }
    Lines Skipped() const { return LinesWith("skipped "); }
};

std::string Library(const std::string &name) { return TAVOSSO_BROKEN_LIBRARIES "/" + name + ".so"; }

Findings RunCheck(const std::string &arguments) {
    // AddressSanitizer's dlopen ignores the run path of the program.
    const CommandResult result =
        RunShell("LD_LIBRARY_PATH=" TAVOSSO_LIBRARIES " " TAVOSSO_PLATFORM_CHECK " " + arguments + " 2>&1");
    return {result.status, result.output};
}

class PlatformCheck : public testing::Test {
  protected:
    void SetUp() override {
        RemoveFiles();
        WriteFile(kDomainTable, R"({"corp.example.net": "ACME"})");
    }
};

TEST_F(PlatformCheck, FindsAllPromisesKeptByStandin) {
    const Findings run = RunCheck(kKnownName);
    EXPECT_EQ(run.status, 0) << run.output;
    EXPECT_THAT(run.Broken(), IsEmpty());
    EXPECT_THAT(run.Skipped(), IsEmpty());
    const Lines kept = run.Kept();
    for (const char *function :
         {"TavoCgiURLEncode: ", "TLIBCBase64SzEncodeFull: ", "TLIBCBase64Decode: ", "TAVOWinsUserNameFqdn2Netbios: "}) {
        EXPECT_THAT(kept, Contains(StartsWith(function)));
    }
    const std::string count = std::to_string(kept.size());
    EXPECT_THAT(run.output, EndsWith(count + " promises: " + count + " kept, 0 broken, 0 skipped\n"));
}

TEST_F(PlatformCheck, ChecksGivenLibrary) {
    const Findings run = RunCheck(TAVOSSO_STANDIN + std::string(kKnownName));
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.output, RunCheck(kKnownName).output);
}

TEST_F(PlatformCheck, SkipsConversionsWithoutLookup) {
    const Findings run = RunCheck("");
    EXPECT_EQ(run.status, 0) << run.output;
    EXPECT_THAT(run.Broken(), IsEmpty());
    EXPECT_THAT(
        run.Skipped(),
        AllOf(Not(IsEmpty()), Each(AllOf(StartsWith("TAVOWinsUserNameFqdn2Netbios: "), HasSubstr("needs --lookup")))));
}

TEST_F(PlatformCheck, ReportsUnexpectedConversion) {
    const Findings run = RunCheck(R"(--lookup 'CORP.EXAMPLE.NET\alice=OTHER\alice')");
    EXPECT_EQ(run.status, 1);
    EXPECT_THAT(run.Broken(), Contains(AllOf(StartsWith("TAVOWinsUserNameFqdn2Netbios: converts the name of --lookup"),
                                             HasSubstr(R"(expected "OTHER\\alice", found "ACME\\alice")"))));
}

TEST_F(PlatformCheck, FindsFunctionsInSeveralLibraries) {
    const Findings run = RunCheck(Library("decode_is_missing") + " " TAVOSSO_STANDIN);
    EXPECT_EQ(run.status, 1);
    EXPECT_THAT(run.Broken(), AllOf(Not(IsEmpty()), Each(Not(StartsWith("TLIBCBase64Decode: ")))));
    EXPECT_THAT(run.Kept(), Contains(StartsWith("TLIBCBase64Decode: decodes")));
}

TEST_F(PlatformCheck, RequiresLibraryThatCanBeLoaded) {
    const Findings missing = RunCheck("/no/such/library.so");
    EXPECT_EQ(missing.status, 2);
    EXPECT_THAT(missing.output,
                StartsWith("tavosso-platform-check: the platform cannot be loaded: /no/such/library.so:"));
    const Findings crashing = RunCheck(Library("crashes_when_loaded"));
    EXPECT_EQ(crashing.status, 2);
    EXPECT_EQ(crashing.output, "tavosso-platform-check: the platform cannot be loaded: SIGABRT\n");
}

TEST_F(PlatformCheck, RequiresAllFunctions) {
    const Findings run = RunCheck(Library("decode_is_missing"));
    EXPECT_EQ(run.status, 2);
    EXPECT_EQ(run.output,
              "tavosso-platform-check: the platform cannot be loaded: no library defines TLIBCBase64Decode\n");
}

TEST_F(PlatformCheck, RejectsInvalidArguments) {
    for (const char *arguments :
         {"--no-such-option", "--timeout 0", "--lookup alice", "--lookup ''", R"(--lookup 'CORP.EXAMPLE.NET\alice')",
          R"(--lookup 'CORP.EXAMPLE.NET\=ACME\alice')", R"(--lookup 'CORP.EXAMPLE.NET\alice=alice')"}) {
        const Findings run = RunCheck(arguments);
        EXPECT_EQ(run.status, 2) << arguments;
        EXPECT_THAT(run.Kept(), IsEmpty()) << arguments;
    }
}

TEST_F(PlatformCheck, PrintsVersionAndHelp) {
    const Findings version = RunCheck("--version");
    EXPECT_EQ(version.status, 0);
    EXPECT_THAT(version.output, testing::MatchesRegex("tavosso-platform-check [0-9]+\\.[0-9]+\\.[0-9]+\n"));
    const Findings help = RunCheck("--help");
    EXPECT_EQ(help.status, 0);
    EXPECT_THAT(help.output, AllOf(HasSubstr("LIBRARY"), HasSubstr("--lookup"), HasSubstr("--timeout"),
                                   HasSubstr("Examples:\n  tavosso-platform-check ")));
}

struct Defect {
    const char *library;
    const char *promise;
    const char *reason;
};

void PrintTo(const Defect &defect, std::ostream *stream) { *stream << defect.library; }

constexpr Defect kDefects[] = {
    {"url_copies_ampersand", "TavoCgiURLEncode: encodes each byte", R"("&" is not escaped)"},
    {"url_counts_nul", "TavoCgiURLEncode: fills the buffer up to its usable size", "size 0) fails"},
    {"url_clears_too_much", "TavoCgiURLEncode: writes only to its buffer",
     "access beyond the end of dst in TavoCgiURLEncode("},
    {"url_crashes_on_null", "TavoCgiURLEncode: rejects null pointers", "SIGSEGV in TavoCgiURLEncode(null"},
    {"base64_breaks_lines", "TLIBCBase64SzEncodeFull: encodes up to 765 bytes on one line", R"(\x0a)"},
    {"base64_omits_nul", "TLIBCBase64SzEncodeFull: rejects a text without room for its NUL",
     "succeeds without room for the NUL"},
    {"decode_adds_padding", "TLIBCBase64Decode: rejects missing padding", R"("Zm8", size 1024) succeeds)"},
    {"decode_clears_length", "TLIBCBase64Decode: leaves dst and len_inout untouched on failure",
     "fails and sets len_inout to 0"},
    {"decode_requires_nul", "TLIBCBase64Decode: only reads its len characters",
     "access beyond the end of src in TLIBCBase64Decode("},
    {"decode_hangs_on_space", "TLIBCBase64Decode: rejects line feeds and blanks",
     R"(no answer within 5 s in TLIBCBase64Decode("\x0aZm9v")"},
    {"lookup_logs_nothing", "TAVOWinsUserNameFqdn2Netbios: logs one line for each rejected name", "logs 0 lines"},
    {"lookup_logs_name", "TAVOWinsUserNameFqdn2Netbios: logs no control character of a name", R"(A\x0aB)"},
    {"lookup_leaves_child", "TAVOWinsUserNameFqdn2Netbios: leaves the process unchanged",
     "new: a child process that was not waited for"},
    {"lookup_leaves_descriptor", "TAVOWinsUserNameFqdn2Netbios: leaves the process unchanged", "new: descriptor "},
    {"lookup_throws", "TAVOWinsUserNameFqdn2Netbios: rejects null pointers", "an exception leaves the function"},
    {"lookup_truncates", "TAVOWinsUserNameFqdn2Netbios: rejects a result that does not fit, with one log line",
     "returns 0"},
};

class BrokenLibrary : public PlatformCheck, public testing::WithParamInterface<Defect> {};

TEST_P(BrokenLibrary, BreaksOnlyOnePromise) {
    const Findings run = RunCheck(Library(GetParam().library) + kKnownName + " --timeout 5");
    EXPECT_EQ(run.status, 1);
    EXPECT_THAT(run.Broken(),
                ElementsAre(AllOf(StartsWith(GetParam().promise + std::string(": ")), HasSubstr(GetParam().reason))));
    EXPECT_THAT(run.Skipped(), IsEmpty());
    EXPECT_THAT(run.output, EndsWith(" kept, 1 broken, 0 skipped\n"));
}

INSTANTIATE_TEST_SUITE_P(All, BrokenLibrary, testing::ValuesIn(kDefects),
                         [](const auto &defect) { return defect.param.library; });

}  // namespace

}  // namespace Test
