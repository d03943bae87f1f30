#ifndef TAVOSSO_DOCTOR_AZURE_CHECKS_H
#define TAVOSSO_DOCTOR_AZURE_CHECKS_H

#include <string>

#include "doctor/client.h"
#include "doctor/report.h"

// Settings that must agree with each other at Azure AD.
namespace Doctor {

/// The tenants and the versions in the addresses of the client's file.
void CheckAzureAddresses(Report &report, Client &client);

/// Returns the tenant of the first address that contains one, or an empty text.
std::string TenantOfAddresses(Client &client);

/// Returns whether the addresses are of the configured tenant and of one version.
bool DoAddressesAgree(Client &client);

/// The configured tenant, compared with the one in the issuer of the discovery document. `issuer` may be empty.
void CheckTenantOfIssuer(Report &report, Client &client, const std::string &issuer);

}  // namespace Doctor

#endif
