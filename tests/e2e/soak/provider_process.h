#ifndef TAVOSSO_TESTS_E2E_SOAK_PROVIDER_PROCESS_H
#define TAVOSSO_TESTS_E2E_SOAK_PROVIDER_PROCESS_H

#include <sys/types.h>

namespace Test {

/// The codes that the providers know, and what each is exchanged for.
constexpr char kGoodCode[] = "good";        // a token
constexpr char kForgedCode[] = "forged";    // a token with another's signature
constexpr char kRefusedCode[] = "refused";  // no token

/// Where both providers send the browser.
constexpr char kAuthorizationEndpoint[] = "https://idp.example/authorize";

/// A provider of each profile, in a process of their own: they keep each request that they get, and OpenSSL keeps
/// things for servers, which would all count as memory that the library under test takes. The appliance is configured
/// for both, but for the profile in force.
class ProviderProcess {
  public:
    ProviderProcess();
    ~ProviderProcess();
    ProviderProcess(const ProviderProcess &) = delete;
    ProviderProcess &operator=(const ProviderProcess &) = delete;

  private:
    pid_t process_;
    int life_;  // a pipe's end: the process ends when it is closed
};

}  // namespace Test

#endif
