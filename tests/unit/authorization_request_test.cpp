// The authorization request of both clients. They differ in the scope.
#include <iostream>
#include <regex>
#include <sstream>

#include "tests/support/encoding.h"
#include "tests/support/interposed/calls.h"
#include "tests/support/interposed/platform_calls.h"
#include "tests/support/interposed/process.h"
#include "tests/support/token.h"
#include "tests/unit/clients.h"
#include "tests/unit/fixture.h"

namespace Test {

namespace {

using namespace TAVO::SSO;

/// The decoded value of a query parameter.
std::string Parameter(const std::string &uri, const std::string &name) {
    std::smatch match;
    EXPECT_TRUE(std::regex_search(uri, match, std::regex("[?&]" + name + "=([^&]*)"))) << name;
    return PercentDecode(match[1]);
}

std::string StateText(const std::string &uri) { return FromBase64(Parameter(uri, "state")); }

template <typename Client>
class AuthorizationRequest : public Library {
  protected:
    void SetUp() override {
        Library::SetUp();
        client.authEndpoint = "https://provider.example/authorize";
        client.clientID = "the id";
        client.redirectURI = "https://nas.example/return.cgi";
    }

    std::string URI(const std::string &state = R"({"origin": "/"})") {
        return client.GetAccessTokenReqURI(Parse(state));
    }

    Client client;
};

using Clients = testing::Types<AzureClient, WebSphereClient>;
TYPED_TEST_SUITE(AuthorizationRequest, Clients);

TYPED_TEST(AuthorizationRequest, SortsItsSixParametersByName) {
    EXPECT_THAT(this->URI(), testing::MatchesRegex("https://provider\\.example/authorize"
                                                   "\\?client_id=the%20id"
                                                   "&nonce=[0-9a-f-]+"
                                                   "&redirect_uri=https%3A%2F%2Fnas\\.example%2Freturn\\.cgi"
                                                   "&response_type=code"
                                                   "&scope=" +
                                                   std::string(TypeParam::kScope) + "&state=[A-Za-z0-9%]+"));
}

TYPED_TEST(AuthorizationRequest, UsesNewNonceAndStateEachTime) {
    const std::string first = this->URI();
    const std::string second = this->URI();
    EXPECT_NE(Parameter(first, "nonce"), Parameter(second, "nonce"));
    EXPECT_NE(Parameter(first, "state"), Parameter(second, "state"));
}

TYPED_TEST(AuthorizationRequest, SeedsNewGeneratorForEachNonce) {
    this->URI();
    const int before = EntropyReads();
    this->URI();
    EXPECT_GT(EntropyReads(), before);
}

TYPED_TEST(AuthorizationRequest, SendsEmptyNonceIfDigestFails) {
    FailCall("MD5");
    EXPECT_EQ(Parse(StateText(this->URI()))["nonce"], "");
    EXPECT_EQ(TakeSystemLog().size(), 1u);
}

TYPED_TEST(AuthorizationRequest, UsesVersion4UUIDAsNonce) {
    EXPECT_TRUE(std::regex_match(Parameter(this->URI(), "nonce"),
                                 std::regex("[0-9a-f]{8}-[0-9a-f]{4}-4[0-9a-f]{3}-[89ab][0-9a-f]{3}-[0-9a-f]{12}")));
}

TYPED_TEST(AuthorizationRequest, PutsOnlyDigestOfNonceIntoState) {
    const std::string uri = this->URI();
    const std::string nonce = Parameter(uri, "nonce");
    EXPECT_EQ(Parse(StateText(uri))["nonce"].asString(), MD5Digest(nonce));
    EXPECT_THAT(StateText(uri), testing::Not(testing::HasSubstr(nonce)));
}

TYPED_TEST(AuthorizationRequest, ConvertsNullStateToObjectWithDigest) {
    const std::string uri = this->URI("null");
    EXPECT_EQ(StateText(uri), R"({"nonce":")" + MD5Digest(Parameter(uri, "nonce")) + "\"}\n");
}

TYPED_TEST(AuthorizationRequest, ReplacesNonceOfCaller) {
    const std::string uri = this->URI(R"({"nonce": "mine"})");
    EXPECT_EQ(Parse(StateText(uri))["nonce"].asString(), MD5Digest(Parameter(uri, "nonce")));
}

TYPED_TEST(AuthorizationRequest, PreservesOtherMembersOfState) {
    const char state[] =
        R"({"origin": "/a?b=c&d", "csrf": "x+/=", "list": [1, null, {"a": 1.5}], "text": "\u00e4\"\\"})";
    Json::Value returned = Parse(StateText(this->URI(state)));
    returned.removeMember("nonce");
    EXPECT_EQ(returned, Parse(state));
}

