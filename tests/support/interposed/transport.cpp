#include "tests/support/interposed/transport.h"

#include <cerrno>
#include <cstdarg>
#include <memory>
#include <new>

#undef curl_easy_setopt  // a type-checking macro

// libcurl declares an enumeration before "...". clang warns about the definition.
#pragma GCC diagnostic ignored "-Wvarargs"

namespace Test {

namespace {

struct Handle {
    std::string url;
    curl_write_callback write = nullptr;
    void *user = nullptr;
};

Transport &State() {
    static Transport transport;
    return transport;
}

void Note(const char *call, const std::string &detail = "") noexcept try {
    State().calls.push_back(call + detail);
} catch (const std::bad_alloc &) {
    // In tests that let memory run out. libcurl does not throw.
}

CURLcode Perform(const Handle &handle) {
    State().urls.push_back(handle.url);
    if (State().duringPerform) {
        State().duringPerform();
    }
    const auto answer = State().answers.find(handle.url);
    if (answer == State().answers.end()) {
        return CURLE_COULDNT_CONNECT;
    }
    for (const std::string &chunk : answer->second.chunks) {
        // Without a NUL, like libcurl: AddressSanitizer detects reads beyond the end.
        const auto data = std::make_unique<char[]>(chunk.size());
        chunk.copy(data.get(), chunk.size());
        if (handle.write(data.get(), 1, chunk.size(), handle.user) != chunk.size()) {
            return CURLE_WRITE_ERROR;
        }
    }
    return answer->second.result;
}

}  // namespace

Transport &CurrentTransport() { return State(); }
void ResetTransport() { State() = Transport(); }
const std::string kNotConnected = curl_easy_strerror(CURLE_COULDNT_CONNECT);

Answer Whole(const std::string &body) { return {CURLE_OK, {body}}; }

}  // namespace Test

using Test::Handle;
using Test::Note;
using Test::State;

extern "C" {

CURLcode curl_global_init(long flags) {
    Note("curl_global_init ", std::to_string(flags));
    return CURLE_FAILED_INIT;  // the library must ignore it
}

void curl_global_cleanup() { Note("curl_global_cleanup"); }

CURL *curl_easy_init() {
    Note("curl_easy_init");
    if (State().noHandle) {
        errno = ENOMEM;
        return nullptr;
    }
    return new Handle();
}

void curl_easy_cleanup(CURL *handle) {
    Note("curl_easy_cleanup");
    delete static_cast<Handle *>(handle);
}

CURLcode curl_easy_setopt(CURL *curl, CURLoption option, ...) {
    auto *handle = static_cast<Handle *>(curl);
    std::va_list arguments;
    va_start(arguments, option);
    switch (option) {
        case CURLOPT_URL:
            handle->url = va_arg(arguments, const char *);
            Note("curl_easy_setopt CURLOPT_URL ", handle->url);
            break;
        case CURLOPT_POSTFIELDS:
            State().form = va_arg(arguments, const char *);
            Note("curl_easy_setopt CURLOPT_POSTFIELDS ", State().form);
            break;
        case CURLOPT_WRITEFUNCTION:
            handle->write = va_arg(arguments, curl_write_callback);
            Note("curl_easy_setopt CURLOPT_WRITEFUNCTION");
            break;
        case CURLOPT_WRITEDATA:
            handle->user = va_arg(arguments, void *);
            Note("curl_easy_setopt CURLOPT_WRITEDATA");
            break;
        case CURLOPT_SSL_VERIFYHOST:
            Note("curl_easy_setopt CURLOPT_SSL_VERIFYHOST ", std::to_string(va_arg(arguments, long)));
            break;
        case CURLOPT_SSL_VERIFYPEER:
            Note("curl_easy_setopt CURLOPT_SSL_VERIFYPEER ", std::to_string(va_arg(arguments, long)));
            break;
        default:
            Note("curl_easy_setopt ", std::to_string(option));
    }
    va_end(arguments);
    return CURLE_OK;
}

CURLcode curl_easy_perform(CURL *handle) {
    Note("curl_easy_perform");
    return Perform(*static_cast<Handle *>(handle));
}

}  // extern "C"
