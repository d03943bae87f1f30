#ifndef TAVOSSO_WEB_FAILURE_TABLE_H
#define TAVOSSO_WEB_FAILURE_TABLE_H

#include <curl/curl.h>

#include <vector>

#include "web/web.h"

// Cause and remedy of each failure that the library, the stand-in and the front end report. The tables of the documents
// and the output of `tavosso-doctor explain` are generated from it.
namespace TAVO::Web {

enum class FailureKind {
    kLibraryLine,   // of the system log
    kPlatformLine,  // the stand-in's
    kFrontEndLine,
    kReason,         // of the front end, for a failed sign-in
    kException,      // of the library
    kTransfer,       // libcurl's result
    kProviderError,  // not in this table; the doctor has its own
};

/// The table's text for the exception with an error response of the token endpoint (RFC 6749, section 5.2).
constexpr char kErrorAnswer[] = "{... \"error\": ...}";

/// The table's text for an error of the authorization endpoint (RFC 6749, section 4.1.2.1).
constexpr char kReturnedError[] = "The provider refused: REASON";

struct FailureRow {
    FailureKind kind;

    /// Words in capitals are placeholders (failure_lookup.h). For a transfer, the name of its CURLcode. Empty if the
    /// text is another library's.
    std::vector<const char *> texts;

    Failure code;  // of the failed login

    const char *cause;  // keys, files, paths and commands are in backticks
    const char *remedy;
    const char *type = "";       // a line's level, or an exception's exact class
    const char *thrownBy = "";   // of an exception
    CURLcode result = CURLE_OK;  // of a transfer
};

const std::vector<FailureRow> &FailureTable();

}  // namespace TAVO::Web

#endif
