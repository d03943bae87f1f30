#include "platform/check/platform_functions.h"

#include <dlfcn.h>

#include <stdexcept>

namespace PlatformCheck {

namespace {

template <typename Function>
void Find(const std::vector<void *> &handles, const char *name, Function *&function) {
    for (void *handle : handles) {
        if (void *address = dlsym(handle, name)) {
            function = reinterpret_cast<Function *>(address);
            return;
        }
    }
    throw std::runtime_error(std::string("no library defines ") + name);
}

}  // namespace

PlatformFunctions LoadPlatform(const std::vector<std::string> &libraries) {
    std::vector<void *> handles;
    for (const std::string &library : libraries) {
        // As if linked: now, and visible to the other libraries.
        void *handle = dlopen(library.c_str(), RTLD_NOW | RTLD_GLOBAL);
        if (handle == nullptr) {
            throw std::runtime_error(dlerror());
        }
        handles.push_back(handle);
    }
    PlatformFunctions functions = {};
    Find(handles, "TavoCgiURLEncode", functions.encodeURL);
    Find(handles, "TLIBCBase64SzEncodeFull", functions.encodeBase64);
    Find(handles, "TLIBCBase64Decode", functions.decodeBase64);
    Find(handles, "TAVOWinsUserNameFqdn2Netbios", functions.lookUp);
    return functions;
}

}  // namespace PlatformCheck
