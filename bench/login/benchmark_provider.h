#ifndef TAVOSSO_BENCH_LOGIN_BENCHMARK_PROVIDER_H
#define TAVOSSO_BENCH_LOGIN_BENCHMARK_PROVIDER_H

#include <map>
#include <string>

#include "tests/support/server.h"

namespace Bench {

/// A provider for both profiles, in a thread of this program. Its documents are as long as real ones.
class Provider {
  public:
    /// Configures the appliance for this provider.
    Provider();

    /// Returns the base address of the profile's documents.
    std::string URL(const std::string &profile) const { return server_.URL("/" + profile); }

  private:
    void AnswerNextConnection();

    std::map<std::string, std::string> answers_;  // by method and path
    Test::Server server_;                         // destroyed first: its thread reads answers_
};

}  // namespace Bench

#endif
