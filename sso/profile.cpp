#include <syslog.h>

#include <utility>

#include "sso/names.h"
#include "sso/sso.h"
#include "sso/supported_profiles.h"
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
    if (!IsSupported(profile)) {
        syslog(LOG_ERR, "%s:%d Profile '%s' not support", SOURCE_LINE, profile.c_str());
        return;
    }
    // Slicing is intended: it keeps only the settings.
    WithClient(profile, [this](SSOClient &chosen) { client = std::move(chosen); });
}

SSOProfile::~SSOProfile() = default;

bool SSOProfile::SSOIsEnable() { return enable; }
std::string SSOProfile::GetSSOProfile() { return profile; }
SSOClient *SSOProfile::GetSSOClient() { return &client; }

}  // namespace TAVO::SSO
