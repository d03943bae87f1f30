#include "tests/support/authority.h"

#include <openssl/bio.h>
#include <openssl/ec.h>
#include <openssl/pem.h>
#include <openssl/x509v3.h>

#include <stdexcept>

#include "tests/support/files.h"

namespace Test {

namespace {

void Require(bool condition, const char *what) {
    if (!condition) {
        throw std::runtime_error(what);
    }
}

/// Does nothing if the value is empty.
void AddExtension(X509 *certificate, int nid, const std::string &value) {
    if (value.empty()) {
        return;
    }
    const std::shared_ptr<X509_EXTENSION> extension(X509V3_EXT_conf_nid(nullptr, nullptr, nid, value.c_str()),
                                                    X509_EXTENSION_free);
    Require(extension != nullptr, value.c_str());
    Require(X509_add_ext(certificate, extension.get(), -1) == 1, "X509_add_ext");
}

void SetNames(X509 *certificate, const std::string &commonName, const X509 *issuer) {
    X509_NAME *subject = X509_get_subject_name(certificate);
    const auto *name = reinterpret_cast<const unsigned char *>(commonName.c_str());
    Require(X509_NAME_add_entry_by_txt(subject, "CN", MBSTRING_ASC, name, -1, -1, 0) == 1 &&
                X509_set_issuer_name(certificate, X509_get_subject_name(issuer)) == 1,
            "names of a certificate");
}

std::string PEM(const Credentials &credentials) {
    const std::shared_ptr<BIO> text(BIO_new(BIO_s_mem()), BIO_free);
    Require(PEM_write_bio_X509(text.get(), credentials.certificate.get()) == 1, "PEM_write_bio_X509");
    char *bytes = nullptr;
    const long length = BIO_get_mem_data(text.get(), &bytes);
    return {bytes, static_cast<std::size_t>(length)};
}

CertificateText ServerText(const std::string &name) {
    CertificateText text;
    text.alternativeName = name;
    return text;
}

}  // namespace

std::shared_ptr<EVP_PKEY> EllipticKey() { return {EVP_EC_gen("P-256"), EVP_PKEY_free}; }

Credentials Certify(const CertificateText &text, const Credentials *issuer, const std::shared_ptr<EVP_PKEY> &key,
                    const EVP_MD *digest) {
    const Credentials made{key, {X509_new(), X509_free}};
    Require(made.key && made.certificate, "EVP_EC_gen or X509_new");
    const Credentials &signer = issuer == nullptr ? made : *issuer;
    X509 *certificate = made.certificate.get();
    SetNames(certificate, text.commonName, signer.certificate.get());
    Require(X509_set_version(certificate, X509_VERSION_3) == 1 &&
                ASN1_INTEGER_set(X509_get_serialNumber(certificate), issuer == nullptr ? 1 : 2) == 1 &&
                ASN1_TIME_set_string_X509(X509_getm_notBefore(certificate), text.notBefore.c_str()) == 1 &&
                ASN1_TIME_set_string_X509(X509_getm_notAfter(certificate), text.notAfter.c_str()) == 1 &&
                X509_set_pubkey(certificate, made.key.get()) == 1,
            "fields of a certificate");
    AddExtension(certificate, NID_basic_constraints, text.basicConstraints);
    AddExtension(certificate, NID_subject_alt_name, text.alternativeName);
    AddExtension(certificate, NID_ext_key_usage, text.extendedKeyUsage);
    Require(X509_sign(certificate, signer.key.get(), digest) != 0, "X509_sign");
    return made;
}

CertificateText AuthorityText(const std::string &commonName) {
    CertificateText text;
    text.commonName = commonName;
    text.basicConstraints = "critical,CA:TRUE";
    text.extendedKeyUsage = "";
    return text;
}

const Credentials &Authority() {
    static const Credentials authority = Certify(AuthorityText("Authority of this test run"), nullptr);
    return authority;
}

void TrustAuthority(const std::vector<Credentials> &others) {
    std::string bundle = PEM(Authority());
    for (const Credentials &other : others) {
        bundle += PEM(other);
    }
    WriteFile(kTrustedAuthorities, bundle);
}

Credentials CertificateFor(const std::string &name) { return Certify(ServerText(name), &Authority()); }

Credentials ExpiredCertificateFor(const std::string &name) {
    CertificateText text = ServerText(name);
    text.notAfter = "20010101000000Z";
    return Certify(text, &Authority());
}

Credentials SelfSignedCertificateFor(const std::string &name) { return Certify(ServerText(name), nullptr); }

}  // namespace Test
