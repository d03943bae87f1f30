#ifndef TAVOSSO_TESTS_SUPPORT_INTERPOSED_CALLS_H
#define TAVOSSO_TESTS_SUPPORT_INTERPOSED_CALLS_H

#include <dlfcn.h>

#include <map>
#include <string>
#include <vector>

// Counts the library's calls of libc, libcurl, libcrypto and platform functions, and makes chosen ones fail. The
// program defines these functions; they call the original ones.
namespace Test {

/// Whether a return address is in the library. Calls of other libraries are neither counted nor made to fail.
bool FromLibrary(const void *returnAddress);

/// The same for jsoncpp, which allocates with malloc.
bool FromJsonLibrary(const void *returnAddress);

/// The return address of the current function.
#define CALLER __builtin_return_address(0)

/// Makes the n-th call of a function fail (1: the next).
void FailCall(const std::string &function, int n = 1);

/// Makes all calls succeed and resets the counters.
void FailNothing();

/// Counts a call if `caller` is in the library. Returns whether it must fail.
bool ShouldFail(const char *function, const void *caller);

/// The number of the library's calls of each function since FailNothing.
std::map<std::string, int> CallCounts();

/// The memory that the library has overwritten with explicit_bzero since the last call.
std::vector<std::string> TakeCleansed();
void NoteCleansed(const void *memory, std::size_t size, const void *caller);

/// The replaced function.
template <typename Function>
Function *Next(Function * /*own*/, const char *name) {
    return reinterpret_cast<Function *>(dlsym(RTLD_NEXT, name));
}

/// Adds an entry to the error queue, like a failing libcrypto call.
void RaiseCryptoError();

/// Nesting depth of libcrypto calls. A libcrypto function may jump to another one, whose return address is then in the
/// library too. Only the outermost call counts.
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

/// Calls the libcrypto function, or fails.
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
