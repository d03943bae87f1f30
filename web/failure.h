#ifndef TAVOSSO_WEB_FAILURE_H
#define TAVOSSO_WEB_FAILURE_H

#include <curl/curl.h>

#include "web/web.h"

namespace TAVO::Web {

/// One sentence for the user.
std::string SentenceOf(Failure failure);

/// The failed login with the cause that libcurl reports.
FailedLogin FailedTransfer(FailedLogin failed, CURLcode result);

/// The failed login of a discovery document or key set that is not what it must be.
FailedLogin UnusableDocuments(FailedLogin failed);

}  // namespace TAVO::Web

#endif
