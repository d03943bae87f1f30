#ifndef TAVOSSO_TESTS_E2E_SOAK_PROVIDER_PROCESS_H
#define TAVOSSO_TESTS_E2E_SOAK_PROVIDER_PROCESS_H

#include <sys/types.h>

namespace Test {

/// The codes that the providers accept.
constexpr char kGoodCode[] = "good";        // a token
constexpr char kForgedCode[] = "forged";    // a token with a signature of another key
constexpr char kRefusedCode[] = "refused";  // no token

constexpr char kAuthorizationEndpoint[] = "https://idp.example/authorize";

/// A provider of each profile, in a separate process: memory of recorded requests and of TLS servers would count for
/// the library. Writes the configuration of both clients, but not the profile.
class ProviderProcess {
  public:
    ProviderProcess();
    ~ProviderProcess();
    ProviderProcess(const ProviderProcess &) = delete;
    ProviderProcess &operator=(const ProviderProcess &) = delete;

  private:
    pid_t process_;
    int life_;  // the process ends when this socket is closed
};

}  // namespace Test

#endif
