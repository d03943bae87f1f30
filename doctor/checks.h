#ifndef TAVOSSO_DOCTOR_CHECKS_H
#define TAVOSSO_DOCTOR_CHECKS_H

#include <json/json.h>

#include <optional>
#include <string>

#include "doctor/client.h"
#include "doctor/report.h"

// The groups of checks, in the order in which one makes sense after the other.
namespace Doctor {

/// The profile file, as a login of a program with the ids of this process finds it. Nothing where no profile is in
/// force.
std::optional<Profile> CheckProfile(Report &report);

/// The file of the profile's client, key by key.
void CheckClientFile(Report &report, Client &client, const std::string &returnProgram);

/// The discovery document, the certificate of its server, the clock, the authorization endpoint, the key set, and the
/// token endpoint. The latter is asked to exchange a code that was made up, which tells whether it takes the client's
/// id and secret.
void CheckProvider(Report &report, Client &client);

/// What the platform converts domains by; of one domain, or that of a user, if one is told, which source answers.
void CheckDirectory(Report &report, const std::optional<std::string> &domainOrUser);

/// Has the library verify an ID token and find the user's name in it, and reports its steps. Those that need the
/// provider's keys are left out unless it may fetch them. Returns the id of the step at which the library stops, empty
/// if at none.
std::string CheckToken(Report &report, Client &client, const std::string &token, bool mayFetch);

}  // namespace Doctor

#endif
