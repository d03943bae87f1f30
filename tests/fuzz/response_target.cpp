// The answer of the token endpoint, for both clients. An input is accepted if both find an ID token.
#include <stdexcept>

#include "sso/sso.h"
#include "tests/fuzz/oracle.h"
#include "tests/fuzz/target.h"

#pragma GCC diagnostic ignored "-Wdeprecated-declarations"  // Json::FastWriter, whose output an exception contains

namespace Fuzz {

namespace {

Json::Value Parse(const std::string &response) {
    const std::optional<Json::Value> document = ParseJson(response);
    if (!document) {
        throw std::invalid_argument("parse json falied");
    }
    return *document;
}

std::string FindToken(const Json::Value &document) {
    const std::optional<std::string> token = StringMember(document, "id_token");
    if (!token) {
        throw TAVO::SSO::sso_err_resp("we cannot find key 'id_token' in response!");
    }
    return *token;
}

struct WebSphere : TAVO::SSO::WebSphereSSOClient {
    using WebSphereSSOClient::token;

    static std::string Expected(const std::string &response) { return FindToken(Parse(response)); }
};

struct Azure : TAVO::SSO::AzureSSOClient {
    using AzureSSOClient::token;

    static std::string Expected(const std::string &response) {
        const Json::Value document = Parse(response);
        if (Member(document, "error") != nullptr) {
            throw TAVO::SSO::sso_err_resp(Json::FastWriter().write(document));
        }
        return FindToken(document);
    }
};

template <typename Client>
bool Takes(const std::string &response) {
    Client client;
    client.token = "token of an earlier answer";
    const Test::Failure failure = FailureOf([&] { client.ProcessTokenResponse(response); });

    std::string expected;
    RequireSame(failure, Test::FailureOf([&] { expected = Client::Expected(response); }));
    Require(client.token == expected, "unexpected token");
    RequireLog({});
    return failure == Test::kNothingThrown;
}

}  // namespace

bool Accepts(const std::string &input) {
    const bool azure = Takes<Azure>(input);
    const bool webSphere = Takes<WebSphere>(input);
    return azure && webSphere;
}

}  // namespace Fuzz
