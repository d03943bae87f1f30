// guide_logout.cpp: ends the session here and, for Azure, at the provider.
#include "guide_request.h"

int main() {
    if (Variable("REQUEST_METHOD") != "POST") {
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
    // Not "Location": browsers hold a redirect that follows a form against the page's form-action.
    std::cout << "Cache-Control: no-store\nRefresh: 0; url=" << next << "\nContent-Type: text/plain\n\nSigning out\n";
}
