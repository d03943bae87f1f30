#ifndef TAVOSSO_TESTS_SUPPORT_AUTHORITY_H
#define TAVOSSO_TESTS_SUPPORT_AUTHORITY_H

#include <openssl/evp.h>
#include <openssl/x509.h>

#include <memory>
#include <string>
#include <vector>

// A generated certificate authority and server certificates. Valid ones are valid at every clock setting of the tests.
namespace Test {

struct Credentials {
    std::shared_ptr<EVP_PKEY> key;
    std::shared_ptr<X509> certificate;
    std::shared_ptr<X509> intermediate = nullptr;  // sent by a server after its own
};

/// The content of a certificate. The defaults are those of a valid server.
struct CertificateText {
    std::string alternativeName;  // such as "DNS:localhost" or "IP:127.0.0.1"; none if empty
    std::string commonName = "Server of this test run";
    std::string basicConstraints = "critical,CA:FALSE";
    std::string extendedKeyUsage = "serverAuth";
    std::string notBefore = "20000101000000Z";
    std::string notAfter = "20990101000000Z";
};

std::shared_ptr<EVP_PKEY> EllipticKey();

/// A certificate for the key, signed by the issuer; self-signed if `issuer` is null.
Credentials Certify(const CertificateText &text, const Credentials *issuer,
                    const std::shared_ptr<EVP_PKEY> &key = EllipticKey(), const EVP_MD *digest = EVP_sha256());

/// The content of an authority's certificate.
CertificateText AuthorityText(const std::string &commonName);

/// The authority of this program.
const Credentials &Authority();

/// Makes the system trust only the authority and `others`.
void TrustAuthority(const std::vector<Credentials> &others = {});

/// A valid certificate for a name such as "DNS:localhost" or "IP:127.0.0.1".
Credentials CertificateFor(const std::string &name);

/// The same, expired.
Credentials ExpiredCertificateFor(const std::string &name);

Credentials SelfSignedCertificateFor(const std::string &name);

}  // namespace Test

#endif
