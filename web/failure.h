#ifndef TAVOSSO_WEB_FAILURE_H
#define TAVOSSO_WEB_FAILURE_H

#include <curl/curl.h>

#include "web/web.h"

namespace TAVO::Web {

/// Returns one sentence for the user.
std::string SentenceOf(Failure failure);

/// Adds the cause that libcurl reports.
FailedLogin FailedTransfer(FailedLogin failed, CURLcode result);

/// Adds the cause: the discovery document or key set is invalid.
FailedLogin UnusableDocuments(FailedLogin failed);

}  // namespace TAVO::Web

#endif
