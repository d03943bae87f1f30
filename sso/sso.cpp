#include "sso/sso.h"

#include <syslog.h>

#include <new>
#include <utility>

#include "sso/base64.h"
#include "sso/fetch.h"
#include "sso/names.h"
#include "sso/supported_profiles.h"
#include "utils/cleanse.h"
#include "utils/json.h"
#include "utils/source_line.h"

namespace TAVO::SSO {

namespace {

constexpr char kSourceName[] = "sso";

}  // namespace

// Out of line: programs catch these by type, so the type information must be in this library only.

sso_exception::sso_exception(std::string message) : std::runtime_error(message) {}
sso_exception::~sso_exception() = default;

sso_err_resp::sso_err_resp(std::string message) : sso_exception(std::move(message)) {}
sso_err_resp::~sso_err_resp() = default;

sso_not_implemented::sso_not_implemented(std::string message) : sso_exception(std::move(message)) {}
sso_not_implemented::~sso_not_implemented() = default;

sso_op_failed::sso_op_failed(std::string message) : sso_exception(std::move(message)) {}
sso_op_failed::~sso_op_failed() = default;

bool SSOClient::isEnable() { return enable; }
std::string SSOClient::GetClientID() { return clientID; }
std::string SSOClient::GetClientSecret() { return clientSecret; }
std::string SSOClient::GetRedirectURI() { return redirectURI; }
std::string SSOClient::GetToken() { return token; }
std::string SSOClient::GetAuthEndpoint() { return authEndpoint; }
std::string SSOClient::GetTokenEndpoint() { return tokenEndpoint; }
std::string SSOClient::GetWellknownEndpoint() { return wellknownEndpoint; }
std::string SSOClient::GetLogoutEndpoint() { return logoutEndpoint; }

void SSOClient::SetRedirectURI(std::string uri) { redirectURI = std::move(uri); }
void SSOClient::SetCode(std::string authorizationCode) {
    Utils::Cleanse(code);
    code = std::move(authorizationCode);
}

void SSOClient::RequestWellknownInfo(Json::Value &out) {
    try {
        FetchJson(wellknownEndpoint, out);
    } catch (const std::bad_alloc &) {
        syslog(LOG_ERR, "%s:%d bad_alloc. %m", SOURCE_LINE);
    } catch (const std::invalid_argument &error) {
        syslog(LOG_ERR, "%s:%d %s", SOURCE_LINE, error.what());
    } catch (const sso_err_resp &error) {
        syslog(LOG_ERR, "%s:%d %s", SOURCE_LINE, error.what());
    }
}

void SSOClient::RequestTokenEndpoint(std::string &response, const std::string &body) {
    try {
        httpPost(tokenEndpoint, body, response, true, AppendChunk);
    } catch (const std::bad_alloc &) {
        syslog(LOG_ERR, "%s:%d bad_alloc. %m", SOURCE_LINE);
    } catch (const std::invalid_argument &error) {
        syslog(LOG_ERR, "%s:%d %s", SOURCE_LINE, error.what());
    } catch (const sso_err_resp &error) {
        syslog(LOG_ERR, "%s:%d request token uri %s.", SOURCE_LINE, error.what());
    }
}

void SSOClient::VerifyIDToken() { throw sso_not_implemented("VerifyIDToken not implemented"); }

std::string SSOClient::GetIDTokenReqParams() { throw sso_not_implemented("GetIDTokenReqParams not implemented"); }

void SSOClient::GetUserName(std::string & /*userName*/) { throw sso_not_implemented("GetUserName not implemented"); }

void SSOClient::ProcessTokenResponse(std::string /*response*/) {
    throw sso_not_implemented("ProcessTokenResponse not implemented");
}

void SSOClient::OpenIDConnectLogin(std::string authorizationCode, std::string &userName) {
    SetCode(std::move(authorizationCode));
    std::string body = GetIDTokenReqParams();
    const Utils::CleanseTextOnExit cleanseBody(body);  // contains the client secret
    std::string response;
    const Utils::CleanseTextOnExit cleanseResponse(response);  // contains the user's tokens
    RequestTokenEndpoint(response, body);
    ProcessTokenResponse(response);
    VerifyIDToken();
    GetUserName(userName);
}

void OIDCLogin(const std::string &code, std::string &userName) {
    // Does not raise ids: a program that cannot read the profile must not log users in.
    Json::Value file;
    if (!Utils::LoadJsonFile(kProfileFile, file)) {
        throw sso_op_failed("read profile file failed.");
    }
    bool enable = false;
    if (!Utils::ReadMember(file, kProfileEnable, enable) || !enable) {
        throw sso_op_failed("sso does not enable.");
    }
    std::string profile;
    if (!Utils::ReadMember(file, kProfileName, profile)) {
        throw sso_op_failed("not specify sso profile");
    }
    WithClient(profile, [&](SSOClient &client) { client.OpenIDConnectLogin(code, userName); });
}

std::string GetSSORelayURL(bool success, const std::string &state, const std::string &reason) {
    std::string query;
    if (success) {
        std::string text;
        Json::Value stateInfo;
        std::string origin;
        if (DecodeBase64(state, text) && Utils::ParseJson(text, stateInfo) &&
            Utils::ReadMember(stateInfo, kOrigin, origin)) {
            query += "origin=" + URLEncode(origin) + "&";
        }
        query += "success=true";
    } else {
        if (!reason.empty()) {
            query += "reason=" + reason + "&";
        }
        query += "success=false";
    }
    return "ssoclient/relay.html#" + query;
}

}  // namespace TAVO::SSO
