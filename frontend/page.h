#ifndef TAVOSSO_FRONTEND_PAGE_H
#define TAVOSSO_FRONTEND_PAGE_H

#include <string>

#include "frontend/messages.h"
#include "web/web.h"

namespace Frontend {

/// Responds with a page of the front end. `title` is the id of a message: title and heading. `content` is HTML.
void ShowPage(TAVO::Web::Response &response, const std::string &status, const Messages &messages, const char *title,
              const std::string &content);

}  // namespace Frontend

#endif
