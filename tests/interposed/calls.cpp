#include "tests/interposed/calls.h"

#include <link.h>
#include <openssl/err.h>

#include <cstdint>
#include <cstring>

namespace Test {

namespace {

struct AddressRange {
    std::uintptr_t begin = 0;
    std::uintptr_t end = 0;
};

/// Where the library under test has its code. Asks for no memory: the first who wants to know may be malloc.
AddressRange FindLibrary() {
    AddressRange code;
    dl_iterate_phdr(
        [](dl_phdr_info *object, std::size_t, void *result) {
            if (std::strstr(object->dlpi_name, "/libtavosso.so") == nullptr) {
                return 0;
            }
            for (int i = 0; i < object->dlpi_phnum; ++i) {
                const ElfW(Phdr) &segment = object->dlpi_phdr[i];
                if (segment.p_type == PT_LOAD && (segment.p_flags & PF_X) != 0) {
                    const std::uintptr_t begin = object->dlpi_addr + segment.p_vaddr;
                    *static_cast<AddressRange *>(result) = {begin, begin + segment.p_memsz};
                }
            }
            return 1;
        },
        &code);
    return code;
}

struct Calls {
    int made = 0;
    int failing = 0;  // the number of the one to fail
};

std::map<std::string, Calls> &CallsByFunction() {
    static std::map<std::string, Calls> calls;
    return calls;
}

std::vector<std::string> &Cleansed() {
    static auto &texts = *new std::vector<std::string>();  // outlives libcrypto's own end, which cleanses too
    return texts;
}

}  // namespace

bool FromLibrary(const void *returnAddress) {
    static const AddressRange code = FindLibrary();
    const auto address = reinterpret_cast<std::uintptr_t>(returnAddress);
    return address >= code.begin && address < code.end;
}

void FailCall(const std::string &function, int n) {
    Calls &calls = CallsByFunction()[function];
    calls.failing = calls.made + n;
}

void FailNothing() { CallsByFunction().clear(); }

bool ShouldFail(const char *function, const void *caller) {
    if (!FromLibrary(caller)) {
        return false;
    }
    Calls &calls = CallsByFunction()[function];
    return ++calls.made == calls.failing;
}

std::map<std::string, int> CallCounts() {
    std::map<std::string, int> counts;
    for (const auto &[function, calls] : CallsByFunction()) {
        counts[function] = calls.made;
    }
    return counts;
}

std::vector<std::string> TakeCleansed() {
    std::vector<std::string> taken;
    taken.swap(Cleansed());
    return taken;
}

void NoteCleansed(const void *memory, std::size_t size) {
    if (memory != nullptr) {
        Cleansed().emplace_back(static_cast<const char *>(memory), size);
    }
}

void RaiseCryptoError() { ERR_raise(ERR_LIB_USER, 99); }

}  // namespace Test
