#ifndef TAVOSSO_DOCTOR_KEY_SET_H
#define TAVOSSO_DOCTOR_KEY_SET_H

#include <json/json.h>

#include <string>

#include "doctor/report.h"

// The provider's published keys (RFC 7517), as far as the library can use them.
namespace Doctor {

void CheckKeySet(Report &report, const Json::Value &keySet);

}  // namespace Doctor

#endif
