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
 * Short texts under random names, each in a file that only this user can read, for a limited time. The name is the
 * secret: 128 bits from the system, given to one browser.
 *
 * Refuses a folder that another user owns or can read, and a path to it that another user than root can change. Throws
 * std::system_error if the system refuses.
 */
class PrivateFolder {
  public:
    static constexpr std::size_t kUnlimited = std::numeric_limits<std::size_t>::max();

    /// The folder at an absolute path, created if missing. Its parent must exist; symbolic links are refused. Texts
    /// expire `seconds` after they were kept; at most about `most` are kept at a time. Throws std::invalid_argument for
    /// a relative path.
    PrivateFolder(const std::string &path, std::time_t seconds, std::size_t most = kUnlimited);

    /// A name that cannot be guessed.
    static std::string NewName();
    /// The name of 16 bytes: 32 hexadecimal digits.
    static std::string NameOf(const unsigned char *bytes);
    /// Keeps a text under a new name, one of `NewName` or `NameOf`. Returns false, and keeps nothing, if the folder is
    /// full. Removes and counts expired texts once a minute, and at each call only while the folder is full.
    [[nodiscard]] bool Keep(const std::string &name, const std::string &text);
    std::optional<std::string> Read(const std::string &name);
    /// Reads a text and removes it. Of two that take the same text, one gets it.
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
