// The entry point of libFuzzer.
#include <cstddef>
#include <cstdint>

#include "tests/fuzz/target.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    Fuzz::Accepts(std::string(reinterpret_cast<const char *>(data), size));
    return 0;
}
