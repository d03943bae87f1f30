#ifndef TAVOSSO_WEB_PRIVATE_FOLDER_H
#define TAVOSSO_WEB_PRIVATE_FOLDER_H

#include <cstddef>
#include <ctime>
#include <limits>
#include <optional>
#include <string>

namespace TAVO::Web {

/// An open file or directory.
class Descriptor {
  public:
    /// Throws std::system_error, with `what` in its text, for a negative number.
    Descriptor(int opened, const char *what);
    ~Descriptor();
    Descriptor(Descriptor &&other) noexcept;
    Descriptor &operator=(Descriptor &&other) noexcept;
    Descriptor(const Descriptor &) = delete;
    Descriptor &operator=(const Descriptor &) = delete;
    int Number() const { return number; }

  private:
    int number;
};

/**
 * Stores short texts under names of 128 random bits, for a limited time. Only this user can read the files.
 *
 * Throws std::system_error if a call fails, if another user owns or can read the folder, or if a user other than root
 * can change its path.
 */
class PrivateFolder {
  public:
    static constexpr std::size_t kUnlimited = std::numeric_limits<std::size_t>::max();

    /// Opens the folder at an absolute path, or creates it in an existing parent. Rejects symbolic links. Texts expire
    /// after `seconds`; about `most` are kept at a time. Throws std::invalid_argument for a relative path.
    PrivateFolder(const std::string &path, std::time_t seconds, std::size_t most = kUnlimited);

    /// Returns a random name.
    static std::string NewName();
    /// Returns 16 bytes as 32 hexadecimal digits.
    static std::string NameOf(const unsigned char *bytes);
    /// Stores a text under a new name from `NewName` or `NameOf`. Returns false, and stores nothing, if the folder is
    /// full. Removes expired texts at most once a minute, or at each call while the folder is full.
    [[nodiscard]] bool Keep(const std::string &name, const std::string &text);
    std::optional<std::string> Read(const std::string &name);
    /// Reads a text and removes it. Of two calls that take the same text, one gets it.
    std::optional<std::string> Take(const std::string &name);

  private:
    bool CountOneMore();
    std::size_t Sweep();

    Descriptor folder;
    std::time_t lifetime;
    std::size_t capacity;
};

}  // namespace TAVO::Web

#endif
