#include "sso/base64.h"

#include <cstring>

#include "platform/platform.h"
#include "sso/limits.h"
#include "sso/sso.h"
#include "utils/cleanse.h"

namespace TAVO::SSO {

namespace {

/// The platform may fill the buffer without a NUL.
std::string TextIn(const char (&buffer)[kPlatformBuffer]) { return {buffer, strnlen(buffer, kPlatformBuffer)}; }

}  // namespace

std::string EncodeBase64(const std::string &bytes) {
    char buffer[kPlatformBuffer] = {};
    const Utils::CleanseOnExit cleanse(buffer, sizeof buffer);  // the bytes may be the client secret
    if (TLIBCBase64SzEncodeFull(bytes.c_str(), bytes.size(), buffer, 1, sizeof buffer, 0, 1) == 0) {
        throw sso_op_failed("encode base64 failed.");
    }
    return TextIn(buffer);
}

bool DecodeBase64(const std::string &text, std::string &decoded) {
    char buffer[kPlatformBuffer] = {};
    std::size_t length = sizeof buffer;
    if (TLIBCBase64Decode(text.c_str(), text.size(), buffer, &length) == 0) {
        return false;
    }
    decoded = TextIn(buffer);
    return true;
}

}  // namespace TAVO::SSO
