#include <curl/curl.h>
#include <gmock/gmock.h>

#include <boost/crc.hpp>
#include <cstdint>
#include <functional>
#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

#include "tests/loopback/loopback_provider.h"
#include "tests/support/authority.h"
#include "tests/support/libcurl_version.h"
#include "tests/support/server.h"
#include "tests/support/system_log.h"
#include "tests/support/token.h"

// Each fault of a provider at each endpoint of a login. Without the fault, the answer would be correct.
namespace Test {

namespace {

using ::testing::ElementsAreArray;
using ::testing::IsEmpty;
using ::testing::ValuesIn;

using Document = const std::string &;
using MakeAnswer = std::function<std::string(Document document)>;
using Fault = std::function<void(Connection &connection, Document document)>;

struct FaultCase {
    std::string name;
    Fault fault;
    CURLcode result;
    bool arrives;  // whether the complete document arrives
};

void PrintTo(const FaultCase &row, std::ostream *stream) { *stream << row.name; }

std::string Token(Profile profile) { return SignedToken(TokenHeader(profile), TokenClaims(profile)); }

std::string TextOf(CURLcode result) { return curl_easy_strerror(result); }

Outcome UnknownKey() { return Refused<std::invalid_argument>("kid does not exist in Azure verified kyes"); }

LogLine KeyRequestLogged(const std::string &text) { return Error("azuresso:N request wellknown uri " + text + "."); }

class FaultyProvider : public ::testing::TestWithParam<FaultCase> {
  protected:
    static void PlayFault(Provider &provider, const std::string &document) {
        provider.Play([document](Connection &connection) { GetParam().fault(connection, document); });
    }

    // A failed transfer is logged, but a complete token response counts.
    static void FailAtTheTokenEndpoint(Profile profile) {
        const auto &[name, fault, result, arrives] = GetParam();
        Provider provider(profile);
        PlayFault(provider, TokenResponse(Token(profile)));
        provider.AnswerVerification();
        EXPECT_EQ(provider.LogIn(),
                  arrives ? LoggedIn(UserName(profile)) : Refused<std::invalid_argument>("parse json falied"));
        std::vector<LogLine> log;
        if (result != CURLE_OK) {
            log.push_back(Error("sso:N request token uri " + TextOf(result) + "."));
        }
        EXPECT_THAT(TakeSystemLog(), ElementsAreArray(log));
    }

    static void FailAtTheDiscoveryDocument() {
        Provider provider(Profile::kAzure);
        provider.Answer(TokenResponse(Token(Profile::kAzure)));
        PlayFault(provider, R"({"jwks_uri": ")" + provider.URL("/keys") + "\"}");
        provider.Answer(KeySet());
        ExpectLoginOnlyWithoutFault(provider,
                                    {Error("sso:N " + FailureText()), KeyRequestLogged(TextOf(CURLE_URL_MALFORMAT))});
    }

    static void FailAtTheKeySet() {
        Provider provider(Profile::kAzure);
        provider.Answer(TokenResponse(Token(Profile::kAzure)));
        provider.Answer(R"({"jwks_uri": "$BASE/keys"})");
        PlayFault(provider, KeySet());
        ExpectLoginOnlyWithoutFault(provider, {KeyRequestLogged(FailureText())});
    }

  private:
    static std::string FailureText() {
        return GetParam().result != CURLE_OK ? TextOf(GetParam().result) : "bad wellknown json format.";
    }

