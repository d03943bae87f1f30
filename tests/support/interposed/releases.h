#ifndef TAVOSSO_TESTS_SUPPORT_INTERPOSED_RELEASES_H
#define TAVOSSO_TESTS_SUPPORT_INTERPOSED_RELEASES_H

#include <cstddef>
#include <string>
#include <vector>

// The program that links this, and memory.cpp, defines `free` itself.
namespace Test {

/// While it lives, looks at each block of memory as it is released, on this thread, by the library under test: by its
/// own code, or by what that has the C++ library do.
class WatchReleases {
  public:
    /// The texts that no block may hold any more; they stay the caller's.
    explicit WatchReleases(const std::vector<std::string> &secrets);
    ~WatchReleases();
    WatchReleases(const WatchReleases &) = delete;
    WatchReleases &operator=(const WatchReleases &) = delete;

    /// How many blocks have been looked at.
    std::size_t Blocks() const;

    /// The secrets that were found, each with the functions that released it, innermost first.
    std::vector<std::string> Found() const;
};

}  // namespace Test

#endif
