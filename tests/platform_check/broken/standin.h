#ifndef TAVOSSO_TESTS_PLATFORM_CHECK_BROKEN_STANDIN_H
#define TAVOSSO_TESTS_PLATFORM_CHECK_BROKEN_STANDIN_H

#include <dlfcn.h>

#include "platform/platform.h"

// A library with a defect defines one function, and is linked to the stand-in for the other three.
namespace Broken {

/// Returns the stand-in's version of a function that the library defines.
template <typename Function>
Function *Standin(Function * /*own*/, const char *name) {
    return reinterpret_cast<Function *>(dlsym(RTLD_NEXT, name));
}

}  // namespace Broken

#endif
