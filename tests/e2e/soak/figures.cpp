#include "tests/e2e/soak/figures.h"

#include <malloc.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <string>

namespace Test {

namespace {

std::size_t HeapInUse() {
    const struct mallinfo2 heap = mallinfo2();
    return heap.uordblks + heap.hblkhd;
}

/// Bytes of this kind in all mappings.
std::size_t Mapped(const std::string &name) {
    std::ifstream mappings("/proc/self/smaps_rollup");
    for (std::string word; mappings >> word;) {
        std::size_t kilobytes = 0;
        if (word == name && mappings >> kilobytes) {
            return kilobytes * 1024;
        }
    }
    throw std::runtime_error("no " + name + " in /proc/self/smaps_rollup");
}

std::ptrdiff_t OpenDescriptors() {
    namespace fs = std::filesystem;
    return std::distance(fs::directory_iterator("/proc/self/fd"), fs::directory_iterator()) - 1;  // the iterator's
}

}  // namespace

void Figures::Note() {
    ++moments_;
    heap_ += static_cast<double>(HeapInUse());
    resident_ += static_cast<double>(Mapped("Anonymous:") + Mapped("Swap:"));  // swapped out memory also counts
    descriptors_.insert(OpenDescriptors());
}

}  // namespace Test
