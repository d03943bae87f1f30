#ifndef TAVOSSO_TESTS_SUPPORT_INTERPOSED_CALLS_H
#define TAVOSSO_TESTS_SUPPORT_INTERPOSED_CALLS_H

#include <dlfcn.h>

#include <map>
#include <string>
#include <vector>

// This program defines functions of libc, libcurl, libcrypto and the platform itself and so stands between them and the
// library under test: each of its calls is counted, passed on, or made to fail.
namespace Test {

/// Whether a call comes from the library under test, by the address that it returns to: what the other libraries call
/// for themselves is neither counted nor made to fail.
bool FromLibrary(const void *returnAddress);

/// The same for jsoncpp, which allocates with malloc.
bool FromJsonLibrary(const void *returnAddress);

/// For FromLibrary: where the function that this stands in returns to.
#define CALLER __builtin_return_address(0)

/// Lets the n-th call of a function from now on fail (1: the next).
void FailCall(const std::string &function, int n = 1);

/// Lets every call succeed again, and counts anew.
void FailNothing();

/// Counts a call of the library under test, and says whether it is the one to fail.
bool ShouldFail(const char *function, const void *caller);

/// How often the library under test has called each function since FailNothing.
std::map<std::string, int> CallCounts();

/// Every text that explicit_bzero has overwritten for the library under test since the last call.
std::vector<std::string> TakeCleansed();
void NoteCleansed(const void *memory, std::size_t size, const void *caller);

/// The function that would have been called.
template <typename Function>
Function *Next(Function * /*own*/, const char *name) {
    return reinterpret_cast<Function *>(dlsym(RTLD_NEXT, name));
}

/// What libcrypto itself does when a call of it fails: leaves an entry in its error queue.
void RaiseCryptoError();

/// A call into libcrypto on its way. A function of libcrypto may end in a jump to another that stands here, which then
/// seems to be called from where the first was: such a call is not the library's.
class CallDepth {
  public:
    CallDepth() { ++depth_; }
    ~CallDepth() { --depth_; }
    CallDepth(const CallDepth &) = delete;
    CallDepth &operator=(const CallDepth &) = delete;

    bool Outermost() const { return depth_ == 1; }

  private:
    static inline thread_local int depth_ = 0;
};

/// Passes a call into libcrypto on, or fails it if that has been asked for.
template <typename Result, typename Function, typename... Arguments>
Result PassOn(const char *name, const void *caller, Result failure, Function *own, Arguments... arguments) {
    const CallDepth depth;
    if (depth.Outermost() && ShouldFail(name, caller)) {
        RaiseCryptoError();
        return failure;
    }
    return Next(own, name)(arguments...);
}

}  // namespace Test

#endif
