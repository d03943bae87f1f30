#ifndef TAVOSSO_SSO_BASE64_H
#define TAVOSSO_SSO_BASE64_H

#include <string>

// Base64 texts by the platform's coder, in its buffers of 1024 bytes.
namespace TAVO::SSO {

/// Throws sso_op_failed "encode base64 failed." when the platform refuses, as it does for more than 765 bytes.
std::string EncodeBase64(const std::string &bytes);

/// The decoded text up to its first NUL. False when the platform refuses.
bool DecodeBase64(const std::string &text, std::string &decoded);

}  // namespace TAVO::SSO

#endif
