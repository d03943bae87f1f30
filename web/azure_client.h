#ifndef TAVOSSO_WEB_AZURE_CLIENT_H
#define TAVOSSO_WEB_AZURE_CLIENT_H

#include <sso/sso.h>

namespace TAVO::Web {

/// Fetches the key set over HTTPS only. With other schemes, a discovery document could reach internal services.
class AzureClient : public TAVO::SSO::AzureSSOClient {
  public:
    /// Removes a "jwks_uri" that is not an https:// URL from the document, with one line at `LOG_ERR`.
    void RequestWellknownInfo(Json::Value &out) override;
};

}  // namespace TAVO::Web

#endif
