#ifndef TAVOSSO_FRONTEND_PRIVATE_FOLDER_H
#define TAVOSSO_FRONTEND_PRIVATE_FOLDER_H

#include <ctime>
#include <optional>
#include <string>

namespace Frontend {

/// An open file or directory.
class Descriptor {
  public:
    /// Throws std::system_error, with `what` in its text, for a negative number.
    Descriptor(int opened, const char *what);
    ~Descriptor();
    Descriptor(const Descriptor &) = delete;
    Descriptor &operator=(const Descriptor &) = delete;
    int Number() const { return number; }

  private:
    int number;
};

/**
 * Short texts under random names, each in a file that only this user can read, for as long as they live. The name is
 * the secret: 128 bits from the system, given to one browser.
 *
 * A folder that another user owns or may look into is refused. Throws std::system_error when the system refuses.
 */
class PrivateFolder {
  public:
    /// The folder `name` in the front end's own, made when missing; texts are forgotten `seconds` after they were kept.
    PrivateFolder(const char *name, std::time_t seconds);

    /// A name that nobody can guess.
    static std::string NewName();
    /// Keeps a text under a new name.
    void Keep(const std::string &name, const std::string &text);
    std::optional<std::string> Read(const std::string &name);
    /// Reads a text and removes it. Of two that take the same, one gets it.
    std::optional<std::string> Take(const std::string &name);

  private:
    bool IsAlive(const std::string &name);
    void Sweep();

    Descriptor folder;
    std::time_t lifetime;
};

}  // namespace Frontend

#endif
