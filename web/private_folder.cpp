#include "web/private_folder.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <boost/algorithm/string.hpp>
#include <cerrno>
#include <chrono>
#include <memory>
#include <stdexcept>
#include <system_error>
#include <utility>
#include <vector>

#include "web/text.h"

namespace TAVO::Web {

namespace {

constexpr std::size_t kNameBytes = 16;
constexpr char kHexDigits[] = "0123456789abcdef";
constexpr char kUnfinished[] = ".new";
constexpr char kCounter[] = "counter";
constexpr std::time_t kSecondsBetweenSweeps = 60;
constexpr std::size_t kLongestText = 16384;

[[noreturn]] void ThrowSystemError(const char *what) { throw std::system_error(errno, std::generic_category(), what); }

bool IsName(const std::string &name) {
    return name.size() == 2 * kNameBytes && name.find_first_not_of(kHexDigits) == std::string::npos;
}

struct stat StatusOf(const Descriptor &file) {
    struct stat status = {};
    if (fstat(file.Number(), &status) != 0) {
        ThrowSystemError("The front end's folder cannot be examined");
    }
    return status;
}

Descriptor OpenFolderIn(const Descriptor &parent, const std::string &name) {
    return {openat(parent.Number(), name.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC),
            "The front end's folder cannot be opened"};
}

/// Opens a parent folder. Throws if anyone but root and this user can replace its entries.
Descriptor OpenTrusted(const Descriptor &parent, const std::string &name) {
    Descriptor folder = OpenFolderIn(parent, name);
    const struct stat status = StatusOf(folder);
    if ((status.st_uid != 0 && status.st_uid != geteuid()) || (status.st_mode & 022) != 0) {
        errno = EPERM;
        ThrowSystemError("Another user can change the path to the front end's folder");
    }
    return folder;
}

Descriptor OpenPrivate(const Descriptor &parent, const std::string &name) {
    if (mkdirat(parent.Number(), name.c_str(), 0700) != 0 && errno != EEXIST) {
        ThrowSystemError("The front end's folder cannot be made");
    }
    Descriptor folder = OpenFolderIn(parent, name);
    const struct stat status = StatusOf(folder);
    if (status.st_uid != geteuid() || (status.st_mode & 077) != 0) {
        errno = EPERM;
        ThrowSystemError("The front end's folder is not private");
    }
    return folder;
}

Descriptor OpenFolder(const std::string &path) {
    if (path.empty() || path.front() != '/') {
        throw std::invalid_argument("The path of a folder must be absolute.");
    }
    std::vector<std::string> names;
    boost::split(names, path, boost::is_any_of("/"), boost::token_compress_on);
    Descriptor folder(open("/", O_RDONLY | O_DIRECTORY | O_CLOEXEC), "/ cannot be opened");
    for (std::size_t i = 1; i + 1 < names.size(); ++i) {
        folder = OpenTrusted(folder, names[i]);
    }
    return OpenPrivate(folder, names.back());
}

/// Returns whether this user created the file and no other user can access it.
bool IsOwnFile(const struct stat &status) {
    return S_ISREG(status.st_mode) && status.st_uid == geteuid() && (status.st_mode & 077) == 0;
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
        if (text.size() > kLongestText) {
            errno = EPERM;
            ThrowSystemError("A file in the front end's folder is too long");
        }
    }
    return text;
}

/// time() can be behind the timestamps of new files; this clock cannot.
std::time_t Now() { return std::chrono::system_clock::to_time_t(std::chrono::system_clock::now()); }

/// Returns whether a file has not expired. A file dated in the future counts as expired.
bool IsAlive(const struct stat &status, std::time_t lifetime) {
    const std::time_t now = Now();
    return status.st_mtime <= now && now - status.st_mtime <= lifetime;
}

struct CloseDirectory {
    void operator()(DIR *directory) const { closedir(directory); }
};

/// Returns the names of the stored texts, including unfinished ones. Ignores other files.
std::vector<std::string> NamesIn(const Descriptor &folder) {
    const int reopened = openat(folder.Number(), ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    const std::unique_ptr<DIR, CloseDirectory> directory(reopened < 0 ? nullptr : fdopendir(reopened));
    if (!directory) {
        if (reopened >= 0) {
            close(reopened);
        }
        ThrowSystemError("The front end's folder cannot be read");
    }
    std::vector<std::string> names;
    while (const dirent *entry = readdir(directory.get())) {
        const std::string name = entry->d_name;
        if (IsName(name) || (boost::ends_with(name, kUnfinished) && IsName(name.substr(0, 2 * kNameBytes)))) {
            names.push_back(name);
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

Descriptor::Descriptor(Descriptor &&other) noexcept : number(std::exchange(other.number, -1)) {}

Descriptor &Descriptor::operator=(Descriptor &&other) noexcept {
    std::swap(number, other.number);
    return *this;
}

Descriptor::~Descriptor() {
    if (number >= 0) {
        close(number);
    }
}

PrivateFolder::PrivateFolder(const std::string &path, std::time_t seconds, std::size_t most)
    : folder(OpenFolder(path)), lifetime(seconds), capacity(most) {}

std::string PrivateFolder::NewName() {
    unsigned char bytes[kNameBytes];
    if (getrandom(bytes, sizeof bytes, 0) != static_cast<ssize_t>(sizeof bytes)) {
        ThrowSystemError("No random name can be made");
    }
    return NameOf(bytes);
}

std::string PrivateFolder::NameOf(const unsigned char *bytes) {
    std::string name;
    for (std::size_t i = 0; i < kNameBytes; ++i) {
        name += kHexDigits[bytes[i] >> 4];
        name += kHexDigits[bytes[i] & 15];
    }
    return name;
}

bool PrivateFolder::Keep(const std::string &name, const std::string &text) {
    if (!IsName(name)) {
        throw std::invalid_argument("The name of a file must be 32 hexadecimal digits.");
    }
    if (text.size() > kLongestText) {
        errno = EFBIG;
        ThrowSystemError("The front end's file cannot be kept");
    }
    if (!CountOneMore()) {
        return false;
    }
    const std::string unfinished = name + kUnfinished;
    const Descriptor file(
        openat(folder.Number(), unfinished.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600),
        "The front end's file cannot be made");
    WriteAll(file, text);
    // linkat fails if the name exists; renameat would replace the file.
    const bool isKept =
        fsync(file.Number()) == 0 && linkat(folder.Number(), unfinished.c_str(), folder.Number(), name.c_str(), 0) == 0;
    const int error = errno;
    unlinkat(folder.Number(), unfinished.c_str(), 0);
    if (!isKept) {
        errno = error;
        ThrowSystemError("The front end's file cannot be kept");
    }
    return true;
}

std::optional<std::string> PrivateFolder::Read(const std::string &name) {
    if (!IsName(name)) {
        return std::nullopt;
    }
    const int opened = openat(folder.Number(), name.c_str(), O_RDONLY | O_NONBLOCK | O_NOFOLLOW | O_CLOEXEC);
    if (opened < 0 && errno == ENOENT) {
        return std::nullopt;
    }
    const Descriptor file(opened, "The front end's file cannot be opened");
    const struct stat status = StatusOf(file);
    if (!IsOwnFile(status)) {
        errno = EPERM;
        ThrowSystemError("A file in the front end's folder is not private");
    }
    return IsAlive(status, lifetime) ? std::optional(ReadAll(file)) : std::nullopt;
}

std::optional<std::string> PrivateFolder::Take(const std::string &name) {
    std::optional<std::string> text = Read(name);
    if (!text || unlinkat(folder.Number(), name.c_str(), 0) == 0) {
        return text;
    }
    if (errno != ENOENT) {
        ThrowSystemError("The front end's file cannot be removed");
    }
    return std::nullopt;
}

/// Counts a text in the counter file, which contains the time of the last sweep and the number of texts.
bool PrivateFolder::CountOneMore() {
    const Descriptor counter(openat(folder.Number(), kCounter, O_RDWR | O_CREAT | O_NOFOLLOW | O_CLOEXEC, 0600),
                             "The front end's counter cannot be opened");
    if (flock(counter.Number(), LOCK_EX) != 0) {
        ThrowSystemError("The front end's counter cannot be locked");
    }
    const Json::Value known = ParseObject(ReadAll(counter));
    const std::time_t now = Now();
    const Json::Int64 swept = known["swept"].isInt64() ? known["swept"].asInt64() : 0;
    const bool isRecent = swept <= now && now - swept < kSecondsBetweenSweeps && known["count"].isUInt64() &&
                          known["count"].asUInt64() < capacity;
    const Json::UInt64 count = isRecent ? known["count"].asUInt64() : Sweep();
    const bool hasRoom = count < capacity;

    Json::Value counted;
    counted["swept"] = Json::Int64{isRecent ? swept : now};
    counted["count"] = hasRoom ? count + 1 : count;
    if (ftruncate(counter.Number(), 0) != 0 || lseek(counter.Number(), 0, SEEK_SET) != 0) {
        ThrowSystemError("The front end's counter cannot be written");
    }
    WriteAll(counter, WriteCompact(counted));
    return hasRoom;
}

/// Removes expired files, including unfinished ones. Returns how many files remain.
std::size_t PrivateFolder::Sweep() {
    std::size_t remaining = 0;
    for (const std::string &name : NamesIn(folder)) {
        struct stat status = {};
        if (fstatat(folder.Number(), name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0 && IsAlive(status, lifetime)) {
            ++remaining;
        } else {
            unlinkat(folder.Number(), name.c_str(), 0);
        }
    }
    return remaining;
}

}  // namespace TAVO::Web
