#ifndef TAVOSSO_FRONTEND_FOLDERS_H
#define TAVOSSO_FRONTEND_FOLDERS_H

#include "web/private_folder.h"
#include "web/web.h"

// What the front end remembers, in /usr/tavo/var/frontend.
namespace Frontend {

/// Logins that are under way. Throws `Refusal` for a wrong FRONTEND_PENDING_LOGINS.
TAVO::Web::FolderLoginStore OpenLogins();

TAVO::Web::PrivateFolder OpenSessions();

}  // namespace Frontend

#endif
