#ifndef TAVOSSO_WEB_FAILURE_TABLE_H
#define TAVOSSO_WEB_FAILURE_TABLE_H

#include <curl/curl.h>

#include <vector>

#include "web/web.h"

// Every failure that the library, the platform's stand-in and the front end report, with its cause and its remedy. The
// documents and `tavosso-doctor explain` print this table, and the tests compare it with what is thrown and logged.
namespace TAVO::Web {

enum class FailureKind {
    kLibraryLine,   // of the system log
    kPlatformLine,  // the stand-in's
    kFrontEndLine,
    kReason,     // the front end's own reason for a failed sign-in
    kException,  // of the library
    kTransfer,   // libcurl's result
};

/// The table's text for an error response of the token endpoint (RFC 6749, section 5.2), which the library throws.
constexpr char kErrorAnswer[] = "{... \"error\": ...}";

/// The table's text for an error of the authorization endpoint (RFC 6749, section 4.1.2.1).
constexpr char kReturnedError[] = "The provider refused: REASON";

struct FailureRow {
    FailureKind kind;

    /// Words in capitals are placeholders: see failure_lookup.h. Of a transfer, the name of its CURLcode. Empty where
    /// the text is another library's.
    std::vector<const char *> texts;

    Failure code;  // of a login that ends so

    const char *cause;  // a key, file, path or command is in backticks
    const char *remedy;
    const char *type = "";       // a line's level, or an exception's exact class
    const char *thrownBy = "";   // of an exception
    CURLcode result = CURLE_OK;  // of a transfer
};

const std::vector<FailureRow> &FailureTable();

}  // namespace TAVO::Web

#endif
