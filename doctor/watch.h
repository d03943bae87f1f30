#ifndef TAVOSSO_DOCTOR_WATCH_H
#define TAVOSSO_DOCTOR_WATCH_H

#include <curl/curl.h>

#include <ctime>
#include <string>
#include <vector>

// What the library does while the doctor has it work: its log lines and its transfers. The calls of the library can be
// interposed; so what is told here is of the very request that a login makes, under the same options.
namespace Doctor {

struct Certificate {
    std::string subject;
    std::string issuer;
    std::time_t expires = -1;  // -1 where libcurl tells no date
};

struct Transfer {
    std::string url;
    CURLcode result = CURLE_OK;
    long status = 0;
    std::string location;  // where the answer sends a browser, whole; empty where it does not
    double seconds = 0;
    std::time_t date = -1;                  // by the server's clock, from its "Date"; -1 where it told none
    std::vector<Certificate> certificates;  // the server's own first; none where TLS was not established
};

/// The lines that would have gone to the system's log, since they were last taken.
std::vector<std::string> TakeLogLines();

/// A line without the source and its line, which tell an administrator nothing.
std::string MessageOf(const std::string &logLine);

/// The messages of these lines, each behind a semicolon: for the end of what is told as found.
std::string TakeMessages();

/// The transfers since they were last taken.
std::vector<Transfer> TakeTransfers();

struct TransferRules {
    long timeout = 10;          // in seconds, for each; the library itself waits without a limit
    bool showProgress = false;  // on standard error, for as long as it takes
};
void SetTransferRules(const TransferRules &rules);

/// As long as one lives, every transfer fails before anyone is asked.
class RefuseTransfers {
  public:
    RefuseTransfers();
    ~RefuseTransfers();
    RefuseTransfers(const RefuseTransfers &) = delete;
    RefuseTransfers &operator=(const RefuseTransfers &) = delete;
};

}  // namespace Doctor

#endif
