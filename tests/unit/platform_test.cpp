// The stand-in for the appliance's libraries. This program links only libtavoplatform.so.0.
#include "platform/platform.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <openssl/evp.h>

#include <string>
#include <vector>

#include "tests/support/conversion.h"
#include "tests/support/files.h"
#include "tests/support/interposed/memory.h"
#include "tests/support/one_letter_locale.h"
#include "tests/support/system_log.h"

namespace Test {

namespace {

/// A buffer for `usable` characters and a NUL, followed by more bytes. All bytes are marked.
struct Buffer {
    explicit Buffer(std::size_t usable) : size(usable), bytes(usable + 17, '#') {}

    std::string Text() const { return bytes.data(); }
    bool Untouched() const { return std::string(bytes.begin(), bytes.end()) == std::string(bytes.size(), '#'); }
    bool UntouchedFrom(std::size_t position) const {
        return std::string(bytes.begin() + static_cast<std::ptrdiff_t>(position), bytes.end()) ==
               std::string(bytes.size() - position, '#');
    }

    std::size_t size;
    std::vector<char> bytes;
};

TEST(PercentEncoding, EscapesAllButUnreservedCharacters) {
    for (int byte = 1; byte < 256; ++byte) {
        const char text[] = {static_cast<char>(byte), '\0'};
        Buffer buffer(3);
        ASSERT_EQ(TavoCgiURLEncode(text, buffer.bytes.data(), buffer.size), 0) << byte;
        const bool unreserved =
            byte < 128 && (std::isalnum(byte) != 0 || std::string("-._~").find(text) != std::string::npos);
        char escaped[4];
        std::snprintf(escaped, sizeof escaped, "%%%02X", static_cast<unsigned>(byte));
        EXPECT_EQ(buffer.Text(), unreserved ? text : escaped) << byte;
    }
}

TEST(PercentEncoding, WritesUpToUsableSize) {
    Buffer exact(6);
    EXPECT_EQ(TavoCgiURLEncode("a&bc", exact.bytes.data(), 6), 0);
    EXPECT_EQ(exact.Text(), "a%26bc");
    EXPECT_TRUE(exact.UntouchedFrom(7));
    Buffer small(5);
    EXPECT_NE(TavoCgiURLEncode("a&bc", small.bytes.data(), 5), 0);
    EXPECT_TRUE(small.Untouched());
}

TEST(PercentEncoding, AcceptsEmptyText) {
    Buffer buffer(0);
    EXPECT_EQ(TavoCgiURLEncode("", buffer.bytes.data(), 0), 0);
    EXPECT_EQ(buffer.Text(), "");
    EXPECT_TRUE(buffer.UntouchedFrom(1));
}

TEST(PercentEncoding, RejectsNullPointers) {
    char byte = 0;
    EXPECT_NE(TavoCgiURLEncode(nullptr, &byte, 1), 0);
    EXPECT_NE(TavoCgiURLEncode("a", nullptr, 1), 0);
}

int Encode(const std::string &bytes, char *dst, std::size_t size) {
    return TLIBCBase64SzEncodeFull(bytes.data(), bytes.size(), dst, 1, size, 0, 1);
}

TEST(Base64, EncodesLikeOpenSSLOnOneLine) {
    std::string bytes;
    for (int i = 0; i < 300; ++i) {
        std::string expected(4 * ((bytes.size() + 2) / 3), '\0');
        EVP_EncodeBlock(reinterpret_cast<unsigned char *>(expected.data()),
                        reinterpret_cast<const unsigned char *>(bytes.data()), static_cast<int>(bytes.size()));
        Buffer buffer(expected.size());
        ASSERT_NE(Encode(bytes, buffer.bytes.data(), expected.size() + 1), 0);
        EXPECT_EQ(buffer.Text(), expected);
        bytes += static_cast<char>(i * 7);
    }
}

TEST(Base64, RequiresRoomForNUL) {
    Buffer buffer(8);
    EXPECT_EQ(Encode("four", buffer.bytes.data(), 8), 0);
    EXPECT_TRUE(buffer.Untouched());
    EXPECT_NE(Encode("four", buffer.bytes.data(), 9), 0);
    EXPECT_EQ(buffer.Text(), "Zm91cg==");
    EXPECT_TRUE(buffer.UntouchedFrom(9));
}

TEST(Base64, RejectsInvalidArgumentsWhenEncoding) {
    char byte = 0;
    EXPECT_EQ(TLIBCBase64SzEncodeFull(nullptr, 1, &byte, 1, 1, 0, 1), 0);
    EXPECT_EQ(TLIBCBase64SzEncodeFull("", 0, nullptr, 1, 1, 0, 1), 0);
    EXPECT_EQ(TLIBCBase64SzEncodeFull("", 0, &byte, 1, 0, 0, 1), 0);
    EXPECT_NE(TLIBCBase64SzEncodeFull(nullptr, 0, &byte, 1, 1, 0, 1), 0);
}

/// The decoded bytes, or "rejected".
std::string Decode(const std::string &text, std::size_t room = 100) {
    Buffer buffer(room);
    std::size_t length = room;
    if (TLIBCBase64Decode(text.data(), text.size(), buffer.bytes.data(), &length) == 0) {
        EXPECT_TRUE(buffer.Untouched());
        EXPECT_EQ(length, room);
        return "rejected";
    }
    EXPECT_TRUE(buffer.UntouchedFrom(length));
    return {buffer.bytes.data(), length};
}

TEST(Base64, DecodesWhatItEncodes) {
    std::string bytes;
    for (int i = 0; i < 100; ++i) {
        char text[200];
        ASSERT_NE(Encode(bytes, text, sizeof text), 0);
        EXPECT_EQ(Decode(text), bytes);
        bytes += static_cast<char>(255 - i);
    }
}

TEST(Base64, RejectsNonCanonicalText) {
    for (const std::string text : {"Zm9v\n", "Zm 9v", " Zm9v", "Zm9v ", "Zm9", "Zm8", "Zm8=Zm8=", "Zm9=", "Zh==",
                                   "====", "=", "Z===", "Zm8==", "Zm9v====", "Zm-_", "Zm9!", "Zm\xff=", "Zm9vZm9"}) {
        EXPECT_EQ(Decode(text), "rejected") << text;
    }
    EXPECT_EQ(Decode(std::string("Zm9v\0Zm9", 8)), "rejected");
}

TEST(Base64, DecodesIntoExactlySizedBuffer) {
    EXPECT_EQ(Decode("Zm9v", 3), "foo");
    EXPECT_EQ(Decode("Zm9v", 2), "rejected");
    EXPECT_EQ(Decode("", 0), "");
}

TEST(Base64, RejectsInvalidArgumentsWhenDecoding) {
    char byte = 0;
    std::size_t length = 1;
    EXPECT_EQ(TLIBCBase64Decode(nullptr, 4, &byte, &length), 0);
    EXPECT_EQ(TLIBCBase64Decode("", 0, nullptr, &length), 0);
    EXPECT_EQ(TLIBCBase64Decode("", 0, &byte, nullptr), 0);
    EXPECT_NE(TLIBCBase64Decode(nullptr, 0, &byte, &length), 0);
}

class DomainConversion : public testing::Test {
  protected:
    void SetUp() override {
        RemoveFiles();
        TakeSystemLog();
        WriteFile(kDomainTable, R"({"corp.example.net": "ACME", "Lab.Example.Net": "LAB", "number": 5,
            "empty": ""})");
    }

