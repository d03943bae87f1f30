// logout.cgi: ends the session here and, for Azure, at the provider.
#include <tavosso/sso.h>

#include <cstdlib>
#include <iostream>
#include <string>

int main() {
    const char *method = std::getenv("REQUEST_METHOD");
    if (method == nullptr || std::string(method) != "POST") {
        std::cout << "Status: 405 Method Not Allowed\nAllow: POST\n\n";
        return 0;
    }
    // End your session here, and expire its cookie.
    TAVO::SSO::SSOProfile profile;
    const std::string returnAddress = profile.GetSSOClient()->GetRedirectURI();
    const std::string site = returnAddress.substr(0, returnAddress.find('/', returnAddress.find("://") + 3));
    std::string next = "/index.cgi";
    if (profile.GetSSOProfile() == "azure" && !profile.GetSSOClient()->GetLogoutEndpoint().empty() && !site.empty()) {
        next = TAVO::SSO::GetAzureSSOLogoutURL(site + "/index.cgi");
    }
    // Not "Location": browsers compare a redirect that follows a form with the page's form-action.
    std::cout << "Cache-Control: no-store\nRefresh: 0; url=" << next << "\nContent-Type: text/plain\n\nSigning out\n";
}
