#ifndef TAVOSSO_SSO_BASE64_H
#define TAVOSSO_SSO_BASE64_H

#include <string>

// Base64 with the platform's encoder and decoder.
namespace TAVO::SSO {

/// Throws sso_op_failed "encode base64 failed." if the platform fails, for example above `kLongestEncoded` bytes.
std::string EncodeBase64(const std::string &bytes);

/// Writes the decoded text up to its first NUL. Returns false if the platform fails.
bool DecodeBase64(const std::string &text, std::string &decoded);

}  // namespace TAVO::SSO

#endif
