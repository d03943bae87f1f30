#include <openssl/evp.h>

#include <stdexcept>

#include "jwt/jwt.h"
#include "sso/authorization_request.h"
#include "sso/base64.h"
#include "sso/id_token.h"
#include "sso/sso.h"
#include "sso/token_exchange.h"
#include "utils/cleanse.h"
#include "utils/json.h"
#include "utils/root_privilege.h"
#include "utils/source_line.h"

namespace TAVO::SSO {

namespace {

constexpr char kSourceName[] = "webspheresso";

constexpr char kConfigurationFile[] = "/usr/tavo/etc/ssoclient/websphere.conf";
constexpr char kRequestedScope[] = "openid profile email";
constexpr Algorithm kAlgorithms[] = {{"HS256", EVP_sha256}, {"HS384", EVP_sha384}, {"HS512", EVP_sha512}};

}  // namespace

WebSphereSSOClient::WebSphereSSOClient() {
    Json::Value file;
    if (!Utils::LoadJsonFileAsRoot(SOURCE_LINE, kConfigurationFile, file)) {
        return;
    }
    // The file has no key for `enable`.
    Utils::ReadMembers(file, {
                                 {"websphere_wellknown", wellknownEndpoint},
                                 {"websphere_client_id", clientID},
                                 {"websphere_client_secret", clientSecret},
                                 {"websphere_authorization_endpoint", authEndpoint},
                                 {"websphere_token_endpoint", tokenEndpoint},
                                 {"websphere_redirect_uri", redirectURI},
                                 {"websphere_logout_endpoint", logoutEndpoint},
                             });
}

WebSphereSSOClient::~WebSphereSSOClient() {
    Utils::Cleanse(clientSecret);
    Utils::Cleanse(code);
    Utils::Cleanse(token);
}

std::string WebSphereSSOClient::GetAccessTokenReqURI(const Json::Value &stateInfo) {
    return AuthorizationURI({authEndpoint, clientID, redirectURI, kRequestedScope}, stateInfo);
}

void WebSphereSSOClient::RedirectAuthEndpoint(const Json::Value &stateInfo) {
    WriteRedirect(GetAccessTokenReqURI(stateInfo));
}

std::string WebSphereSSOClient::GetIDTokenReqParams() {
    return TokenRequestBody(clientID, clientSecret, code, redirectURI);
}

void WebSphereSSOClient::ProcessTokenResponse(std::string response) {
    const Utils::CleanseTextOnExit cleanse(response);
    Utils::Cleanse(token);
    token.clear();
    token = FindIDToken(ParseTokenResponse(response));
}

void WebSphereSSOClient::VerifyIDToken() {
    JWT::Jwt jwt = SplitIDToken(token);
    const Json::Value header = jwt.GetHeader();
    const Json::Value claims = jwt.GetBody();

    CheckExpiry(claims);
    CheckAudience(claims, clientID);
    const EVP_MD *digest = ChooseDigest(header, kAlgorithms);

    // JwtHMACVerify takes its key as base64 text.
    std::string key = EncodeBase64(clientSecret);
    const Utils::CleanseTextOnExit cleanse(key);
    jwt.JwtHMACVerify(key, digest);
}

void WebSphereSSOClient::GetUserInfo(Json::Value &claims) { claims = ReadClaims(token); }

void WebSphereSSOClient::GetUserName(std::string &userName) {
    if (!Utils::ReadMember(ReadClaims(token), "sub", userName)) {
        throw std::invalid_argument("cannot find the user name!");
    }
}

}  // namespace TAVO::SSO
