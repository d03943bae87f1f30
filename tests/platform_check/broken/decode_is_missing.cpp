// Lacks TLIBCBase64Decode. It is not linked to the stand-in.
#include "platform/platform.h"

int TavoCgiURLEncode(const char * /*src*/, char * /*dst*/, size_t /*size*/) { return -1; }

int TLIBCBase64SzEncodeFull(const char * /*src*/, size_t /*len*/, char * /*dst*/, int /*flag1*/, size_t /*size*/,
                            int /*flag2*/, int /*flag3*/) {
    return 0;
}

int TAVOWinsUserNameFqdn2Netbios(const char * /*src*/, char * /*dst*/, size_t /*size*/) { return -1; }
