#include "tests/support/files.h"

#include <linux/magic.h>
#include <sys/vfs.h>

#include <filesystem>
#include <fstream>
#include <stdexcept>

namespace fs = std::filesystem;

namespace Test {

namespace {

/// Throws unless the path is in memory. Without tools/private-root, a test run by root would overwrite the machine's
/// certificate authorities.
void RequirePrivate(fs::path path) {
    while (!fs::exists(path)) {
        path = path.parent_path();
    }
    struct statfs system = {};
    if (statfs(path.c_str(), &system) != 0 || system.f_type != TMPFS_MAGIC) {
        throw std::runtime_error("refusing to write to " + path.string() +
                                 ": run the tests through tools/private-root");
    }
}

}  // namespace

void WriteFile(const std::string &path, const std::string &content) {
    RequirePrivate(path);
    fs::create_directories(fs::path(path).parent_path());
    std::ofstream file(path, std::ios::trunc | std::ios::binary);
    fs::permissions(path, fs::perms::owner_read | fs::perms::owner_write);
    if (!(file << content) || !file.flush()) {
        throw std::runtime_error("cannot write " + path);
    }
}

void RemoveFiles() {
    RequirePrivate("/usr/tavo");
    for (const fs::directory_entry &entry : fs::directory_iterator("/usr/tavo")) {
        fs::remove_all(entry);
    }
}

}  // namespace Test
