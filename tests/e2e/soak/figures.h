#ifndef TAVOSSO_TESTS_E2E_SOAK_FIGURES_H
#define TAVOSSO_TESTS_E2E_SOAK_FIGURES_H

#include <cstddef>
#include <set>

namespace Test {

/// Resource use of this process, averaged over several measurements.
class Figures {
  public:
    /// Adds a measurement.
    void Note();

    /// Average of bytes allocated with malloc.
    double Heap() const { return heap_ / moments_; }

    /// Average of bytes of private memory. File mappings are excluded, because the kernel evicts and loads them.
    double Resident() const { return resident_ / moments_; }

    /// The numbers of open descriptors.
    const std::set<std::ptrdiff_t> &Descriptors() const { return descriptors_; }

  private:
    double moments_ = 0;
    double heap_ = 0;
    double resident_ = 0;
    std::set<std::ptrdiff_t> descriptors_;
};

}  // namespace Test

#endif
