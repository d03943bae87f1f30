#ifndef TAVOSSO_DOCTOR_CHECKS_H
#define TAVOSSO_DOCTOR_CHECKS_H

#include <json/json.h>

#include <optional>
#include <string>

#include "doctor/client.h"
#include "doctor/report.h"
#include "doctor/settings_file.h"

// The groups of checks, in the order of a login.
namespace Doctor {

/// The profile file, read with the ids of this process. Returns nothing if no profile is configured.
std::optional<Profile> CheckProfile(Report &report, RunAs runAs);

/// Returns whether the client id cannot be the client secret. Azure AD's ids are GUIDs.
bool MayPrintClientID(Client &client);

/// Hides the client secret, and the id of an Azure client if it may be the secret.
void HideSecrets(Report &report, Client &client);

/// The file of the profile's client, key by key.
void CheckClientFile(Report &report, Client &client, const std::string &returnProgram, RunAs runAs);

/// The discovery document, certificates, the clock, the authorization endpoint, the key set, and the token endpoint,
/// which receives a test code with the client's id and secret.
void CheckProvider(Report &report, Client &client);

/// The front end on this machine: the host of the redirect URI, the return program, and the folders.
void CheckFrontEnd(Report &report, Client &client, const std::string &returnProgram, RunAs runAs);

/// How to make a domain known to the platform.
std::string RemedyForDomain(const std::string &domain);

/// The platform's sources of domain names. Converts a domain, or the name of a user, if there is one.
void CheckDirectory(Report &report, const std::optional<std::string> &domainOrUser, RunAs runAs);

/// Verifies an ID token with the library. Steps that need the provider's keys are not checked unless `mayFetch`.
/// Returns the id of the step at which the library stops, or an empty text.
std::string CheckToken(Report &report, Client &client, const std::string &token, bool mayFetch);

}  // namespace Doctor

#endif
