// libcurl functions that can fail. See tests/support/interposed/calls.h.
#include <curl/curl.h>

#include <cerrno>
#include <cstdarg>

#include "tests/support/interposed/calls.h"

#undef curl_easy_setopt  // a type-checking macro

// libcurl declares an enumeration before "...". clang warns about the definition.
#pragma GCC diagnostic ignored "-Wvarargs"

using Test::Next;
using Test::ShouldFail;

extern "C" {

CURLcode curl_global_init(long flags) {
    return ShouldFail("curl_global_init", CALLER) ? CURLE_FAILED_INIT
                                                  : Next(curl_global_init, "curl_global_init")(flags);
}

void curl_global_cleanup() {
    ShouldFail("curl_global_cleanup", CALLER);  // only counted
    Next(curl_global_cleanup, "curl_global_cleanup")();
}

CURL *curl_easy_init() {
    if (ShouldFail("curl_easy_init", CALLER)) {
        errno = ENOMEM;
        return nullptr;
    }
    return Next(curl_easy_init, "curl_easy_init")();
}

void curl_easy_cleanup(CURL *handle) {
    ShouldFail("curl_easy_cleanup", CALLER);  // only counted
    Next(curl_easy_cleanup, "curl_easy_cleanup")(handle);
}

CURLcode curl_easy_setopt(CURL *handle, CURLoption option, ...) {
    if (ShouldFail("curl_easy_setopt", CALLER)) {
        return CURLE_OUT_OF_MEMORY;
    }
    std::va_list arguments;
    va_start(arguments, option);
    void *argument = va_arg(arguments, void *);  // all options of the library have this size
    va_end(arguments);
    return Next(curl_easy_setopt, "curl_easy_setopt")(handle, option, argument);
}

CURLcode curl_easy_perform(CURL *handle) {
    return ShouldFail("curl_easy_perform", CALLER) ? CURLE_COULDNT_CONNECT
                                                   : Next(curl_easy_perform, "curl_easy_perform")(handle);
}

}  // extern "C"
