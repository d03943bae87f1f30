#include <gmock/gmock.h>

#include <string>

#include "tests/doctor/appliance.h"
#include "tests/doctor/doctor_process.h"
#include "tests/support/files.h"

// What editors do to the files. Each break is named, with line and column.
namespace Test {

namespace {

using ::testing::HasSubstr;
using ::testing::IsEmpty;

struct TextRow {
    std::string name;
    std::string content;
    std::string found;
    std::string remedy;
};

void PrintTo(const TextRow &row, std::ostream *stream) { *stream << row.name; }

class BrokenText : public ::testing::TestWithParam<TextRow> {};

const std::string kUTF16 = std::string("\xff\xfe{\0\n\0}\0", 8);

INSTANTIATE_TEST_SUITE_P(
    Doctor, BrokenText,
    ::testing::Values(TextRow{"Empty", "", "profile.conf is empty", "Write the file"},
                      TextRow{"Blank", " \n", "profile.conf is empty", "Write the file"},
                      TextRow{"ByteOrderMark", "\xef\xbb\xbf{\"sso_enable\": true}",
                              "begins with a byte-order mark, at line 1, column 1", "Save the file as UTF-8"},
                      TextRow{"UTF16", kUTF16, "is UTF-16 or binary, from line 1, column 1", "Save the file as UTF-8"},
                      TextRow{"TrailingComma", "{\n  \"sso_enable\": true,\n}",
                              "line 2, column 21: comma after the last member", "Remove the comma."},
                      TextRow{"SingleQuotes", "{\n  'sso_enable': true\n}", "line 2, column 3: single quote",
                              "double quotation mark"},
                      TextRow{"SmartQuotes", "{\n  \"a\": \"\xc3\xa4\", \xe2\x80\x9csso_enable\xe2\x80\x9d: true\n}",
                              "line 2, column 13: smart quote outside a string", "ordinary quotation mark"},
                      TextRow{"NoBreakSpace", "{\n\xc2\xa0\"sso_enable\": true\n}",
                              "line 2, column 1: no-break space outside a string", "ordinary blank"},
                      TextRow{"CommentBeforeQuote", "{ // it's\n  /* isn't */ 'a': 1}",
                              "line 2, column 15: single quote", "double quotation mark"}),
    [](const auto &row) { return row.param.name; });

TEST_P(BrokenText, IsNamed) {
    const Appliance appliance(Profile::kAzure);
    WriteFile(kProfileFile, GetParam().content);
    const Check finding = OnlyFinding();
    EXPECT_EQ(finding.id, "profile.file");
    EXPECT_THAT(finding.found, HasSubstr(GetParam().found));
    EXPECT_THAT(finding.remedy, HasSubstr(GetParam().remedy));
    EXPECT_EQ(finding.library, "read profile file failed.");
}

TEST(Text, ReportsRepeatedKey) {
    const Appliance appliance(Profile::kAzure);
    WriteFile(kProfileFile, "{\"sso_enable\": true,\n\"sso_profile\": \"websphere\",\n\"sso_profile\": \"azure\"}");
    const Check finding = OnlyFinding();
    EXPECT_EQ(finding.id, "profile.duplicate_key");
    EXPECT_THAT(finding.found, HasSubstr("line 3: the key \"sso_profile\" occurs twice"));
}

TEST(Text, ReportsByteThatIsNotUTF8) {
    const Appliance appliance(Profile::kAzure);
    WriteFile(kProfileFile, "{\"sso_enable\": true,\n\"sso_profile\": \"azure\", \"note\": \"\xfc\"}");
    const Check finding = OnlyFinding();
    EXPECT_EQ(finding.id, "profile.encoding");
    EXPECT_THAT(finding.found, HasSubstr("line 2, column 34: a byte that is not UTF-8"));
}

TEST(Text, ReportsPastedCharacter) {
    Appliance appliance(Profile::kAzure);
    appliance.SetClient("tenant_id", std::string(kTenant) + "\xc2\xa0");
    EXPECT_THAT(Ask({}).FirstFinding().found, HasSubstr("contains a no-break space"));
    appliance.SetClient("tenant_id", "\xe2\x80\x9c" + std::string(kTenant) + "\xe2\x80\x9d");
    EXPECT_THAT(Ask({}).FirstFinding().found, HasSubstr("contains a smart quote"));
}

TEST(Text, ReadsTableOfDomainsLikeStandIn) {
    const Appliance appliance(Profile::kAzure);
    WriteFile(kDomainTable, "\xef\xbb\xbf{\"corp.example\": \"CORP\",}");
    const Report report = Ask({"--domain", "alice@corp.example"});
    EXPECT_THAT(report.Findings(), IsEmpty());
    EXPECT_EQ(report.Find("directory.domain", "good").found, "is \"CORP\\alice\", by the table");
    EXPECT_THAT(RunDoctor({"--domain", "alice@corp.example"}).output,
                HasSubstr("\nalice@corp.example signs in as \"CORP\\alice\", by the table.\n"));
}

TEST(Text, IgnoresTableEntryWithoutName) {
    const Appliance appliance(Profile::kAzure);
    WriteFile(kDomainTable, "{\"corp.example\": \"CORP\", \"lab.example\": 7}");
    const Report report = Ask({"--domain", "lab.example"});
    EXPECT_THAT(report.Find("directory.table", "finding").found, HasSubstr("\"lab.example\" has no NetBIOS name"));
    EXPECT_EQ(report.Find("directory.domain", "finding").subject, "domain lab.example");
}

}  // namespace

}  // namespace Test
