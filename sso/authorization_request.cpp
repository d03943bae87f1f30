#include "sso/authorization_request.h"

#include <boost/random/mersenne_twister.hpp>
#include <boost/uuid/detail/random_provider.hpp>
#include <boost/uuid/random_generator.hpp>
#include <boost/uuid/uuid_io.hpp>
#include <ostream>

#include "sso/base64.h"
#include "sso/names.h"
#include "sso/parameters.h"
#include "sso/sso.h"
#include "utils/json.h"

namespace TAVO::SSO {

/// `std::cout`, by the name that it has for the linker. <iostream> declares it, too, and puts an initialiser into every
/// library that includes it: that one would run in each program that loads this library.
extern std::ostream standardOutput __asm__("_ZSt4cout");

namespace {

std::string MakeNonce() {
    // By the provider that the generator seeds an engine of its own with. That engine it would lose when the system has
    // no random numbers.
    boost::uuids::detail::random_provider entropy;
    boost::random::mt19937 engine(entropy);
    return to_string(boost::uuids::basic_random_generator<boost::random::mt19937>(engine)());
}

/// The state carries the digest of the nonce and not the nonce: a front end can tie the ID token to its request by it,
/// while the state alone does not give the nonce away.
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

void WriteRedirect(const std::string &uri) {
    // A program without <iostream> of its own has not made the stream ready.
    static const std::ios_base::Init initialised;
    standardOutput << "Location: " + uri + "\n\n";
}

}  // namespace TAVO::SSO