    static std::string Convert(const std::string &name, std::size_t size = 1023) {
        Buffer buffer(size);
        const int result = TAVOWinsUserNameFqdn2Netbios(name.c_str(), buffer.bytes.data(), size);
        if (result < 0) {
            EXPECT_TRUE(buffer.Untouched());
            return "rejected";
        }
        EXPECT_EQ(result, 0);
        EXPECT_THAT(TakeSystemLog(), testing::IsEmpty());
        return buffer.Text();
    }

    /// The line that was logged for a rejected name.
    static std::string Refusal(const std::string &name, std::size_t size = 1023) {
        EXPECT_EQ(Convert(name, size), "rejected") << name;
        const std::vector<LogLine> log = TakeSystemLog();
        EXPECT_THAT(log, testing::SizeIs(1)) << name;
        return log.size() == 1 && log[0].priority == LOG_ERR ? log[0].text : "unexpected log";
    }
};

TEST_F(DomainConversion, ReplacesDNSNameIgnoringCase) {
    EXPECT_EQ(Convert("CORP.EXAMPLE.NET\\alice"), "ACME\\alice");
    EXPECT_EQ(Convert("corp.Example.net\\Alice"), "ACME\\Alice");
    EXPECT_EQ(Convert("LAB.EXAMPLE.NET\\bob"), "LAB\\bob");
}

TEST_F(DomainConversion, IgnoresLocaleOfProcess) {
    const OneLetterLocale locale;
    EXPECT_EQ(Refusal("KORP.EXAMPLE.NET\\alice"), UnknownDomain("KORP.EXAMPLE.NET"));
    EXPECT_EQ(Convert("CORP.EXAMPLE.NET\\alice"), "ACME\\alice");
}

TEST_F(DomainConversion, KeepsUserUnchanged) {
    EXPECT_EQ(Convert("CORP.EXAMPLE.NET\\a\\b c"), "ACME\\a\\b c");
    EXPECT_EQ(Convert("CORP.EXAMPLE.NET\\\\"), "ACME\\\\");
}

TEST_F(DomainConversion, RejectsDomainMissingFromTable) {
    for (const char *domain :
         {"ELSEWHERE.EXAMPLE", "CORP", "CORP.EXAMPLE.NET.", "CORP.EXAMPLE.NET ", "NUMBER", "EMPTY"}) {
        EXPECT_EQ(Refusal(std::string(domain) + "\\alice"), UnknownDomain(domain));
    }
}

TEST_F(DomainConversion, RequiresDomainAndUser) {
    EXPECT_EQ(Refusal("alice"), "platform:N name without a domain");
    EXPECT_EQ(Refusal(""), "platform:N name without a domain");
    EXPECT_EQ(Refusal("CORP.EXAMPLE.NET\\"), "platform:N name of domain 'CORP.EXAMPLE.NET' without a user");
}

TEST_F(DomainConversion, RejectsAllNamesWithoutTable) {
    for (const char *table : {"", "[]", "{\"corp.example.net\": \"ACME\"", "5", "[5]"}) {
        WriteFile(kDomainTable, table);
        EXPECT_EQ(Refusal("CORP.EXAMPLE.NET\\alice"), UnknownDomain("CORP.EXAMPLE.NET")) << table;
    }
    RemoveFiles();
    EXPECT_EQ(Refusal("CORP.EXAMPLE.NET\\alice"), UnknownDomain("CORP.EXAMPLE.NET"));
    WriteFile(std::string(kDomainTable) + "/file", "");
    EXPECT_EQ(Refusal("CORP.EXAMPLE.NET\\alice"), UnknownDomain("CORP.EXAMPLE.NET")) << "a directory";
}

TEST_F(DomainConversion, RejectsAllNamesIfTableNestsTooDeeply) {
    WriteFile(kDomainTable, std::string(5000, '['));
    EXPECT_EQ(Refusal("CORP.EXAMPLE.NET\\alice"), "platform:N memory ran out, or domains.conf is nested too deeply");
}

TEST_F(DomainConversion, WritesUpToUsableSize) {
    EXPECT_EQ(Convert("CORP.EXAMPLE.NET\\alice", 10), "ACME\\alice");
    EXPECT_EQ(Refusal("CORP.EXAMPLE.NET\\alice", 9), "platform:N name is too long for its buffer");
    EXPECT_EQ(Refusal("CORP.EXAMPLE.NET\\alice", 0), "platform:N name is too long for its buffer");
}

TEST_F(DomainConversion, RejectsNullPointers) {
    char byte = 0;
    EXPECT_LT(TAVOWinsUserNameFqdn2Netbios(nullptr, &byte, 1), 0);
    EXPECT_LT(TAVOWinsUserNameFqdn2Netbios("CORP.EXAMPLE.NET\\alice", nullptr, 1), 0);
    const LogLine line = Error("platform:N no name, or no buffer for it");
    EXPECT_THAT(TakeSystemLog(), testing::ElementsAre(line, line));
}

TEST_F(DomainConversion, LogsAnyDomainOnOneLine) {
    EXPECT_EQ(Refusal("%s%n\n\t\x7f\xc3\xa9\\alice"), UnknownDomain("%s%n???\xc3\xa9"));
    EXPECT_EQ(Refusal(std::string(3000, 'a') + "\\alice"), UnknownDomain(std::string(255, 'a')));
}

TEST_F(DomainConversion, FailsIfMemoryRunsOut) {
    const std::string name = "CORP.EXAMPLE.NET\\alice";
    int n = 1;
    for (bool ranOut = true; ranOut; ++n) {
        Buffer buffer(1023);
        FailingAllocation failing(n, FailingAllocation::Of::kCxx, FailingAllocation::Until::kEver);
        const int result = TAVOWinsUserNameFqdn2Netbios(name.c_str(), buffer.bytes.data(), buffer.size);
        failing.Stop();
        ranOut = failing.Happened();
        const std::vector<LogLine> log = TakeSystemLog();
        if (result == 0) {
            EXPECT_EQ(buffer.Text(), "ACME\\alice");
            EXPECT_THAT(log, testing::IsEmpty());
        } else {
            EXPECT_TRUE(ranOut);
            EXPECT_TRUE(buffer.Untouched());
            EXPECT_THAT(log,
                        testing::ElementsAre(Error("platform:N memory ran out, or domains.conf is nested too deeply")));
        }
    }
    EXPECT_GT(n, 5);
}

}  // namespace

}  // namespace Test
