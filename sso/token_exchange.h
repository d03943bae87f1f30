#ifndef TAVOSSO_SSO_TOKEN_EXCHANGE_H
#define TAVOSSO_SSO_TOKEN_EXCHANGE_H

#include <json/json.h>

#include <string>

namespace TAVO::SSO {

/// Returns the form that exchanges a code for a token (RFC 6749, sections 2.3.1 and 4.1.3).
std::string TokenRequestBody(const std::string &clientID, const std::string &clientSecret, const std::string &code,
                             const std::string &redirectURI);

/// Throws std::invalid_argument "parse json falied" if the response is not JSON.
Json::Value ParseTokenResponse(const std::string &response);

/// Throws sso_err_resp "we cannot find key 'id_token' in response!" if "id_token" is missing or not a string.
std::string FindIDToken(const Json::Value &tokenResponse);

}  // namespace TAVO::SSO

#endif
