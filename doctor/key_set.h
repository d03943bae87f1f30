#ifndef TAVOSSO_DOCTOR_KEY_SET_H
#define TAVOSSO_DOCTOR_KEY_SET_H

#include <json/json.h>

#include <string>

#include "doctor/report.h"

// The provider's published keys (RFC 7517), as far as the library can use them.
namespace Doctor {

void CheckKeySet(Report &report, const Json::Value &keySet);

/// What is wrong with a key for the library; empty if nothing is.
std::string FaultOf(const Json::Value &key);

/// The size of an RSA key's modulus in bits, 0 where that is not base64url.
int SizeOf(const Json::Value &key);

}  // namespace Doctor

#endif
