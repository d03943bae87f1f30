#ifndef TAVOSSO_TESTS_SUPPORT_SYSTEM_LOG_H
#define TAVOSSO_TESTS_SUPPORT_SYSTEM_LOG_H

#include <syslog.h>

#include <iosfwd>
#include <string>
#include <vector>

// The program that links this defines `syslog` itself, and so sees what the library under test writes.
namespace Test {

struct LogLine {
    int priority;
    std::string text;  // with the source's line number written as N: "utils:N calloc failed. ..."
};

bool operator==(const LogLine &a, const LogLine &b);
std::ostream &operator<<(std::ostream &stream, const LogLine &line);

/// A line at LOG_ERR.
LogLine Error(const std::string &text);

/// Every line so far, and no more of them. Throws if the table of failures has no such line of this level.
std::vector<LogLine> TakeSystemLog();

/// The same where the test itself has thrown what the library logs, with a text of its own.
std::vector<LogLine> TakeSystemLogWithOwnTexts();

}  // namespace Test

#endif
