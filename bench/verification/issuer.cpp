#include "bench/verification/issuer.h"

#include <cstdlib>

#include "bench/verification/signed_token.h"
#include "tests/support/authority.h"
#include "tests/support/token.h"

namespace Bench {

Issuer::Issuer(std::initializer_list<unsigned int> sizesOfKeys) : server_(Test::CertificateFor("IP:127.0.0.1")) {
    Test::TrustAuthority();
    setenv("no_proxy", "*", 1);           // a proxy that the environment names does not know this machine's loopback
    setenv("XDG_CACHE_HOME", "/tmp", 1);  // where fetched keys are kept
    Json::Value discovery;
    discovery["issuer"] = name();
    discovery["jwks_uri"] = server_.URL("/keys");
    Json::Value keys;
    for (const unsigned int bits : sizesOfKeys) {
        keys["keys"].append(PublicKey(bits));
        keys["keys"][keys["keys"].size() - 1]["alg"] = "RS256";
    }
    server_.Answer(Test::HTTPAnswer(Test::Compact(discovery)));
    server_.Answer(Test::HTTPAnswer(Test::Compact(keys)));
}

}  // namespace Bench
