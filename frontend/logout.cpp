// Ends the session on this device and, if the provider has a logout page, at the provider.
#include <sso/sso.h>
#include <sso/supported_profiles.h>

#include "frontend/cgi_program.h"
#include "frontend/environment.h"
#include "frontend/page.h"
#include "frontend/session.h"
#include "web/text.h"

namespace Web = TAVO::Web;

namespace {

// The start page's URL, from the configured redirect URI: the client chooses the Host header.
std::string StartPageAddress(const std::string &redirectURI) {
    const std::size_t authority = redirectURI.find("://");
    if (authority == std::string::npos) {
        return "";
    }
    return redirectURI.substr(0, redirectURI.find('/', authority + 3)) + "/index.cgi";
}

std::string ProviderLogout(const Frontend::Session &session) {
    TAVO::SSO::AzureSSOClient client;
    if (session.profile != TAVO::SSO::kAzureProfile || client.GetLogoutEndpoint().empty()) {
        return "";
    }
    return TAVO::SSO::GetAzureSSOLogoutURL(StartPageAddress(client.GetRedirectURI()));
}

void LeaveForProvider(Web::Response &response, const std::string &address) {
    // Not a redirect: browsers apply "form-action 'self'" to the redirects after a form.
    response.AddHeader("Refresh", "0; url=" + address);
    const Frontend::Messages messages(Frontend::Variable("HTTP_ACCEPT_LANGUAGE"));
    Frontend::ShowPage(response, "200 OK", messages, "sign_out.title",
                       "<p>" + messages["sign_out.done"] + "</p>\n<p><a href=\"" + Web::EscapeHtml(address) + "\">" +
                           messages["sign_out.provider"] + "</a></p>\n");
}

// Browsers send one of these headers with a form. Other sites cannot forge them.
bool ComesFromThisSite() {
    const std::string origin = Frontend::Variable("HTTP_ORIGIN");
    return Frontend::Variable("HTTP_SEC_FETCH_SITE") == "same-origin" ||
           (!origin.empty() && origin == "https://" + Frontend::Variable("HTTP_HOST"));
}

void RefuseForeignRequest(Web::Response &response) {
    const Frontend::Messages messages(Frontend::Variable("HTTP_ACCEPT_LANGUAGE"));
    Frontend::ShowPage(response, "403 Forbidden", messages, "signed_in.sign_out",
                       "<p>" + messages["sign_out.refused"] + "</p>\n<p><a href=\"/index.cgi\">" +
                           messages["method.start_page"] + "</a></p>\n");
}

void SignOut(Web::Response &response) {
    if (!ComesFromThisSite()) {
        RefuseForeignRequest(response);
        return;
    }
    const auto session = Frontend::EndSession(response, Frontend::Variable("HTTP_COOKIE"));
    const std::string address = session ? ProviderLogout(*session) : "";
    if (address.empty()) {
        response.Redirect("/index.cgi");
    } else {
        LeaveForProvider(response, address);
    }
}

}  // namespace

int main() { return Frontend::Serve("POST", SignOut); }
