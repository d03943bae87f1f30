#ifndef TAVOSSO_DOCTOR_PROVIDER_ERRORS_H
#define TAVOSSO_DOCTOR_PROVIDER_ERRORS_H

#include <string>
#include <vector>

#include "web/failure_table.h"

namespace Doctor {

/// Error codes of OAuth 2.0, OpenID Connect and Azure AD. `type` is the source of the description.
const std::vector<TAVO::Web::FailureRow> &ProviderErrors();

/// Returns whether a text contains an error code as a word, in any case.
bool ContainsCode(const std::string &text, const std::string &code);

/// Returns the row of the most specific error code in a text, or null.
const TAVO::Web::FailureRow *FindProviderError(const std::string &text);

/// Returns the text to look up for a sentence that only the script of the relay page has; empty for other texts.
std::string ReasonOfSentence(const std::string &sentence);

}  // namespace Doctor

#endif
