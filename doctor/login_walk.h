#ifndef TAVOSSO_DOCTOR_LOGIN_WALK_H
#define TAVOSSO_DOCTOR_LOGIN_WALK_H

#include "doctor/client.h"
#include "doctor/report.h"

namespace Doctor {

/// Walks through a login in the terminal. Returns false if no address was entered.
bool WalkLogin(Report &report, Client &client);

}  // namespace Doctor

#endif
