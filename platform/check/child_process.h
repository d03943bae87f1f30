#ifndef TAVOSSO_PLATFORM_CHECK_CHILD_PROCESS_H
#define TAVOSSO_PLATFORM_CHECK_CHILD_PROCESS_H

#include <chrono>
#include <functional>
#include <string>

// Runs foreign code in a child process, which may crash, hang or end.
namespace PlatformCheck {

struct Result {
    bool isGood;         // the task has returned
    std::string reason;  // why not
};

/// Runs a task in a child process, with standard input from /dev/null and standard output and standard error in
/// files that are discarded. An exception is not good. The limit is for each call that the task notes.
Result RunInChild(const std::function<void()> &task, std::chrono::seconds limit);

/// Records, in the child process, the call that begins. A crash or a hang is reported with it.
void NoteCall(const std::string &call);

/// Records, in the child process, why a signal ends it. Callable in a signal handler.
void NoteFault(const char *fault);

}  // namespace PlatformCheck

#endif
