#include "sso/authorization_request.h"

#include <boost/uuid/random_generator.hpp>
#include <boost/uuid/uuid_io.hpp>
#include <iostream>

#include "sso/base64.h"
#include "sso/names.h"
#include "sso/parameters.h"
#include "sso/sso.h"
#include "utils/json.h"

namespace TAVO::SSO {

namespace {

std::string MakeNonce() { return to_string(boost::uuids::random_generator_mt19937()()); }

/// Adds the digest of the nonce to the state. A front end compares it with the ID token; the nonce stays secret.
std::string MakeState(const Json::Value &stateInfo, const std::string &nonce) {
    return EncodeBase64(Utils::WriteCompactJson(Utils::WithMember(stateInfo, kNonce, MD5Digest(nonce))));
}

}  // namespace

std::string AuthorizationURI(const AuthorizationRequest &request, const Json::Value &stateInfo) {
    const std::string nonce = MakeNonce();
    return request.endpoint + WriteQuery({
                                  {kClientID, request.clientID},
                                  {kNonce, nonce},
                                  {kRedirectURI, request.redirectURI},
                                  {kResponseType, kCode},
                                  {kScope, request.scope},
                                  {kState, MakeState(stateInfo, nonce)},
                              });
}

void WriteRedirect(const std::string &uri) { std::cout << "Location: " + uri + "\n\n"; }

}  // namespace TAVO::SSO
