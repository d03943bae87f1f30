// Platform functions that can fail. See tests/support/interposed/calls.h.
#include "platform/platform.h"
#include "tests/support/interposed/calls.h"

using Test::Next;
using Test::ShouldFail;

extern "C" {

int TavoCgiURLEncode(const char *src, char *dst, size_t size) {
    return ShouldFail("TavoCgiURLEncode", CALLER) ? -1 : Next(TavoCgiURLEncode, "TavoCgiURLEncode")(src, dst, size);
}

int TLIBCBase64SzEncodeFull(const char *src, size_t len, char *dst, int flag1, size_t size, int flag2, int flag3) {
    return ShouldFail("TLIBCBase64SzEncodeFull", CALLER)
               ? 0
               : Next(TLIBCBase64SzEncodeFull, "TLIBCBase64SzEncodeFull")(src, len, dst, flag1, size, flag2, flag3);
}

int TLIBCBase64Decode(const char *src, size_t len, char *dst, size_t *length) {
    return ShouldFail("TLIBCBase64Decode", CALLER)
               ? 0
               : Next(TLIBCBase64Decode, "TLIBCBase64Decode")(src, len, dst, length);
}

int TAVOWinsUserNameFqdn2Netbios(const char *src, char *dst, size_t size) {
    return ShouldFail("TAVOWinsUserNameFqdn2Netbios", CALLER)
               ? -1
               : Next(TAVOWinsUserNameFqdn2Netbios, "TAVOWinsUserNameFqdn2Netbios")(src, dst, size);
}

}  // extern "C"
