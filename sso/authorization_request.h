#ifndef TAVOSSO_SSO_AUTHORIZATION_REQUEST_H
#define TAVOSSO_SSO_AUTHORIZATION_REQUEST_H

#include <json/json.h>

#include <string>

namespace TAVO::SSO {

/// The values of an authorization request that differ between clients.
struct AuthorizationRequest {
    const std::string &endpoint;
    const std::string &clientID;
    const std::string &redirectURI;
    const char *scope;
};

/// Implements AzureSSOClient::GetAccessTokenReqURI. Throws as documented there.
std::string AuthorizationURI(const AuthorizationRequest &request, const Json::Value &stateInfo);

/// Writes the CGI redirect to standard output, unflushed.
void WriteRedirect(const std::string &uri);

}  // namespace TAVO::SSO

#endif
