#include "tests/support/system_log.h"

#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <ostream>
#include <regex>

namespace Test {

namespace {

std::vector<LogLine> &Lines() {
    static std::vector<LogLine> lines;
    return lines;
}

}  // namespace

bool operator==(const LogLine &a, const LogLine &b) { return a.priority == b.priority && a.text == b.text; }

std::ostream &operator<<(std::ostream &stream, const LogLine &line) {
    return stream << "<" << line.priority << "> " << line.text;
}

LogLine Error(const std::string &text) { return {LOG_ERR, text}; }

std::vector<LogLine> TakeSystemLog() {
    std::vector<LogLine> taken;
    taken.swap(Lines());
    return taken;
}

}  // namespace Test

extern "C" void syslog(int priority, const char *format, ...) {
    char text[8192];
    va_list arguments;
    va_start(arguments, format);
    std::vsnprintf(text, sizeof text, format, arguments);  // glibc's knows %m
    va_end(arguments);
    Test::Lines().push_back({priority, std::regex_replace(text, std::regex("^([a-z]+):[0-9]+ "), "$1:N ")});
    errno = EINTR;  // as a real one may leave it: nothing in the library may rely on it
}
