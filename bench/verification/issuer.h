#ifndef TAVOSSO_BENCH_VERIFICATION_ISSUER_H
#define TAVOSSO_BENCH_VERIFICATION_ISSUER_H

#include <string>
#include <vector>

#include "tests/support/server.h"

namespace Bench {

/// A provider in this program, over TLS, of which keys can be fetched: for who takes them from nowhere else, and keeps
/// them afterwards.
class Issuer {
  public:
    /// Publishes the RSA keys of these sizes, once, and makes them when they are asked for: that takes seconds.
    explicit Issuer(const std::vector<unsigned int> &sizesOfKeys);

    std::string name() const { return server_.URL(""); }

  private:
    Test::Server server_;
};

}  // namespace Bench

#endif
