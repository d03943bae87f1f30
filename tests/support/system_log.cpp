#include "tests/support/system_log.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ostream>
#include <regex>
#include <stdexcept>

#include "web/failure_lookup.h"

namespace Test {

namespace {

// A fixed buffer, because tests let memory run out.
struct Record {
    int priority;
    std::size_t length;
};
std::array<char, std::size_t{4} << 20> records;
std::size_t used = 0;

LogLine Read(const Record &record, const char *text) {
    static const std::regex sourceLine("^([a-z]+):[0-9]+ ");
    return {record.priority, std::regex_replace(std::string(text, record.length), sourceLine, "$1:N ")};
}

void Write(int priority, const char *format, std::va_list arguments) {
    Record record{priority, 0};
    if (used + sizeof record >= records.size()) {
        std::abort();  // buffer is full
    }
    char *text = &records[used + sizeof record];
    const std::size_t room = records.size() - used - sizeof record;
    const int length = std::vsnprintf(text, room, format, arguments);  // glibc supports %m
    if (length < 0 || static_cast<std::size_t>(length) >= room) {
        std::abort();
    }
    record.length = static_cast<std::size_t>(length);
    std::memcpy(&records[used], &record, sizeof record);
    used += sizeof record + record.length + 1;
    errno = EINTR;  // like a real syslog, which may change errno
}

std::string LevelOf(int priority) {
    const int level = LOG_PRI(priority);
    const std::string name = level == LOG_ERR       ? "err"
                             : level == LOG_WARNING ? "warning"
                             : level == LOG_INFO    ? "info"
                                                    : "?";
    return name + (LOG_FAC(priority) == LOG_FAC(LOG_AUTH) ? ", auth" : "");
}

bool IsInTable(const LogLine &line) {
    const auto isText = [&](const char *ofTable) {
        // The placeholder matches only texts of libcurl.
        const bool isCurls =
            std::strstr(ofTable, "CURL") == nullptr || TAVO::Web::FindTransferText(line.text) != CURLE_OK;
        return isCurls && TAVO::Web::IsText(line.text, ofTable);
    };
    const std::vector<TAVO::Web::FailureRow> &rows = TAVO::Web::FailureTable();
    return std::any_of(rows.begin(), rows.end(), [&](const TAVO::Web::FailureRow &row) {
        return row.kind <= TAVO::Web::FailureKind::kFrontEndLine && LevelOf(line.priority) == row.type &&
               std::any_of(row.texts.begin(), row.texts.end(), isText);
    });
}

}  // namespace

bool operator==(const LogLine &a, const LogLine &b) { return a.priority == b.priority && a.text == b.text; }

std::ostream &operator<<(std::ostream &stream, const LogLine &line) {
    return stream << "<" << line.priority << "> " << line.text;
}

LogLine Error(const std::string &text) { return {LOG_ERR, text}; }

std::vector<LogLine> TakeSystemLog() {
    const std::vector<LogLine> taken = TakeSystemLogWithOwnTexts();
    for (const LogLine &line : taken) {
        if (!IsInTable(line)) {
            throw std::logic_error("web/failure_table.cpp has no row for a line of level " + LevelOf(line.priority) +
                                   ": " + line.text);
        }
    }
    return taken;
}

std::vector<LogLine> TakeSystemLogWithOwnTexts() {
    std::vector<LogLine> taken;
    for (std::size_t at = 0; at < used;) {
        Record record{};
        std::memcpy(&record, &records[at], sizeof record);
        taken.push_back(Read(record, &records[at + sizeof record]));
        at += sizeof record + record.length + 1;
    }
    used = 0;
    return taken;
}

}  // namespace Test

extern "C" {

void syslog(int priority, const char *format, ...) {
    std::va_list arguments;
    va_start(arguments, format);
    Test::Write(priority, format, arguments);
    va_end(arguments);
}

/// Called by libraries built with _FORTIFY_SOURCE.
void __syslog_chk(int priority, int /*flag*/, const char *format, ...) {
    std::va_list arguments;
    va_start(arguments, format);
    Test::Write(priority, format, arguments);
    va_end(arguments);
}

}  // extern "C"
