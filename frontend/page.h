#ifndef TAVOSSO_FRONTEND_PAGE_H
#define TAVOSSO_FRONTEND_PAGE_H

#include <string>

#include "web/web.h"

namespace Frontend {

/// Responds with a page of the front end. `content` is HTML; `title` is text.
void ShowPage(TAVO::Web::Response &response, const std::string &status, const std::string &title,
              const std::string &content);

}  // namespace Frontend

#endif
