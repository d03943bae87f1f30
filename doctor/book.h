#ifndef TAVOSSO_DOCTOR_BOOK_H
#define TAVOSSO_DOCTOR_BOOK_H

#include <string>
#include <utility>
#include <vector>

// What the guides for administrators and programmers say of a text, whether an exception's, a line of the log, or
// libcurl's. Their tables are built into the program: what is told here is what stands there.
namespace Doctor {

struct Explanation {
    std::string about;  // the text as the guide has it, with words in capitals for what differs

    /// Each other column of the table: its head, and what it says.
    std::vector<std::pair<std::string, std::string>> told;

    /// What a column says, empty where the table has none of that name.
    std::string Told(const std::string &column) const;
};

/// The most particular row that each kind of table has on a text. A line may be as the log has it.
std::vector<Explanation> LookUp(const std::string &text);

/// What the guides have on libcurl's text for a transfer that failed.
std::string CauseOf(const std::string &curlText);

}  // namespace Doctor

#endif
