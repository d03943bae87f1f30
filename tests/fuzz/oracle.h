#ifndef TAVOSSO_TESTS_FUZZ_ORACLE_H
#define TAVOSSO_TESTS_FUZZ_ORACLE_H

#include <json/json.h>
#include <openssl/evp.h>

#include <optional>
#include <string>
#include <vector>

// Expected results, computed with separate tables and with OpenSSL calls that the library does not use.
namespace Fuzz {

std::string UpToNUL(const std::string &text);
std::vector<std::string> Split(const std::string &text, char separator);

/// Base64 or base64url. Malformed text is decoded like by OpenSSL: up to the first invalid character, without white
/// space, with padding inside the text as zero bits.
struct Decoded {
    std::string bytes;
    bool wellFormed = true;
};

/// Decodes up to the first NUL; padding is optional.
Decoded DecodeBase64(const std::string &text);

/// Standard base64 with padding.
std::string EncodeBase64(const std::string &bytes);

/// The decoded bytes if the text is exactly the encoding of these bytes.
std::optional<std::string> DecodeCanonicalBase64(const std::string &text);

std::string PercentEncode(const std::string &text);

/// Parsed by the reader that the library uses; empty if malformed.
std::optional<Json::Value> ParseJson(const std::string &text);

/// A member of an object, or null.
const Json::Value *Member(const Json::Value &document, const std::string &name);

/// A string member.
std::optional<std::string> StringMember(const Json::Value &document, const std::string &name);

/// A member as text. Missing members and null are empty; lists and objects have no text.
std::optional<std::string> TextMember(const Json::Value &document, const std::string &name);

/// All arguments are raw bytes.
bool RSAVerifies(const std::string &n, const std::string &e, const std::string &signature,
                 const std::string &signingInput, const EVP_MD *digest);

/// The encoded signature.
std::string HMACSignature(const std::string &key, const std::string &signingInput, const EVP_MD *digest);

/// SHA-256, SHA-384 or SHA-512 for an algorithm of the family "RS" or "HS"; else null.
const EVP_MD *DigestOf(const std::string &algorithm, const std::string &family);

}  // namespace Fuzz

#endif
