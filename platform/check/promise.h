#ifndef TAVOSSO_PLATFORM_CHECK_PROMISE_H
#define TAVOSSO_PLATFORM_CHECK_PROMISE_H

#include <functional>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include "platform/check/platform_functions.h"

// The promises of platform/platform.h.
namespace PlatformCheck {

/// A name that the platform knows.
struct Conversion {
    std::string name;  // DOMAIN\user
    std::string result;
};

/// What is checked.
struct Subject {
    PlatformFunctions functions;
    std::optional<Conversion> conversion;
};

struct Promise {
    const char *function;
    const char *behaviour;
    void (*verify)(const Subject &subject);  // throws promise_broken; runs in its own process
    bool needsConversion = false;
};

class promise_broken : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

std::vector<Promise> URLEncodingPromises();
std::vector<Promise> Base64EncodingPromises();
std::vector<Promise> Base64DecodingPromises();
std::vector<Promise> LookupPromises();

/// Throws promise_broken with a reason.
void Expect(bool isKept, const std::string &otherwise);

/// Throws promise_broken with the first difference.
void ExpectEqual(const std::string &found, const std::string &expected, const std::string &call);

/// Throws promise_broken if the calls leave something of the process changed.
void ExpectProcessUnchanged(const std::function<void()> &calls);

/// Returns a C literal of at most 60 bytes, with the length of a longer text.
std::string Quoted(const std::string &bytes);

}  // namespace PlatformCheck

#endif
