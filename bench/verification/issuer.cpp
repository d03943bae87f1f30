#include "bench/verification/issuer.h"

#include <cstdlib>

#include "bench/verification/signed_token.h"
#include "tests/support/authority.h"
#include "tests/support/token.h"

namespace Bench {

Issuer::Issuer(const std::vector<unsigned int> &sizesOfKeys) : server_(Test::CertificateFor("IP:127.0.0.1")) {
    Test::TrustAuthority();
    setenv("no_proxy", "*", 1);           // a proxy that the environment names does not know this machine's loopback
    setenv("XDG_CACHE_HOME", "/tmp", 1);  // where fetched keys are kept
    Json::Value discovery;
    discovery["issuer"] = name();
    discovery["jwks_uri"] = server_.URL("/keys");
    server_.Answer(Test::HTTPAnswer(Test::Compact(discovery)));
    server_.Play([sizesOfKeys](Test::Connection &connection) {
        connection.ReceiveRequest();
        Json::Value keys;
        for (const unsigned int bits : sizesOfKeys) {
            Json::Value key = PublicKey(bits);
            key["alg"] = "RS256";
            keys["keys"].append(key);
        }
        connection.Send(Test::HTTPAnswer(Test::Compact(keys)));
    });
}

}  // namespace Bench
