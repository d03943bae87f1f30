#include "sso/token_exchange.h"

#include <stdexcept>

#include "sso/names.h"
#include "sso/parameters.h"
#include "sso/sso.h"
#include "utils/cleanse.h"
#include "utils/json.h"

namespace TAVO::SSO {

std::string TokenRequestBody(const std::string &clientID, const std::string &clientSecret, const std::string &code,
                             const std::string &redirectURI) {
    Parameters parameters;  // an initialiser list would keep copies of the secrets
    parameters[kClientID] = clientID;
    parameters[kClientSecret] = clientSecret;
    const Utils::CleanseTextOnExit cleanseSecret(parameters[kClientSecret]);
    parameters[kCode] = code;
    const Utils::CleanseTextOnExit cleanseCode(parameters[kCode]);
    parameters[kGrantType] = kAuthorizationCode;
    parameters[kRedirectURI] = redirectURI;
    return WriteForm(parameters);
}

Json::Value ParseTokenResponse(const std::string &response) {
    Json::Value tokenResponse;
    if (!Utils::ParseJson(response, tokenResponse)) {
        throw std::invalid_argument("parse json falied");
    }
    return tokenResponse;
}

std::string FindIDToken(const Json::Value &tokenResponse) {
    std::string token;
    if (!Utils::ReadMember(tokenResponse, kIDToken, token)) {
        throw sso_err_resp("we cannot find key 'id_token' in response!");
    }
    return token;
}

}  // namespace TAVO::SSO
