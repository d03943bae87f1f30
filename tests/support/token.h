#ifndef TAVOSSO_TESTS_SUPPORT_TOKEN_H
#define TAVOSSO_TESTS_SUPPORT_TOKEN_H

#include <json/json.h>
#include <openssl/evp.h>

#include <memory>
#include <string>

// Signs tokens like an identity provider, with high-level OpenSSL functions, independent of the code under test.
namespace Test {

std::string Compact(const Json::Value &value);
Json::Value Parse(const std::string &text);

/// The signing input: header and claims, encoded.
std::string SigningInput(const Json::Value &header, const Json::Value &claims);

std::string SignHMAC(const std::string &signingInput, const std::string &secret, const EVP_MD *digest);

/// A token signed with HS256.
std::string HS256Token(const Json::Value &claims, const std::string &secret);

/// A generated RSA key pair.
class RSAKey {
  public:
    explicit RSAKey(unsigned int bits = 2048);

    std::string Sign(const std::string &signingInput, const EVP_MD *digest) const;

    /// A token signed with RS256. Its header names this key.
    std::string RS256Token(const Json::Value &claims, const std::string &kid) const;

    /// The public key as a JSON Web Key (RFC 7517).
    Json::Value JWK(const std::string &kid) const;

    /// The public key in PEM (RFC 7468, section 13).
    std::string PublicPEM() const;

  private:
    std::shared_ptr<EVP_PKEY> key_;
};

/// One 2048-bit key for the whole program, because generating one takes longer than most tests.
const RSAKey &ProviderKey();

}  // namespace Test

#endif