    static void ExpectLoginOnlyWithoutFault(Provider &provider, const std::vector<LogLine> &failures) {
        const bool sound = GetParam().arrives && GetParam().result == CURLE_OK;
        EXPECT_EQ(provider.LogIn(), sound ? LoggedIn(UserName(Profile::kAzure)) : UnknownKey());
        EXPECT_THAT(TakeSystemLog(), ElementsAreArray(sound ? std::vector<LogLine>() : failures));
    }
};

TEST_P(FaultyProvider, YieldsExpectedOutcome) {
    for (const Profile profile : {Profile::kAzure, Profile::kWebSphere}) {
        SCOPED_TRACE("token endpoint, " + Name(profile));
        FailAtTheTokenEndpoint(profile);
    }
    {
        SCOPED_TRACE("discovery document");
        FailAtTheDiscoveryDocument();
    }
    SCOPED_TRACE("key set");
    FailAtTheKeySet();
}

/// Waits for a request and sends the answer made of the document.
Fault Answers(const MakeAnswer &answer) {
    return [answer](Connection &connection, Document document) {
        connection.ReceiveRequest();
        connection.Send(answer(document));
    };
}

/// The same, then closes the connection without a TLS close_notify.
Fault BreaksOffAfter(const MakeAnswer &answer) {
    return [answer](Connection &connection, Document document) {
        Answers(answer)(connection, document);
        connection.BreakOff();
    };
}

FaultCase Row(const char *name, CURLcode result, bool arrives, const MakeAnswer &answer) {
    return {name, Answers(answer), result, arrives};
}

std::string Half(Document document) { return document.substr(0, document.size() / 2); }

std::string With(const std::string &fields, const std::string &body) {
    return "HTTP/1.1 200 OK\r\n" + fields + "\r\n" + body;
}

std::string Length(std::size_t length) { return "Content-Length: " + std::to_string(length) + "\r\n"; }

std::string Chunk(const std::string &data) {
    const std::string last = ChunkedHTTPAnswer({});
    const std::string whole = ChunkedHTTPAnswer({data});
    const std::size_t header = last.find("\r\n\r\n") + 4;
    return whole.substr(header, whole.size() - last.size());
}

std::string InChunks(const std::string &chunks) { return With("Transfer-Encoding: chunked\r\n", chunks); }

std::string LittleEndian(std::uint32_t number, int bytes) {
    std::string text;
    for (int i = 0; i < bytes; ++i) {
        text += static_cast<char>(number >> (8 * i) & 0xff);
    }
    return text;
}

/// The text in the gzip format (RFC 1952), as one stored block. For short texts only.
std::string Gzip(const std::string &text) {
    const auto length = static_cast<std::uint32_t>(text.size());
    boost::crc_32_type sum;
    sum.process_bytes(text.data(), text.size());
    return std::string("\x1f\x8b\x08\0\0\0\0\0\0\xff\x01", 11) + LittleEndian(length, 2) + LittleEndian(~length, 2) +
           text + LittleEndian(sum.checksum(), 4) + LittleEndian(length, 4);
}

std::vector<FaultCase> Connections() {
    const auto whole = [](Document document) { return HTTPAnswer(document); };
    const auto withoutLength = [](Document document) { return With("", document); };
    return {
        {"ClosesBeforeTheHandshake", [](Connection &, Document) {}, CURLE_SSL_CONNECT_ERROR, false},
        {"ClosesInTheHandshake", [](Connection &connection, Document) { connection.ReceiveRaw(); },
         CURLE_SSL_CONNECT_ERROR, false},
        {"ClosesDuringServerHello",
         [](Connection &connection, Document) {
             connection.ReceiveRaw();
             connection.SendRaw(std::string("\x16\x03\x03\x00\x7a\x02", 6));
         },
         CURLE_SSL_CONNECT_ERROR, false},
        {"AnswersTheHandshakeInPlainHTTP",
         [](Connection &connection, Document document) {
             connection.ReceiveRaw();
             connection.SendRaw(HTTPAnswer(document));
         },
         CURLE_SSL_CONNECT_ERROR, false},
        {"ClosesInTheStatusLine", Answers([](Document) { return "HTTP/1.1 20"; }), CURLE_GOT_NOTHING, false},
        {"ClosesInTheHeader", Answers([](Document) { return "HTTP/1.1 200 OK\r\nContent-Len"; }), CURLE_OK, false},
        {"ClosesAfterTheHeader", Answers([](Document document) { return With(Length(document.size()), ""); }),
         CURLE_PARTIAL_FILE, false},
        {"ClosesInTheBody", Answers([](Document document) { return With(Length(document.size()), Half(document)); }),
         CURLE_PARTIAL_FILE, false},
        {"BreaksOffInTheBody",
         BreaksOffAfter([](Document document) { return With(Length(document.size()), Half(document)); }),
         LibcurlRequiresCloseNotify() ? CURLE_RECV_ERROR : CURLE_PARTIAL_FILE, false},
        {"BreaksOffBehindAWholeAnswer", BreaksOffAfter(whole), CURLE_OK, true},
        {"EndsABodyWithoutLengthByItsGoodbye", Answers(withoutLength), CURLE_OK, true},
        {"BreaksOffBehindABodyWithoutLength", BreaksOffAfter(withoutLength),
         LibcurlRequiresCloseNotify() ? CURLE_RECV_ERROR : CURLE_OK, true},
        {"DripsEachByteInARecordOfItsOwn",
         [](Connection &connection, Document document) {
             connection.ReceiveRequest();
             connection.SendByteByByte(HTTPAnswer(document));
         },
         CURLE_OK, true},
        {"SendsEachByteInSeparateChunk", Answers([](Document document) {
             std::vector<std::string> bytes;
             for (const char byte : document) {
                 bytes.emplace_back(1, byte);
             }
             return ChunkedHTTPAnswer(bytes);
         }),
         CURLE_OK, true},
    };
}

std::vector<FaultCase> Lengths() {
    const auto row = [](const char *name, CURLcode result, bool arrives, const MakeAnswer &fields) {
        return Row(name, result, arrives, [fields](Document document) { return With(fields(document), document); });
    };
    const CURLcode ofBadLength = LibcurlAcceptsBadLengths() ? CURLE_OK : CURLE_WEIRD_SERVER_REPLY;
    return {
        row("TooLong", CURLE_PARTIAL_FILE, true, [](Document document) { return Length(document.size() + 1); }),
        row("TooShort", CURLE_OK, false, [](Document document) { return Length(document.size() - 1); }),
        row("Zero", CURLE_OK, false, [](Document) { return Length(0); }),
        row("Negative", CURLE_WEIRD_SERVER_REPLY, false, [](Document) { return "Content-Length: -1\r\n"; }),
        row("NotANumber", CURLE_WEIRD_SERVER_REPLY, false, [](Document) { return "Content-Length: many\r\n"; }),
        row("Empty", CURLE_WEIRD_SERVER_REPLY, false, [](Document) { return "Content-Length: \r\n"; }),
        row("TooLarge", CURLE_OK, true, [](Document) { return "Content-Length: 99999999999999999999\r\n"; }),
        row("FollowedByLetters", ofBadLength, LibcurlAcceptsBadLengths(),
            [](Document document) { return "Content-Length: " + std::to_string(document.size()) + "abc\r\n"; }),
        row("RepeatedEqual", CURLE_OK, true,
            [](Document document) { return Length(document.size()) + Length(document.size()); }),
        row("RepeatedLastTooShort", ofBadLength, false,
            [](Document document) { return Length(document.size()) + Length(3); }),
        row("RepeatedFirstTooShort", ofBadLength, LibcurlAcceptsBadLengths(),
            [](Document document) { return Length(3) + Length(document.size()); }),
    };
}

std::vector<FaultCase> Headers() {
    const auto withStatusLine = [](const char *name, CURLcode result, const char *line) {
        return Row(name, result, result == CURLE_OK, [line](Document document) {
            return std::string(line) + "\r\n" + Length(document.size()) + "\r\n" + document;
        });
    };
    return {
        withStatusLine("OfHTTP09", CURLE_UNSUPPORTED_PROTOCOL, "HTTP/0.9 200 OK"),
        withStatusLine("OfHTTP10", CURLE_OK, "HTTP/1.0 200 OK"),
        withStatusLine("OfHTTP2OverHTTP1", CURLE_OK, "HTTP/2 200"),
        withStatusLine("OfHTTP4", CURLE_UNSUPPORTED_PROTOCOL, "HTTP/4 200"),
        withStatusLine("WhoseStatusIsNoNumber", CURLE_UNSUPPORTED_PROTOCOL, "HTTP/1.1 two OK"),
        withStatusLine("WhoseStatusIs99", CURLE_UNSUPPORTED_PROTOCOL, "HTTP/1.1 099 OK"),
        Row("Missing", CURLE_UNSUPPORTED_PROTOCOL, false, [](Document document) { return document; }),
        Row("OfManyInterimAnswers", CURLE_OK, true,
            [](Document document) {
                std::string interim;
                for (int i = 0; i < 1000; ++i) {
                    interim += "HTTP/1.1 103 Early Hints\r\n\r\n";
                }
                return interim + HTTPAnswer(document);
            }),
        Row("Of200KBInOneLine", LibcurlResultOfLongHeader(), false,
            [](Document document) { return With("X: " + std::string(200 << 10, 'x') + "\r\n", document); }),
        Row("Of1MBInManyLines", CURLE_RECV_ERROR, false,
            [](Document document) {
                std::string fields;
                while (fields.size() < 1 << 20) {
                    fields += "X: " + std::string(1000, 'x') + "\r\n";
                }
                return With(fields, document);
            }),
        Row("WithANUL", CURLE_WEIRD_SERVER_REPLY, false,
            [](Document document) { return With(std::string("X: a\0b\r\n", 8), document); }),
    };
}

std::vector<FaultCase> Codings() {
    return {
        Row("GzipNotRequested", CURLE_OK, false,
            [](Document document) { return With("Content-Encoding: gzip\r\n", Gzip(document)); }),
        Row("GzipDeclaredButPlain", CURLE_OK, true,
            [](Document document) { return With("Content-Encoding: gzip\r\n", document); }),
        Row("GzipForTheTransfer", LibcurlAcceptsGzipForTheTransfer() ? CURLE_OK : CURLE_BAD_CONTENT_ENCODING,
            LibcurlAcceptsGzipForTheTransfer(),
            [](Document document) { return With("Transfer-Encoding: gzip\r\n", Gzip(document)); }),
        Row("UnknownForTheTransfer", CURLE_BAD_CONTENT_ENCODING, false,
            [](Document document) { return With("Transfer-Encoding: rot13\r\n", document); }),
        Row("ChunkedWithWrongLength", CURLE_OK, true,
            [](Document document) {
                return With("Transfer-Encoding: chunked\r\n" + Length(3), Chunk(document) + Chunk(""));
            }),
        Row("ChunksWithExtensionsAndTrailers", CURLE_OK, true,
            [](Document document) {
                return InChunks("2;a=b\r\n" + document.substr(0, 2) + "\r\n" + Chunk(document.substr(2)) +
                                "0\r\nX: y\r\n\r\n");
            }),
        Row("ChunkWithANULInTheMiddle", CURLE_OK, false,
            [](Document document) {
                return ChunkedHTTPAnswer({Half(document) + '\0' + document.substr(Half(document).size())});
            }),
        Row("ChunkWithTextAfterNUL", CURLE_OK, true,
            [](Document document) { return ChunkedHTTPAnswer({document + '\0' + "<html>"}); }),
        Row("SurroundedByChunksOfNULs", CURLE_OK, true,
            [](Document document) {
                return ChunkedHTTPAnswer({std::string(5000, '\0'), document, std::string(1, '\0')});
            }),
        Row("ChunksWithoutEnd", CURLE_PARTIAL_FILE, true, [](Document document) { return InChunks(Chunk(document)); }),
        Row("ChunkWithoutSize", CURLE_RECV_ERROR, false, [](Document document) { return InChunks("\r\n" + document); }),
        Row("ChunkWhoseSizeIsNoNumber", CURLE_RECV_ERROR, false,
            [](Document document) { return InChunks("xyz\r\n" + document + "\r\n"); }),
        Row("ChunkWhoseSizeIsNegative", CURLE_RECV_ERROR, false,
            [](Document document) { return InChunks("-5\r\n" + document + "\r\n"); }),
        Row("ChunkWhoseSizeIsTooLarge", CURLE_RECV_ERROR, false,
            [](Document document) { return InChunks("fffffffffffffffff\r\n" + document + "\r\n"); }),
        Row("ChunkShorterThanDeclared", CURLE_PARTIAL_FILE, true,
            [](Document document) { return InChunks("fffff\r\n" + document); }),
        Row("ChunkLongerThanDeclared", CURLE_RECV_ERROR, false,
            [](Document document) { return InChunks("3\r\n" + document + "\r\n0\r\n\r\n"); }),
    };
}

std::string NameOfFault(const ::testing::TestParamInfo<FaultCase> &info) { return info.param.name; }

INSTANTIATE_TEST_SUITE_P(Connection, FaultyProvider, ValuesIn(Connections()), NameOfFault);
INSTANTIATE_TEST_SUITE_P(Length, FaultyProvider, ValuesIn(Lengths()), NameOfFault);
INSTANTIATE_TEST_SUITE_P(Header, FaultyProvider, ValuesIn(Headers()), NameOfFault);
INSTANTIATE_TEST_SUITE_P(Coding, FaultyProvider, ValuesIn(Codings()), NameOfFault);

TEST(ChunkedAnswer, ReadsEachChunkUpToFirstNUL) {
    Provider provider(Profile::kAzure);
    const std::string document = R"({"jwks_uri": ")" + provider.URL("/keys") + "\"}";
    for (std::size_t i = 0; i <= document.size(); ++i) {
        provider.Answer(TokenResponse(Token(Profile::kAzure)));
        provider.AnswerByteByByte(ChunkedHTTPAnswer({document.substr(0, i) + '\0' + "}\0]", document.substr(i) + " "}));
        provider.Answer(KeySet());
        EXPECT_EQ(provider.LogIn(), LoggedIn(UserName(Profile::kAzure))) << i;
        EXPECT_THAT(TakeSystemLog(), IsEmpty()) << i;
    }
}

