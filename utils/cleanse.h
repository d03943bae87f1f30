#ifndef TAVOSSO_UTILS_CLEANSE_H
#define TAVOSSO_UTILS_CLEANSE_H

#include <cstddef>
#include <cstring>
#include <string>

namespace TAVO::Utils {

/// Overwrites a secret at the end of a scope. Declare it after the owner of the memory, so that it runs before the
/// memory is released.
class CleanseOnExit {
  public:
    CleanseOnExit(void *memory, std::size_t size) : memory_(memory), size_(size) {}
    ~CleanseOnExit() { explicit_bzero(memory_, size_); }
    CleanseOnExit(const CleanseOnExit &) = delete;
    CleanseOnExit &operator=(const CleanseOnExit &) = delete;

  private:
    void *memory_;
    std::size_t size_;
};

inline void Cleanse(std::string &text) { explicit_bzero(text.data(), text.size()); }

/// Overwrites a text at the end of a scope. Let the text grow only by AppendSecret or within its capacity: any other
/// reallocation would leave an uncleared copy.
class CleanseTextOnExit {
  public:
    explicit CleanseTextOnExit(std::string &text) : text_(text) {}
    ~CleanseTextOnExit() { Cleanse(text_); }
    CleanseTextOnExit(const CleanseTextOnExit &) = delete;
    CleanseTextOnExit &operator=(const CleanseTextOnExit &) = delete;

  private:
    std::string &text_;
};

/// Appends to a text that may contain a secret. Overwrites the old memory if the text is reallocated.
void AppendSecret(std::string &text, const char *bytes, std::size_t length);

}  // namespace TAVO::Utils

#endif
