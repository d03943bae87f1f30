#ifndef TAVOSSO_TESTS_INTERPOSED_CALLS_H
#define TAVOSSO_TESTS_INTERPOSED_CALLS_H

#include <dlfcn.h>

#include <string>
#include <vector>

// This program defines functions of libc, libcrypto and the platform itself and so stands between them and the library
// under test: each call is counted, passed on, or made to fail.
namespace Test {

/// Lets the n-th call of a function from now on fail (1: the next).
void FailCall(const std::string &function, int n = 1);

/// Lets every call succeed again.
void FailNothing();

/// Counts a call, and says whether it is the one to fail.
bool ShouldFail(const std::string &function);

/// Every text that OPENSSL_cleanse has overwritten since the last call.
std::vector<std::string> TakeCleansed();
void NoteCleansed(const void *memory, std::size_t size);

/// The function that would have been called.
template <typename Function>
Function *Next(Function * /*own*/, const char *name) {
    return reinterpret_cast<Function *>(dlsym(RTLD_NEXT, name));
}

/// A call on its way. Calls that it makes itself, inside of libcrypto, are not the library's, and not counted.
class CallDepth {
  public:
    CallDepth() { ++depth_; }
    ~CallDepth() { --depth_; }
    CallDepth(const CallDepth &) = delete;
    CallDepth &operator=(const CallDepth &) = delete;

    bool Outermost() const { return depth_ == 1; }

  private:
    static inline int depth_ = 0;
};

/// What libcrypto itself does when a call of it fails: leaves an entry in its error queue.
void RaiseCryptoError();

/// Passes a call into libcrypto on, or fails it if that has been asked for.
template <typename Result, typename Function, typename... Arguments>
Result PassOn(const char *name, Result failure, Function *own, Arguments... arguments) {
    const CallDepth depth;
    if (depth.Outermost() && ShouldFail(name)) {
        RaiseCryptoError();
        return failure;
    }
    return Next(own, name)(arguments...);
}

}  // namespace Test

#endif
