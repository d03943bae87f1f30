#include "tests/support/interposed/calls.h"

#include <link.h>
#include <openssl/err.h>

#include <array>
#include <cstdint>
#include <cstdio>
#include <cstring>

namespace Test {

namespace {

struct AddressRange {
    std::uintptr_t begin = 0;
    std::uintptr_t end = 0;
};

/// A library of this process and its code.
struct Library {
    const char *name;
    AddressRange code;
};

int NoteCode(dl_phdr_info *object, std::size_t /*size*/, void *found) {
    auto *library = static_cast<Library *>(found);
    if (std::strstr(object->dlpi_name, library->name) == nullptr) {
        return 0;
    }
    for (int i = 0; i < object->dlpi_phnum; ++i) {
        const ElfW(Phdr) &segment = object->dlpi_phdr[i];
        if (segment.p_type == PT_LOAD && (segment.p_flags & PF_X) != 0) {
            const std::uintptr_t begin = object->dlpi_addr + segment.p_vaddr;
            library->code = {begin, begin + segment.p_memsz};
        }
    }
    return 1;
}

/// Must not allocate: malloc may be the first caller.
AddressRange CodeOf(const char *name) {
    Library library{name, {}};
    dl_iterate_phdr(NoteCode, &library);
    return library.code;
}

bool IsIn(const AddressRange &code, const void *pointer) {
    const auto address = reinterpret_cast<std::uintptr_t>(pointer);
    return address >= code.begin && address < code.end;
}

struct Calls {
    std::array<char, 64> function;
    int made;
    int failing;  // number of the call to fail
};

// Must not allocate: malloc may be the counted function.
std::array<Calls, 64> calls;
std::size_t functions = 0;

Calls &CallsOf(const char *function) {
    for (std::size_t i = 0; i < functions; ++i) {
        if (std::strcmp(calls[i].function.data(), function) == 0) {
            return calls[i];
        }
    }
    Calls &added = calls.at(functions);
    std::snprintf(added.function.data(), added.function.size(), "%s", function);
    ++functions;
    return added;
}

std::vector<std::string> &Cleansed() {
    static auto &texts = *new std::vector<std::string>();  // libcrypto still cleanses memory at exit
    return texts;
}

}  // namespace

bool FromLibrary(const void *returnAddress) {
    static const AddressRange code = CodeOf("/libtavosso.so");
    return IsIn(code, returnAddress);
}

bool FromJsonLibrary(const void *returnAddress) {
    static const AddressRange code = CodeOf("/libjsoncpp.so");
    return IsIn(code, returnAddress);
}

void FailCall(const std::string &function, int n) {
    Calls &counted = CallsOf(function.c_str());
    counted.failing = counted.made + n;
}

void FailNothing() {
    calls.fill({});
    functions = 0;
}

bool ShouldFail(const char *function, const void *caller) {
    if (!FromLibrary(caller)) {
        return false;
    }
    Calls &counted = CallsOf(function);
    return ++counted.made == counted.failing;
}

std::map<std::string, int> CallCounts() {
    std::map<std::string, int> counts;
    for (std::size_t i = 0; i < functions; ++i) {
        counts[calls[i].function.data()] = calls[i].made;
    }
    return counts;
}

std::vector<std::string> TakeCleansed() {
    std::vector<std::string> taken;
    taken.swap(Cleansed());
    return taken;
}

void NoteCleansed(const void *memory, std::size_t size, const void *caller) {
    if (memory != nullptr && FromLibrary(caller)) {
        Cleansed().emplace_back(static_cast<const char *>(memory), size);
    }
}

void RaiseCryptoError() { ERR_raise(ERR_LIB_USER, 99); }

}  // namespace Test
