#include "tests/support/authority.h"

#include <openssl/bio.h>
#include <openssl/ec.h>
#include <openssl/pem.h>
#include <openssl/x509v3.h>

#include <stdexcept>

#include "tests/support/files.h"

namespace Test {

namespace {

constexpr char kLongAgo[] = "20000101000000Z";
constexpr char kSoonAfter[] = "20010101000000Z";
constexpr char kFarAhead[] = "20990101000000Z";

struct Description {
    std::string commonName;
    std::string basicConstraints;
    std::string alternativeName;  // none if empty
    const char *notAfter;
};

void Require(bool condition, const char *what) {
    if (!condition) {
        throw std::runtime_error(what);
    }
}

void AddExtension(X509 *certificate, int nid, const std::string &value) {
    const std::shared_ptr<X509_EXTENSION> extension(X509V3_EXT_conf_nid(nullptr, nullptr, nid, value.c_str()),
                                                    X509_EXTENSION_free);
    Require(extension != nullptr, value.c_str());
    Require(X509_add_ext(certificate, extension.get(), -1) == 1, "X509_add_ext");
}

/// Issued by itself where there is no issuer.
Credentials Issue(const Description &description, const Credentials *issuer) {
    const Credentials made{{EVP_EC_gen("P-256"), EVP_PKEY_free}, {X509_new(), X509_free}};
    Require(made.key && made.certificate, "EVP_EC_gen or X509_new");
    X509 *certificate = made.certificate.get();
    X509_NAME *subject = X509_get_subject_name(certificate);
    const bool filled = X509_set_version(certificate, X509_VERSION_3) == 1 &&
                        ASN1_INTEGER_set(X509_get_serialNumber(certificate), issuer == nullptr ? 1 : 2) == 1 &&
                        ASN1_TIME_set_string_X509(X509_getm_notBefore(certificate), kLongAgo) == 1 &&
                        ASN1_TIME_set_string_X509(X509_getm_notAfter(certificate), description.notAfter) == 1 &&
                        X509_NAME_add_entry_by_txt(
                            subject, "CN", MBSTRING_ASC,
                            reinterpret_cast<const unsigned char *>(description.commonName.c_str()), -1, -1, 0) == 1 &&
                        X509_set_pubkey(certificate, made.key.get()) == 1;
    Require(filled, "fields of a certificate");
    const Credentials &signer = issuer == nullptr ? made : *issuer;
    Require(X509_set_issuer_name(certificate, X509_get_subject_name(signer.certificate.get())) == 1, "issuer");
    AddExtension(certificate, NID_basic_constraints, description.basicConstraints);
    if (!description.alternativeName.empty()) {
        AddExtension(certificate, NID_subject_alt_name, description.alternativeName);
    }
    Require(X509_sign(certificate, signer.key.get(), EVP_sha256()) != 0, "X509_sign");
    return made;
}

const Credentials &Authority() {
    static const Credentials authority =
        Issue({"Authority of this test run", "critical,CA:TRUE", "", kFarAhead}, nullptr);
    return authority;
}

Description Server(const std::string &name, const char *notAfter) {
    return {"Server of this test run", "critical,CA:FALSE", name, notAfter};
}

}  // namespace

void TrustAuthority() {
    const std::shared_ptr<BIO> text(BIO_new(BIO_s_mem()), BIO_free);
    Require(PEM_write_bio_X509(text.get(), Authority().certificate.get()) == 1, "PEM_write_bio_X509");
    char *bytes = nullptr;
    const long length = BIO_get_mem_data(text.get(), &bytes);
    WriteFile(kTrustedAuthorities, std::string(bytes, static_cast<std::size_t>(length)));
}

Credentials CertificateFor(const std::string &name) { return Issue(Server(name, kFarAhead), &Authority()); }

Credentials ExpiredCertificateFor(const std::string &name) { return Issue(Server(name, kSoonAfter), &Authority()); }

Credentials SelfSignedCertificateFor(const std::string &name) { return Issue(Server(name, kFarAhead), nullptr); }

}  // namespace Test
