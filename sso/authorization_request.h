#ifndef TAVOSSO_SSO_AUTHORIZATION_REQUEST_H
#define TAVOSSO_SSO_AUTHORIZATION_REQUEST_H

#include <json/json.h>

#include <string>

namespace TAVO::SSO {

/// What of an authorization request is the client's own.
struct AuthorizationRequest {
    const std::string &endpoint;
    const std::string &clientID;
    const std::string &redirectURI;
    const char *scope;
};

/// The address that the browser is sent to for signing in, with a fresh nonce, and the caller's state with the digest
/// of that nonce. Throws as the clients' GetAccessTokenReqURI tells.
std::string AuthorizationURI(const AuthorizationRequest &request, const Json::Value &stateInfo);

/// Writes the CGI redirect to that address on standard output, unflushed.
void WriteRedirect(const std::string &uri);

}  // namespace TAVO::SSO

#endif