TYPED_TEST(AuthorizationRequest, KeepsStateOfCallerUnchanged) {
    const Json::Value state = Parse(R"({"origin": "/"})");
    const Json::Value before = state;
    this->client.GetAccessTokenReqURI(state);
    EXPECT_EQ(state, before);
}

TYPED_TEST(AuthorizationRequest, LetsRelayURLReadOriginFromState) {
    EXPECT_EQ(GetSSORelayURL(true, Parameter(this->URI(R"({"origin": "/a b"})"), "state"), ""),
              "ssoclient/relay.html#origin=%2Fa%20b&success=true");
}

/// A state whose compact JSON has this length.
std::string StateOfLength(std::size_t length) { return R"({"origin":")" + std::string(length - 13, 'x') + "\"}"; }

TYPED_TEST(AuthorizationRequest, AcceptsStateUpTo721Bytes) {
    EXPECT_EQ(Parameter(this->URI(StateOfLength(721)), "state").size(), 1020u);
    EXPECT_EQ(FailureOf([&] { this->URI(StateOfLength(722)); }), Fails<sso_op_failed>("encode base64 failed."));
}

TYPED_TEST(AuthorizationRequest, PassesZeroedBufferAndFlagsToEncoder) {
    Platform platform;
    platform.encode = [](const std::string &src, char *dst, int flag1, std::size_t size, int flag2, int flag3) {
        EXPECT_EQ(src.back(), '\n');
        EXPECT_EQ(flag1, 1);
        EXPECT_EQ(size, 1024u);
        EXPECT_EQ(flag2, 0);
        EXPECT_EQ(flag3, 1);
        EXPECT_EQ(std::string(dst, size), std::string(1024, '\0'));
        std::fill_n(dst, size, 'x');  // fills the buffer, without a NUL
        return -1;                    // every value except 0 is success
    };
    ReplacePlatform(platform);
    EXPECT_EQ(Parameter(this->URI(), "state"), std::string(1024, 'x'));
}

TYPED_TEST(AuthorizationRequest, AcceptsEmptyConfiguration) {
    this->client.authEndpoint = "";
    this->client.clientID = "";
    this->client.redirectURI = "";
    EXPECT_THAT(this->URI(), testing::StartsWith("?client_id=&nonce="));
    EXPECT_EQ(Parameter(this->URI(), "redirect_uri"), "");
}

TYPED_TEST(AuthorizationRequest, AppendsSecondQuestionMarkToEndpointWithQuery) {
    this->client.authEndpoint = "https://provider.example/?tenant=1";
    EXPECT_THAT(this->URI(), testing::StartsWith("https://provider.example/?tenant=1?client_id="));
}

TYPED_TEST(AuthorizationRequest, ThrowsUnlessStateIsObjectOrNull) { EXPECT_THROW(this->URI("[]"), Json::LogicError); }

/// Replaces the buffer of std::cout and counts insertions and flushes.
class Output : public std::stringbuf {
  public:
    Output() : former_(std::cout.rdbuf(this)) {}
    ~Output() override { std::cout.rdbuf(former_); }

    int insertions = 0;
    int flushes = 0;

  protected:
    std::streamsize xsputn(const char *text, std::streamsize length) override {
        ++insertions;
        return std::stringbuf::xsputn(text, length);
    }
    int sync() override {
        ++flushes;
        return 0;
    }

  private:
    std::streambuf *former_;
};

TYPED_TEST(AuthorizationRequest, WritesRedirectAtOnceWithoutFlush) {
    Output output;
    this->client.RedirectAuthEndpoint(Parse(R"({"origin": "/"})"));
    EXPECT_THAT(output.str(),
                testing::MatchesRegex("Location: https://provider\\.example/authorize\\?client_id=[^ \n]*\n\n"));
    EXPECT_EQ(output.insertions, 1);
    EXPECT_EQ(output.flushes, 0);
}

TYPED_TEST(AuthorizationRequest, WritesNothingOnFailure) {
    Output output;
    EXPECT_EQ(FailureOf([&] { this->client.RedirectAuthEndpoint(Parse(StateOfLength(722))); }),
              Fails<sso_op_failed>("encode base64 failed."));
    EXPECT_EQ(output.insertions, 0);
}

}  // namespace

}  // namespace Test
