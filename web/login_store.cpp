#include "web/private_folder.h"
#include "web/web.h"

namespace TAVO::Web {

LoginStore::~LoginStore() = default;

FolderLoginStore::FolderLoginStore(std::string folder, std::size_t most) : folder_(std::move(folder)), most_(most) {}

bool FolderLoginStore::Keep(const std::string &name, const std::string &text) {
    return PrivateFolder(folder_, kLoginSeconds, most_).Keep(name, text);
}

std::optional<std::string> FolderLoginStore::Take(const std::string &name) {
    return PrivateFolder(folder_, kLoginSeconds, most_).Take(name);
}

}  // namespace TAVO::Web
