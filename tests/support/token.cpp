#include "tests/support/token.h"

#include <openssl/bn.h>
#include <openssl/core_names.h>
#include <openssl/hmac.h>
#include <openssl/pem.h>
#include <openssl/rsa.h>

#include <sstream>
#include <stdexcept>
#include <vector>

#include "tests/support/encoding.h"

namespace Test {

namespace {

const unsigned char *Bytes(const std::string &text) { return reinterpret_cast<const unsigned char *>(text.data()); }

void Require(bool condition, const char *what) {
    if (!condition) {
        throw std::runtime_error(what);
    }
}

std::string Component(EVP_PKEY *key, const char *name) {
    BIGNUM *number = nullptr;
    Require(EVP_PKEY_get_bn_param(key, name, &number) == 1, name);
    std::string bytes(static_cast<std::size_t>(BN_num_bytes(number)), '\0');
    BN_bn2bin(number, reinterpret_cast<unsigned char *>(bytes.data()));
    BN_free(number);
    return Base64Url(bytes);
}

}  // namespace

std::string Compact(const Json::Value &value) {
    Json::StreamWriterBuilder writer;
    writer["indentation"] = "";
    return Json::writeString(writer, value);
}

Json::Value Parse(const std::string &text) {
    std::istringstream stream(text);
    Json::Value value;
    stream >> value;
    return value;
}

std::string SigningInput(const Json::Value &header, const Json::Value &claims) {
    return Base64Url(Compact(header)) + "." + Base64Url(Compact(claims));
}

std::string SignHMAC(const std::string &signingInput, const std::string &secret, const EVP_MD *digest) {
    unsigned char mac[EVP_MAX_MD_SIZE];
    unsigned int length = 0;
    Require(HMAC(digest, secret.data(), static_cast<int>(secret.size()), Bytes(signingInput), signingInput.size(), mac,
                 &length) != nullptr,
            "HMAC");
    return Base64Url(std::string(reinterpret_cast<char *>(mac), length));
}

std::string HS256Token(const Json::Value &claims, const std::string &secret) {
    const std::string signingInput = SigningInput(Parse(R"({"alg": "HS256", "typ": "JWT"})"), claims);
    return signingInput + "." + SignHMAC(signingInput, secret, EVP_sha256());
}

RSAKey::RSAKey(unsigned int bits) : key_(EVP_RSA_gen(bits), EVP_PKEY_free) { Require(key_ != nullptr, "EVP_RSA_gen"); }

std::string RSAKey::Sign(const std::string &signingInput, const EVP_MD *digest) const {
    const std::shared_ptr<EVP_MD_CTX> context(EVP_MD_CTX_new(), EVP_MD_CTX_free);
    std::size_t length = 0;
    Require(EVP_DigestSignInit(context.get(), nullptr, digest, nullptr, key_.get()) == 1, "EVP_DigestSignInit");
    Require(EVP_DigestSign(context.get(), nullptr, &length, Bytes(signingInput), signingInput.size()) == 1, "length");
    std::string signature(length, '\0');
    Require(EVP_DigestSign(context.get(), reinterpret_cast<unsigned char *>(signature.data()), &length,
                           Bytes(signingInput), signingInput.size()) == 1,
            "EVP_DigestSign");
    return Base64Url(signature);
}

std::string RSAKey::RS256Token(const Json::Value &claims, const std::string &kid) const {
    Json::Value header = Parse(R"({"alg": "RS256", "typ": "JWT"})");
    header["kid"] = kid;
    const std::string signingInput = SigningInput(header, claims);
    return signingInput + "." + Sign(signingInput, EVP_sha256());
}

Json::Value RSAKey::JWK(const std::string &kid) const {
    Json::Value key;
    key["kty"] = "RSA";
    key["use"] = "sig";
    key["kid"] = kid;
    key["n"] = Component(key_.get(), OSSL_PKEY_PARAM_RSA_N);
    key["e"] = Component(key_.get(), OSSL_PKEY_PARAM_RSA_E);
    return key;
}

std::string RSAKey::PublicPEM() const {
    const std::shared_ptr<BIO> memory(BIO_new(BIO_s_mem()), BIO_free);
    Require(memory && PEM_write_bio_PUBKEY(memory.get(), key_.get()) == 1, "PEM_write_bio_PUBKEY");
    char *text = nullptr;
    const long length = BIO_get_mem_data(memory.get(), &text);
    return {text, static_cast<std::size_t>(length)};
}

const RSAKey &ProviderKey() {
    static const RSAKey key;
    return key;
}

}  // namespace Test
