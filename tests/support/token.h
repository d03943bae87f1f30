#ifndef TAVOSSO_TESTS_SUPPORT_TOKEN_H
#define TAVOSSO_TESTS_SUPPORT_TOKEN_H

#include <json/json.h>
#include <openssl/evp.h>

#include <memory>
#include <string>

// What an identity provider does with tokens, by OpenSSL's high-level calls: independent of the code under test.
namespace Test {

std::string Compact(const Json::Value &value);
Json::Value Parse(const std::string &text);

/// header.claims, each encoded: what gets signed.
std::string SigningInput(const Json::Value &header, const Json::Value &claims);

std::string SignHMAC(const std::string &signingInput, const std::string &secret, const EVP_MD *digest);

/// A whole token signed with HS256 under the secret.
std::string HS256Token(const Json::Value &claims, const std::string &secret);

/// An RSA key pair made for this run.
class RSAKey {
  public:
    explicit RSAKey(unsigned int bits = 2048);

    std::string Sign(const std::string &signingInput, const EVP_MD *digest) const;

    /// A whole token signed with RS256, its header naming this key.
    std::string RS256Token(const Json::Value &claims, const std::string &kid) const;

    /// The public key as a JSON Web Key (RFC 7517).
    Json::Value JWK(const std::string &kid) const;

    /// The public key in PEM (RFC 7468, section 13).
    std::string PublicPEM() const;

  private:
    std::shared_ptr<EVP_PKEY> key_;
};

/// One 2048-bit key for the whole program: making one takes longer than most tests.
const RSAKey &ProviderKey();

}  // namespace Test

#endif
