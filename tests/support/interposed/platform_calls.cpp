#include "tests/support/interposed/platform_calls.h"

#include "platform/platform.h"
#include "tests/support/interposed/calls.h"

namespace Test {

namespace {

Platform &Replaced() {
    static Platform platform;
    return platform;
}

}  // namespace

void ReplacePlatform(Platform platform) { Replaced() = std::move(platform); }

}  // namespace Test

using Test::Next;
using Test::Replaced;

extern "C" {

int TavoCgiURLEncode(const char *src, char *dst, size_t size) {
    return Replaced().urlEncode ? Replaced().urlEncode(src, dst, size)
                                : Next(TavoCgiURLEncode, "TavoCgiURLEncode")(src, dst, size);
}

int TLIBCBase64SzEncodeFull(const char *src, size_t len, char *dst, int flag1, size_t size, int flag2, int flag3) {
    return Replaced().encode
               ? Replaced().encode(std::string(src, len), dst, flag1, size, flag2, flag3)
               : Next(TLIBCBase64SzEncodeFull, "TLIBCBase64SzEncodeFull")(src, len, dst, flag1, size, flag2, flag3);
}

int TLIBCBase64Decode(const char *src, size_t len, char *dst, size_t *length) {
    return Replaced().decode ? Replaced().decode(std::string(src, len), dst, length)
                             : Next(TLIBCBase64Decode, "TLIBCBase64Decode")(src, len, dst, length);
}

int TAVOWinsUserNameFqdn2Netbios(const char *src, char *dst, size_t size) {
    return Replaced().fqdn2Netbios ? Replaced().fqdn2Netbios(src, dst, size)
                                   : Next(TAVOWinsUserNameFqdn2Netbios, "TAVOWinsUserNameFqdn2Netbios")(src, dst, size);
}

}  // extern "C"
