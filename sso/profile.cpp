#include <syslog.h>

#include "sso/names.h"
#include "sso/sso.h"
#include "utils/json.h"
#include "utils/root_privilege.h"
#include "utils/source_line.h"

namespace TAVO::SSO {

namespace {

constexpr char kSourceName[] = "profile";

}  // namespace

SSOProfile::SSOProfile() {
    Json::Value file;
    if (!Utils::LoadJsonFileAsRoot(SOURCE_LINE, kProfileFile, file)) {
        return;
    }
    Utils::ReadMember(file, kProfileEnable, enable);
    Utils::ReadMember(file, kProfileName, profile);
    if (!enable) {
        return;
    }
    // Only the settings are kept: the client's own steps stay behind with the temporary.
    if (profile == kAzureProfile) {
        client = AzureSSOClient();
    } else if (profile == kWebSphereProfile) {
        client = WebSphereSSOClient();
    } else {
        syslog(LOG_ERR, "%s:%d Profile '%s' not support", SOURCE_LINE, profile.c_str());
    }
}

SSOProfile::~SSOProfile() = default;

bool SSOProfile::SSOIsEnable() { return enable; }
std::string SSOProfile::GetSSOProfile() { return profile; }
SSOClient *SSOProfile::GetSSOClient() { return &client; }

}  // namespace TAVO::SSO
