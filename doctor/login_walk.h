#ifndef TAVOSSO_DOCTOR_LOGIN_WALK_H
#define TAVOSSO_DOCTOR_LOGIN_WALK_H

#include "doctor/client.h"
#include "doctor/report.h"

namespace Doctor {

/// Walks a login from the terminal: gives the address to open, takes the one that the browser was sent back to, from
/// standard input, and goes on with the library's own steps. False where no address was given.
bool WalkLogin(Report &report, Client &client);

}  // namespace Doctor

#endif
