#ifndef TAVOSSO_TESTS_FUZZ_ORACLE_H
#define TAVOSSO_TESTS_FUZZ_ORACLE_H

#include <json/json.h>
#include <openssl/evp.h>

#include <optional>
#include <string>
#include <vector>

// What the targets hold the library against, worked out without it: by tables of their own, and by OpenSSL's calls that
// the library does not use.
namespace Fuzz {

std::string UpToNUL(const std::string &text);
std::vector<std::string> Split(const std::string &text, char separator);

/// Base64 or base64url. A text that is not well-formed is read as OpenSSL reads it, where that takes it at all: up to
/// the first character that does not belong, without white space, and padding in the middle counts as zero bits.
struct Decoded {
    std::string bytes;
    bool wellFormed = true;
};

/// Up to the first NUL, with padding or without.
Decoded DecodeBase64(const std::string &text);

/// Standard base64 with padding.
std::string EncodeBase64(const std::string &bytes);

/// The bytes of a text that is exactly what EncodeBase64 makes of them; nothing of any other.
std::optional<std::string> DecodeCanonicalBase64(const std::string &text);

std::string PercentEncode(const std::string &text);

/// By the reader that everything of the library's is read with; nothing where it refuses.
std::optional<Json::Value> ParseJson(const std::string &text);

/// A member of an object; null where there is none.
const Json::Value *Member(const Json::Value &document, const std::string &name);

/// A member that must be a string.
std::optional<std::string> StringMember(const Json::Value &document, const std::string &name);

/// A member as text: missing ones and null are empty, lists and objects have none.
std::optional<std::string> TextMember(const Json::Value &document, const std::string &name);

/// Bytes, not texts.
bool RSAVerifies(const std::string &n, const std::string &e, const std::string &signature,
                 const std::string &signingInput, const EVP_MD *digest);

/// The signature as it stands in a token.
std::string HMACSignature(const std::string &key, const std::string &signingInput, const EVP_MD *digest);

/// SHA-256, SHA-384 or SHA-512 for the name of an algorithm that begins with these two letters; else null.
const EVP_MD *DigestOf(const std::string &algorithm, const std::string &family);

}  // namespace Fuzz

#endif
