#include "frontend/private_folder.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <memory>
#include <system_error>
#include <vector>

namespace Frontend {

namespace {

constexpr char kFrontEndFolder[] = "/usr/tavo/var/frontend";
constexpr std::size_t kRandomBytes = 16;
constexpr char kHexDigits[] = "0123456789abcdef";

[[noreturn]] void ThrowSystemError(const char *what) { throw std::system_error(errno, std::generic_category(), what); }

bool IsName(const std::string &name) {
    return name.size() == 2 * kRandomBytes && name.find_first_not_of(kHexDigits) == std::string::npos;
}

void MakeFolder(const std::string &path) {
    if (mkdir(path.c_str(), 0700) != 0 && errno != EEXIST) {
        ThrowSystemError("The front end's folder cannot be made");
    }
}

int OpenFolder(const std::string &path) {
    MakeFolder(kFrontEndFolder);
    MakeFolder(path);
    return open(path.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
}

void RefuseUnlessPrivate(const Descriptor &folder) {
    struct stat status;
    if (fstat(folder.Number(), &status) != 0) {
        ThrowSystemError("The front end's folder cannot be examined");
    }
    if (status.st_uid != geteuid() || (status.st_mode & 077) != 0) {
        errno = EPERM;
        ThrowSystemError("The front end's folder is not private");
    }
}

void WriteAll(const Descriptor &file, const std::string &text) {
    for (std::size_t written = 0; written < text.size();) {
        const ssize_t count = write(file.Number(), text.data() + written, text.size() - written);
        if (count < 0 && errno != EINTR) {
            ThrowSystemError("The front end's file cannot be written");
        }
        written += static_cast<std::size_t>(std::max<ssize_t>(count, 0));
    }
}

std::string ReadAll(const Descriptor &file) {
    std::string text;
    char chunk[1024];
    for (ssize_t count; (count = read(file.Number(), chunk, sizeof chunk)) != 0;) {
        if (count < 0 && errno != EINTR) {
            ThrowSystemError("The front end's file cannot be read");
        }
        text.append(chunk, static_cast<std::size_t>(std::max<ssize_t>(count, 0)));
    }
    return text;
}

struct CloseDirectory {
    void operator()(DIR *directory) const { closedir(directory); }
};

std::vector<std::string> NamesIn(const Descriptor &folder) {
    const int reopened = openat(folder.Number(), ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    const std::unique_ptr<DIR, CloseDirectory> directory(fdopendir(reopened));
    if (!directory) {
        ThrowSystemError("The front end's folder cannot be read");
    }
    std::vector<std::string> names;
    while (const dirent *entry = readdir(directory.get())) {
        if (IsName(entry->d_name)) {
            names.emplace_back(entry->d_name);
        }
    }
    return names;
}

}  // namespace

Descriptor::Descriptor(int opened, const char *what) : number(opened) {
    if (number < 0) {
        ThrowSystemError(what);
    }
}

Descriptor::~Descriptor() { close(number); }

PrivateFolder::PrivateFolder(const char *name, std::time_t seconds)
    : folder(OpenFolder(std::string(kFrontEndFolder) + "/" + name), "The front end's folder cannot be opened"),
      lifetime(seconds) {
    RefuseUnlessPrivate(folder);
}

std::string PrivateFolder::NewName() {
    unsigned char bytes[kRandomBytes];
    if (getrandom(bytes, sizeof bytes, 0) != static_cast<ssize_t>(sizeof bytes)) {
        ThrowSystemError("No random name can be made");
    }
    std::string name;
    for (const unsigned char byte : bytes) {
        name += kHexDigits[byte >> 4];
        name += kHexDigits[byte & 15];
    }
    return name;
}

void PrivateFolder::Keep(const std::string &name, const std::string &text) {
    Sweep();
    const Descriptor file(
        openat(folder.Number(), name.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600),
        "The front end's file cannot be made");
    WriteAll(file, text);
}

std::optional<std::string> PrivateFolder::Read(const std::string &name) {
    if (!IsName(name) || !IsAlive(name)) {
        return std::nullopt;
    }
    const int opened = openat(folder.Number(), name.c_str(), O_RDONLY | O_NOFOLLOW | O_CLOEXEC);
    if (opened < 0 && errno == ENOENT) {
        return std::nullopt;
    }
    return ReadAll(Descriptor(opened, "The front end's file cannot be opened"));
}

std::optional<std::string> PrivateFolder::Take(const std::string &name) {
    const std::optional<std::string> text = Read(name);
    return text && unlinkat(folder.Number(), name.c_str(), 0) == 0 ? text : std::nullopt;
}

bool PrivateFolder::IsAlive(const std::string &name) {
    struct stat status;
    return fstatat(folder.Number(), name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0 &&
           std::time(nullptr) - status.st_mtime <= lifetime;
}

// There is no daemon that would do it: whoever keeps something clears away what is too old.
void PrivateFolder::Sweep() {
    for (const std::string &name : NamesIn(folder)) {
        if (!IsAlive(name)) {
            unlinkat(folder.Number(), name.c_str(), 0);
        }
    }
}

}  // namespace Frontend
