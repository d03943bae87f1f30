#include "platform/check/log_lines.h"

#include <cstdarg>
#include <cstdio>
#include <utility>

namespace PlatformCheck {

namespace {

std::vector<std::string> lines;

void AddLine(const char *format, std::va_list arguments) {
    char line[4096];
    // clang-tidy 14 does not see that the callers below have started the arguments.
    std::vsnprintf(line, sizeof line, format, arguments);  // NOLINT(clang-analyzer-valist.Uninitialized)
    std::string text = line;
    if (!text.empty() && text.back() == '\n') {
        text.pop_back();  // which syslog(3) ignores
    }
    lines.push_back(std::move(text));
}

}  // namespace

std::vector<std::string> TakeLogLines() { return std::exchange(lines, {}); }

}  // namespace PlatformCheck

// The calls of the loaded libraries come here. <syslog.h> is left out: under _FORTIFY_SOURCE it defines them.
// NOLINTBEGIN(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp): the C library's own names
extern "C" {

void syslog(int priority, const char *format, ...);
void vsyslog(int priority, const char *format, std::va_list arguments);
// What a library calls that was built with _FORTIFY_SOURCE.
void __syslog_chk(int priority, int flag, const char *format, ...);
void __vsyslog_chk(int priority, int flag, const char *format, std::va_list arguments);

void syslog(int /*priority*/, const char *format, ...) {
    std::va_list arguments;
    va_start(arguments, format);
    PlatformCheck::AddLine(format, arguments);
    va_end(arguments);
}

void vsyslog(int /*priority*/, const char *format, std::va_list arguments) {
    PlatformCheck::AddLine(format, arguments);
}

void __syslog_chk(int /*priority*/, int /*flag*/, const char *format, ...) {
    std::va_list arguments;
    va_start(arguments, format);
    PlatformCheck::AddLine(format, arguments);
    va_end(arguments);
}

void __vsyslog_chk(int /*priority*/, int /*flag*/, const char *format, std::va_list arguments) {
    PlatformCheck::AddLine(format, arguments);
}
}
// NOLINTEND(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp)
