// The token request and its answer, as both clients process it.
#include "tests/unit/clients.h"
#include "tests/unit/fixture.h"

namespace Test {

namespace {

using namespace TAVO::SSO;

template <typename Client>
class TokenExchange : public Library {
  protected:
    Failure Process(const std::string &response) {
        return FailureOf([&] { client.ProcessTokenResponse(response); });
    }

    Client client;
};

using Clients = testing::Types<AzureClient, WebSphereClient>;
TYPED_TEST_SUITE(TokenExchange, Clients);

const auto kNoToken = Fails<sso_err_resp>("we cannot find key 'id_token' in response!");
const auto kNotJson = Fails<std::invalid_argument>("parse json falied");

TYPED_TEST(TokenExchange, SortsFiveRequestParametersByName) {
    this->client.code = "abc";
    this->client.clientID = "id";
    this->client.clientSecret = "s";
    this->client.redirectURI = "r";
    EXPECT_EQ(this->client.GetIDTokenReqParams(),
              "client_id=id&client_secret=s&code=abc&grant_type=authorization_code&redirect_uri=r");
}

TYPED_TEST(TokenExchange, EncodesEveryRequestValue) {
    this->client.code = "a&b";
    this->client.clientID = "an id";
    this->client.clientSecret = "=";
    this->client.redirectURI = "https://nas";
    EXPECT_EQ(this->client.GetIDTokenReqParams(),
              "client_id=an%20id&client_secret=%3D&code=a%26b&grant_type=authorization_code"
              "&redirect_uri=https%3A%2F%2Fnas");
}

TYPED_TEST(TokenExchange, SendsEmptySettingsAsEmptyValues) {
    EXPECT_EQ(this->client.GetIDTokenReqParams(),
              "client_id=&client_secret=&code=&grant_type=authorization_code&redirect_uri=");
}

TYPED_TEST(TokenExchange, AcceptsAnswerWithOnlyIDToken) {
    this->client.ProcessTokenResponse(R"({"id_token": "h.b.s"})");
    EXPECT_EQ(this->client.GetToken(), "h.b.s");
}

TYPED_TEST(TokenExchange, StoresIDTokenVerbatim) {
    this->client.ProcessTokenResponse(R"({"access_token": "other", "id_token": "no token at all", "expires_in": 5})");
    EXPECT_EQ(this->client.GetToken(), "no token at all");
    this->client.ProcessTokenResponse(R"({"id_token": ""})");
    EXPECT_EQ(this->client.GetToken(), "");
}

TYPED_TEST(TokenExchange, RejectsInvalidJSONAndClearsToken) {
    for (const char *response : {"", "<html>", "{\"id_token\": \"h.b.s\"", "{\"id_token\": \"h.b.s"}) {
        this->client.token = "earlier";
        EXPECT_EQ(this->Process(response), kNotJson) << response;
        EXPECT_EQ(this->client.GetToken(), "") << response;
    }
}

TYPED_TEST(TokenExchange, RejectsDeeplyNestedJSON) {
    EXPECT_EQ(this->Process(std::string(5000, '[') + std::string(5000, ']')), kNotJson);
}

TYPED_TEST(TokenExchange, RejectsMissingIDTokenAndClearsToken) {
    for (const char *response : {R"({})", R"({"id_token": 5})", R"({"id_token": null})", R"({"id_token": ["h.b.s"]})",
                                 R"({"ID_TOKEN": "h.b.s"})"}) {
        this->client.token = "earlier";
        EXPECT_EQ(this->Process(response), kNoToken) << response;
        EXPECT_EQ(this->client.GetToken(), "") << response;
    }
}

TYPED_TEST(TokenExchange, RejectsAnswerUnlessObject) {
    for (const char *response : {"null", "[]", "[{\"id_token\": \"h.b.s\"}]", "5", "true"}) {
        EXPECT_EQ(this->Process(response), kNoToken) << response;
    }
}

TYPED_TEST(TokenExchange, StoresNewTokenAfterFailedAnswer) {
    EXPECT_EQ(this->Process("{}"), kNoToken);
    this->client.ProcessTokenResponse(R"({"id_token": "new"})");
    EXPECT_EQ(this->client.GetToken(), "new");
}

}  // namespace

}  // namespace Test
