#include "tests/support/interposed/releases.h"

#include <dlfcn.h>
#include <malloc.h>
#include <unwind.h>

#include <array>
#include <cstdlib>
#include <cstring>
#include <utility>

#include "tests/support/interposed/calls.h"
#include "tests/support/interposed/memory.h"

namespace Test {

namespace {

// Per thread, because a server in the same process also has the secrets.
thread_local const std::vector<std::string> *watched = nullptr;
thread_local std::size_t blocks = 0;
thread_local bool inspecting = false;

std::vector<std::string> &Finds() {
    static std::vector<std::string> finds;
    return finds;
}

using Frames = std::array<void *, 24>;

_Unwind_Reason_Code NoteFrame(_Unwind_Context *context, void *stack) {
    auto &[frames, depth] = *static_cast<std::pair<Frames, int> *>(stack);
    if (static_cast<std::size_t>(depth) == frames.size()) {
        return _URC_END_OF_STACK;
    }
    frames.at(static_cast<std::size_t>(depth++)) = reinterpret_cast<void *>(_Unwind_GetIP(context));
    return _URC_NO_REASON;
}

/// backtrace(3) would load a library.
std::pair<Frames, int> CallStack() {
    std::pair<Frames, int> stack{};
    _Unwind_Backtrace(NoteFrame, &stack);
    return stack;
}

/// Whether the library released it. Between its frames and this one there are only the C++ library and this program.
bool IsFromLibrary(const Frames &frames, int depth) {
    for (int i = 0; i < depth; ++i) {
        Dl_info object{};
        if (FromLibrary(frames.at(static_cast<std::size_t>(i)))) {
            return true;
        }
        if (dladdr(frames.at(static_cast<std::size_t>(i)), &object) != 0 &&
            std::strstr(object.dli_fname, "/libstdc++.so") == nullptr &&
            std::strstr(object.dli_fname, ".so") != nullptr) {
            return false;
        }
    }
    return false;
}

std::string Describe(const Frames &frames, int depth) {
    std::string text;
    for (int i = 0; i < depth; ++i) {
        Dl_info object{};
        dladdr(frames.at(static_cast<std::size_t>(i)), &object);
        text += std::string(" < ") + (object.dli_sname == nullptr ? "?" : object.dli_sname);
    }
    return text;
}

void Inspect(void *block) {
    const std::size_t size = malloc_usable_size(block);
    ++blocks;
    for (const std::string &secret : *watched) {
        if (memmem(block, size, secret.data(), secret.size()) == nullptr) {
            continue;
        }
        const auto [frames, depth] = CallStack();
        if (IsFromLibrary(frames, depth)) {
            Finds().push_back(secret + Describe(frames, depth));
        }
    }
}

}  // namespace

WatchReleases::WatchReleases(const std::vector<std::string> &secrets) {
    Finds().clear();
    blocks = 0;
    FillNewMemory(true);
    watched = &secrets;
}

WatchReleases::~WatchReleases() {
    watched = nullptr;
    FillNewMemory(false);
}

std::size_t WatchReleases::Blocks() const { return blocks; }

std::vector<std::string> WatchReleases::Found() const { return Finds(); }

}  // namespace Test

extern "C" void free(void *block) noexcept {
    static decltype(&free) next = nullptr;
    static thread_local bool searching = false;
    static thread_local void *postponed = nullptr;
    if (next == nullptr && searching) {
        postponed = block;  // dlsym releases the text of an earlier error
        return;
    }
    if (next == nullptr) {
        searching = true;
        next = Test::Next(free, "free");
        next(postponed);
    }
    if (Test::watched != nullptr && block != nullptr && !Test::inspecting) {
        Test::inspecting = true;  // the inspection allocates and releases memory
        Test::Inspect(block);
        Test::inspecting = false;
    }
    next(block);
}
