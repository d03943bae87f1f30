#ifndef TAVOSSO_WEB_FAILURE_LOOKUP_H
#define TAVOSSO_WEB_FAILURE_LOOKUP_H

#include <cstddef>
#include <string>

#include "web/failure_table.h"

// Finds the row of the failure table for an actual text. A placeholder matches any text; `kErrorAnswer` matches JSON
// with an "error".
namespace TAVO::Web {

constexpr const char *kPlaceholders[] = {"N",   "CURL", "SYSTEM", "NAME",   "UID",
                                         "GID", "ALG",  "SOURCE", "REASON", "DOMAIN"};

/// Returns whether `text` matches this text of the table.
bool IsText(const std::string &text, const char *ofTable);

/// Returns whether `line` ends in this text of the table. Log lines begin with a time and a program.
bool EndsInText(const std::string &line, const char *ofTable);

/// Returns the same, ignoring case and a final full stop: for texts that a person has typed.
bool EndsInTypedText(const std::string &line, const char *ofTable);

/// Returns the number of characters outside placeholders. A text with more of them is more specific.
std::size_t Specificity(const char *ofTable);

/// Returns the row of a failed transfer, or null.
const FailureRow *FindTransfer(CURLcode result);

/// Returns the result whose text, of libcurl 7 or 8, is in `text`; CURLE_OK if there is none.
CURLcode FindTransferText(const std::string &text);

}  // namespace TAVO::Web

#endif
