#include "web/azure_client.h"

#include <syslog.h>

#include "web/text.h"

namespace TAVO::Web {

void AzureClient::RequestWellknownInfo(Json::Value &out) {
    AzureSSOClient::RequestWellknownInfo(out);
    if (out.isObject() && out.isMember("jwks_uri") && StringMember(out, "jwks_uri").rfind("https://", 0) != 0) {
        syslog(LOG_AUTH | LOG_ERR, "frontend: jwks_uri of the discovery document is not an https:// URL");
        out.removeMember("jwks_uri");
    }
}

}  // namespace TAVO::Web
