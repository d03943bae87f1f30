#ifndef TAVOSSO_WEB_FAILURE_LOOKUP_H
#define TAVOSSO_WEB_FAILURE_LOOKUP_H

#include <cstddef>
#include <string>

#include "web/failure_table.h"

// Which text of the table of failures a real text is. In a text of the table, a placeholder matches anything; JSON
// alone matches a provider's error answer (RFC 6749, section 5.2).
namespace TAVO::Web {

constexpr const char *kPlaceholders[] = {"N",   "CURL", "SYSTEM", "NAME",   "UID",
                                         "GID", "ALG",  "SOURCE", "REASON", "DOMAIN"};

/// Whether `text` is this text of the table.
bool IsText(const std::string &text, const char *ofTable);

/// Whether `line` ends in this text of the table. A line of the log begins with a time and a program.
bool EndsInText(const std::string &line, const char *ofTable);

/// The number of characters that are not a placeholder's. The text that has more of them explains more.
std::size_t Specificity(const char *ofTable);

/// The row of a failed transfer; null if the table has none.
const FailureRow *FindTransfer(CURLcode result);

/// The result whose text, in the words of libcurl 7 or 8, is in `text`; CURLE_OK if there is none.
CURLcode FindTransferText(const std::string &text);

}  // namespace TAVO::Web

#endif
