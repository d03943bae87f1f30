#ifndef TAVOSSO_FRONTEND_FOLDERS_H
#define TAVOSSO_FRONTEND_FOLDERS_H

#include "web/private_folder.h"
#include "web/web.h"

// The folders of the front end, in /usr/tavo/var/frontend.
namespace Frontend {

/// Pending logins. Throws `Refusal` for an invalid FRONTEND_PENDING_LOGINS.
TAVO::Web::FolderLoginStore OpenLogins();

TAVO::Web::PrivateFolder OpenSessions();

}  // namespace Frontend

#endif
