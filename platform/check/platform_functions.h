#ifndef TAVOSSO_PLATFORM_CHECK_PLATFORM_FUNCTIONS_H
#define TAVOSSO_PLATFORM_CHECK_PLATFORM_FUNCTIONS_H

#include <string>
#include <vector>

#include "platform/platform.h"

namespace PlatformCheck {

/// The functions of the loaded libraries.
struct PlatformFunctions {
    decltype(&TavoCgiURLEncode) encodeURL;
    decltype(&TLIBCBase64SzEncodeFull) encodeBase64;
    decltype(&TLIBCBase64Decode) decodeBase64;
    decltype(&TAVOWinsUserNameFqdn2Netbios) lookUp;
};

/// Loads libraries, and looks each function up in them and in the libraries that they are linked to. Throws
/// std::runtime_error.
PlatformFunctions LoadPlatform(const std::vector<std::string> &libraries);

}  // namespace PlatformCheck

#endif
