#ifndef TAVOSSO_TESTS_SUPPORT_INTERPOSED_RELEASES_H
#define TAVOSSO_TESTS_SUPPORT_INTERPOSED_RELEASES_H

#include <cstddef>
#include <string>
#include <vector>

// Defines `free`. Programs must also link memory.cpp.
namespace Test {

/// Inspects each block of memory that the library releases on this thread, directly or through the C++ library.
class WatchReleases {
  public:
    /// Searches blocks for `secrets`, which must outlive this object.
    explicit WatchReleases(const std::vector<std::string> &secrets);
    ~WatchReleases();
    WatchReleases(const WatchReleases &) = delete;
    WatchReleases &operator=(const WatchReleases &) = delete;

    /// The number of inspected blocks.
    std::size_t Blocks() const;

    /// The secrets found, each with the call stack of the release, innermost first.
    std::vector<std::string> Found() const;
};

}  // namespace Test

#endif
