#ifndef TAVOSSO_TESTS_SUPPORT_AUTHORITY_H
#define TAVOSSO_TESTS_SUPPORT_AUTHORITY_H

#include <openssl/evp.h>
#include <openssl/x509.h>

#include <memory>
#include <string>
#include <vector>

// A certificate authority made for this run, and what servers show to their clients. All that is valid is so whatever
// time a test's clock tells.
namespace Test {

struct Credentials {
    std::shared_ptr<EVP_PKEY> key;
    std::shared_ptr<X509> certificate;
};

/// What a certificate says; as it stands, what a good server's does.
struct CertificateText {
    std::string alternativeName;  // such as "DNS:localhost" or "IP:127.0.0.1"; none if empty
    std::string commonName = "Server of this test run";
    std::string basicConstraints = "critical,CA:FALSE";
    std::string extendedKeyUsage = "serverAuth";
    std::string notBefore = "20000101000000Z";
    std::string notAfter = "20990101000000Z";
};

std::shared_ptr<EVP_PKEY> EllipticKey();

/// A certificate for the key, signed by the issuer, or by itself where there is none.
Credentials Certify(const CertificateText &text, const Credentials *issuer,
                    const std::shared_ptr<EVP_PKEY> &key = EllipticKey(), const EVP_MD *digest = EVP_sha256());

/// What an authority's own certificate says.
CertificateText AuthorityText(const std::string &commonName);

/// The one that this machine trusts, if it trusts any.
const Credentials &Authority();

/// Makes the authority, and others if any are told, the only ones that this machine trusts.
void TrustAuthority(const std::vector<Credentials> &others = {});

/// What a server shows under a name such as "DNS:localhost" or "IP:127.0.0.1".
Credentials CertificateFor(const std::string &name);

/// The authority's as well, but it ran out long ago.
Credentials ExpiredCertificateFor(const std::string &name);

/// One that no authority stands behind.
Credentials SelfSignedCertificateFor(const std::string &name);

}  // namespace Test

#endif
