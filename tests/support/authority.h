#ifndef TAVOSSO_TESTS_SUPPORT_AUTHORITY_H
#define TAVOSSO_TESTS_SUPPORT_AUTHORITY_H

#include <openssl/evp.h>
#include <openssl/x509.h>

#include <memory>
#include <string>

// A certificate authority made for this run, and what servers show to their clients. All that is valid is so whatever
// time a test's clock tells.
namespace Test {

struct Credentials {
    std::shared_ptr<EVP_PKEY> key;
    std::shared_ptr<X509> certificate;
};

/// Makes the authority the only one that this machine trusts.
void TrustAuthority();

/// What a server shows under a name such as "DNS:localhost" or "IP:127.0.0.1".
Credentials CertificateFor(const std::string &name);

/// The authority's as well, but it ran out long ago.
Credentials ExpiredCertificateFor(const std::string &name);

/// One that no authority stands behind.
Credentials SelfSignedCertificateFor(const std::string &name);

}  // namespace Test

#endif
