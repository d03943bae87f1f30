#include "frontend/folders.h"

#include "frontend/environment.h"

namespace Frontend {

namespace {

constexpr char kFolder[] = "/usr/tavo/var/frontend";
constexpr std::time_t kSessionSeconds = std::time_t{8} * 60 * 60;
constexpr std::size_t kMostSessions = 10000;

/// Returns the path of a folder. Creates the folder that contains it.
std::string FolderNamed(const std::string &name) {
    static_cast<void>(TAVO::Web::PrivateFolder(kFolder, 0));
    return kFolder + ("/" + name);
}

}  // namespace

TAVO::Web::FolderLoginStore OpenLogins() {
    return TAVO::Web::FolderLoginStore(FolderNamed("logins"), MostPendingLogins());
}

TAVO::Web::PrivateFolder OpenSessions() { return {FolderNamed("sessions"), kSessionSeconds, kMostSessions}; }

}  // namespace Frontend
