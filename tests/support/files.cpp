#include "tests/support/files.h"

#include <filesystem>
#include <fstream>
#include <stdexcept>

namespace fs = std::filesystem;

namespace Test {

void WriteFile(const std::string &path, const std::string &content) {
    fs::create_directories(fs::path(path).parent_path());
    std::ofstream file(path, std::ios::trunc | std::ios::binary);
    fs::permissions(path, fs::perms::owner_read | fs::perms::owner_write);
    if (!(file << content) || !file.flush()) {
        throw std::runtime_error("cannot write " + path + ": run the tests through tools/private-root");
    }
}

void RemoveFiles() {
    for (const fs::directory_entry &entry : fs::directory_iterator("/usr/tavo")) {
        fs::remove_all(entry);
    }
}

}  // namespace Test
