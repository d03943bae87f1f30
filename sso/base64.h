#ifndef TAVOSSO_SSO_BASE64_H
#define TAVOSSO_SSO_BASE64_H

#include <cstddef>
#include <string>

// Base64 with the platform's encoder and decoder, and the limits that follow from their buffers.
namespace TAVO::SSO {

/// Of each buffer that the platform fills, in bytes.
constexpr std::size_t kPlatformBuffer = 1024;

/// In bytes: the base64 text and its NUL fill the buffer.
constexpr std::size_t kLongestEncoded = (kPlatformBuffer - 1) / 4 * 3;

/// Of WebSphere: it is encoded as the key of the tokens' signatures.
constexpr std::size_t kLongestSecret = kLongestEncoded;

/// Of a caller, as compact JSON. The digest of the nonce is added to it, and a line feed, for which the NUL counts
/// here.
constexpr std::size_t kLongestState = kLongestEncoded - sizeof R"(,"nonce":"0123456789abcdef0123456789abcdef")";

/// Throws sso_op_failed "encode base64 failed." if the platform refuses, as it does above `kLongestEncoded`.
std::string EncodeBase64(const std::string &bytes);

/// Writes the decoded text up to its first NUL. Returns false if the platform refuses.
bool DecodeBase64(const std::string &text, std::string &decoded);

}  // namespace TAVO::SSO

#endif
