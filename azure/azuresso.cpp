#include <curl/curl.h>
#include <openssl/evp.h>
#include <syslog.h>

#include <boost/algorithm/string/case_conv.hpp>
#include <boost/algorithm/string/find.hpp>
#include <cstring>
#include <new>
#include <optional>
#include <stdexcept>
#include <vector>

#include "jwt/jwt.h"
#include "platform/platform.h"
#include "sso/authorization_request.h"
#include "sso/fetch.h"
#include "sso/id_token.h"
#include "sso/limits.h"
#include "sso/names.h"
#include "sso/sso.h"
#include "sso/token_exchange.h"
#include "utils/cleanse.h"
#include "utils/json.h"
#include "utils/root_privilege.h"
#include "utils/source_line.h"
#include "utils/split.h"

namespace TAVO::SSO {

namespace {

constexpr char kSourceName[] = "azuresso";

constexpr char kConfigurationFile[] = "/usr/tavo/etc/ssoclient/azure.conf";
constexpr char kRequestedScope[] = "openid";
constexpr Algorithm kAlgorithms[] = {{"RS256", EVP_sha256}, {"RS384", EVP_sha384}, {"RS512", EVP_sha512}};

constexpr char kStartPage[] = "/index.cgi";
constexpr char kRelayPage[] = "/webman/ssoclient/relay.html";
constexpr char kPostLogoutRedirectURI[] = "post_logout_redirect_uri";

/// Returns the first key with that "kid", or null.
const Json::Value *FindKey(const Json::Value &keySet, const std::optional<std::string> &kid) {
    const Json::Value *keys = Utils::FindMember(keySet, "keys");
    if (keys == nullptr || !keys->isArray() || !kid) {
        return nullptr;
    }
    for (const Json::Value &key : *keys) {
        if (Utils::FindMember(key, "kid") != nullptr && Utils::MemberTextIs(key, "kid", *kid)) {
            return &key;
        }
    }
    return nullptr;
}

/// Returns the user's principal name, user@domain.
std::string FindPrincipalName(const Json::Value &claims) {
    std::string name;
    if (!Utils::ReadMember(claims, "unique_name", name) && !Utils::ReadMember(claims, "email", name)) {
        throw std::invalid_argument("cannot find the user name!");
    }
    return name;
}

}  // namespace

AzureSSOClient::AzureSSOClient() {
    Json::Value file;
    if (!Utils::LoadJsonFileAsRoot(SOURCE_LINE, kConfigurationFile, file)) {
        return;
    }
    Utils::ReadMember(file, "azure_sso_enable", enable);
    Utils::ReadMembers(file, {
                                 {"azure_wellknown", wellknownEndpoint},
                                 {"azure_client_id", clientID},
                                 {"azure_client_secret", clientSecret},
                                 {"azure_tenant_id", tenantID},
                                 {"azure_authorization_endpoint", authEndpoint},
                                 {"azure_token_endpoint", tokenEndpoint},
                                 {"azure_redirect_uri", redirectURI},
                                 {"azure_logout_endpoint", logoutEndpoint},
                             });
}

AzureSSOClient::~AzureSSOClient() {
    Utils::Cleanse(clientSecret);
    Utils::Cleanse(code);
    Utils::Cleanse(token);
}

std::string AzureSSOClient::GetAccessTokenReqURI(const Json::Value &state) {
    return AuthorizationURI({authEndpoint, clientID, redirectURI, kRequestedScope}, state);
}

void AzureSSOClient::RedirectAuthEndpoint(const Json::Value &state) { WriteRedirect(GetAccessTokenReqURI(state)); }

std::string AzureSSOClient::GetIDTokenReqParams() {
    return TokenRequestBody(clientID, clientSecret, code, redirectURI);
}

void AzureSSOClient::ProcessTokenResponse(std::string response) {
    const Utils::CleanseTextOnExit cleanse(response);
    Utils::Cleanse(token);
    token.clear();
    const Json::Value tokenResponse = ParseTokenResponse(response);
    if (Utils::FindMember(tokenResponse, kError) != nullptr) {
        throw sso_err_resp(Utils::WriteCompactJson(tokenResponse));
    }
    token = FindIDToken(tokenResponse);
}

void AzureSSOClient::VerifyIDToken() {
    JWT::Jwt jwt = SplitIDToken(token);
    const Json::Value header = jwt.GetHeader();
    const Json::Value claims = jwt.GetBody();

    CheckExpiry(claims);
    if (!Utils::MemberTextIs(claims, "tid", tenantID)) {
        throw std::invalid_argument("tenant ID invalid");
    }
    CheckAudience(claims, clientID);

    Json::Value wellknown;
    RequestWellknownInfo(wellknown);
    Json::Value keySet;
    RequestKeysInfo(Utils::MemberText(wellknown, "jwks_uri").value_or(""), keySet);

    const Json::Value *key = FindKey(keySet, Utils::MemberText(header, "kid"));
    if (key == nullptr) {
        throw std::invalid_argument("kid does not exist in Azure verified kyes");
    }
    std::string n;
    if (!Utils::ReadMember(*key, "n", n)) {
        throw std::invalid_argument("RSA public 'n' cannot be found!");
    }
    std::string e;
    if (!Utils::ReadMember(*key, "e", e)) {
        throw std::invalid_argument("RSA public 'e' cannot be found!");
    }
    jwt.JwtRSAVerify(n, e, ChooseDigest(header, kAlgorithms));
}

void AzureSSOClient::RequestKeysInfo(std::string uri, Json::Value &keys) {
    try {
        FetchJson(uri, keys);
        if (Utils::FindMember(keys, "keys") == nullptr) {
            throw std::invalid_argument("no kyes information");
        }
    } catch (const std::bad_alloc &) {
        syslog(LOG_ERR, "%s:%d curl_easy_init failed. %m", SOURCE_LINE);
    } catch (const std::invalid_argument &error) {
        syslog(LOG_ERR, "%s:%d %s", SOURCE_LINE, error.what());
    } catch (const sso_err_resp &error) {
        syslog(LOG_ERR, "%s:%d request wellknown uri %s.", SOURCE_LINE, error.what());
    }
    // One more cleanup than initialisations; sso.h documents it.
    curl_global_cleanup();
}

void AzureSSOClient::GetUserInfo(Json::Value &info) { info = ReadClaims(token); }

void AzureSSOClient::GetUserName(std::string &userName) {
    const std::string principalName = FindPrincipalName(ReadClaims(token));
    const std::vector<std::string> pieces = Utils::SplitInto(2, principalName, '@');
    if (pieces.empty()) {
        // sso.h documents this value of userName.
        userName.assign(principalName.begin(), boost::find_first(principalName, "@").begin());
        throw std::invalid_argument("cannot get the user name!");
    }
    userName = boost::to_upper_copy(pieces[1]) + '\\' + pieces[0];

    char buffer[kPlatformBuffer] = {};
    if (TAVOWinsUserNameFqdn2Netbios(userName.c_str(), buffer, sizeof buffer - 1) < 0) {
        throw sso_op_failed("TAVOWinsUserNameFqdn2Netbios failed.");
    }
    userName.assign(buffer, strnlen(buffer, sizeof buffer));
}

std::string GetAzureSSOLogoutURL(const std::string &base) {
    AzureSSOClient client;
    std::string url = client.GetLogoutEndpoint();
    if (base.empty()) {
        return url;
    }
    std::string relayPage = base;
    // If `base` is shorter, substr throws std::out_of_range, as sso.h documents.
    const std::size_t end = relayPage.size() - std::strlen(kStartPage);
    if (relayPage.substr(end) == kStartPage) {
        relayPage.resize(end);
    }
    if (!relayPage.empty() && relayPage.back() == '/') {
        relayPage.pop_back();
    }
    relayPage += kRelayPage;
    return url + "?" + kPostLogoutRedirectURI + "=" + URLEncode(relayPage);
}

}  // namespace TAVO::SSO
