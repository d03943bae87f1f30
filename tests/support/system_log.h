#ifndef TAVOSSO_TESTS_SUPPORT_SYSTEM_LOG_H
#define TAVOSSO_TESTS_SUPPORT_SYSTEM_LOG_H

#include <syslog.h>

#include <iosfwd>
#include <string>
#include <vector>

// Defines `syslog`, to read what the library logs.
namespace Test {

struct LogLine {
    int priority;
    std::string text;  // the line number of the source is N: "utils:N calloc failed. ..."
};

bool operator==(const LogLine &a, const LogLine &b);
std::ostream &operator<<(std::ostream &stream, const LogLine &line);

/// A line at LOG_ERR.
LogLine Error(const std::string &text);

/// Returns and removes all lines. Throws if the failure table has no row for one of them.
std::vector<LogLine> TakeSystemLog();

/// The same without the check, for lines whose text comes from the test.
std::vector<LogLine> TakeSystemLogWithOwnTexts();

}  // namespace Test

#endif
