#ifndef TAVOSSO_TESTS_E2E_SOAK_FIGURES_H
#define TAVOSSO_TESTS_E2E_SOAK_FIGURES_H

#include <cstddef>
#include <set>

namespace Test {

/// What this process holds, over some moments.
class Figures {
  public:
    /// One more moment: now.
    void Note();

    /// Bytes that malloc has given out, on average.
    double Heap() const { return heap_ / moments_; }

    /// Bytes in main memory that belong to no file, on average: those of files come and go as the kernel likes.
    double Resident() const { return resident_ / moments_; }

    /// How many descriptors were open.
    const std::set<std::ptrdiff_t> &Descriptors() const { return descriptors_; }

  private:
    double moments_ = 0;
    double heap_ = 0;
    double resident_ = 0;
    std::set<std::ptrdiff_t> descriptors_;
};

}  // namespace Test

#endif
