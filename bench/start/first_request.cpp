// A login's first request, as a CGI program serves it: sends the browser to the provider.
#include "sso/sso.h"

int main() {
    Json::Value state;
    state["origin"] = "/desktop";
    TAVO::SSO::AzureSSOClient().RedirectAuthEndpoint(state);
}