TEST(LargeAnswer, Accepts200MB) {
    constexpr std::size_t kBlanks = std::size_t{200} << 20;
    Provider provider(Profile::kWebSphere);
    const std::string document = TokenResponse(Token(Profile::kWebSphere));
    provider.Play([document](Connection &connection) {
        connection.ReceiveRequest();
        connection.Send(With(Length(kBlanks + document.size()), ""));
        const std::string blanks(std::size_t{1} << 20, ' ');
        for (std::size_t sent = 0; sent < kBlanks; sent += blanks.size()) {
            connection.Send(blanks);
        }
        connection.Send(document);
    });
    EXPECT_EQ(provider.LogIn(), LoggedIn(UserName(Profile::kWebSphere)));
    EXPECT_THAT(TakeSystemLog(), IsEmpty());
}

constexpr const char *kRedirects[] = {"301 Moved Permanently", "302 Found", "303 See Other", "307 Temporary Redirect",
                                      "308 Permanent Redirect"};

/// A provider that redirects to a server with a correct answer.
class Redirect : public ::testing::Test {
  protected:
    void ExpectNotFollowed(const std::vector<std::string> &answersBefore, const Outcome &outcome,
                           const std::vector<LogLine> &log) {
        for (const char *status : kRedirects) {
            SCOPED_TRACE(status);
            for (const std::string &answer : answersBefore) {
                provider_.Answer(answer);
            }
            provider_.AnswerByteByByte("HTTP/1.1 " + std::string(status) + "\r\nLocation: " + elsewhere_.URL("/") +
                                       "\r\nContent-Length: 0\r\n\r\n");
            EXPECT_EQ(provider_.LogIn(), outcome);
            EXPECT_THAT(TakeSystemLog(), ElementsAreArray(log));
            EXPECT_THAT(elsewhere_.Requests(), IsEmpty());
        }
    }

    const std::string token_ = TokenResponse(Token(Profile::kAzure));

  private:
    Server elsewhere_{CertificateFor("IP:127.0.0.1")};
    Provider provider_{Profile::kAzure};
};

TEST_F(Redirect, IsNotFollowedAtTokenEndpoint) {
    ExpectNotFollowed({}, Refused<std::invalid_argument>("parse json falied"), {});
}

TEST_F(Redirect, IsNotFollowedAtDiscoveryDocument) {
    ExpectNotFollowed({token_}, UnknownKey(),
                      {Error("sso:N bad wellknown json format."), KeyRequestLogged(TextOf(CURLE_URL_MALFORMAT))});
}

TEST_F(Redirect, IsNotFollowedAtKeySet) {
    ExpectNotFollowed({token_, R"({"jwks_uri": "$BASE/keys"})"}, UnknownKey(),
                      {KeyRequestLogged("bad wellknown json format.")});
}

}  // namespace

}  // namespace Test
