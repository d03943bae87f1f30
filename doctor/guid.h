#ifndef TAVOSSO_DOCTOR_GUID_H
#define TAVOSSO_DOCTOR_GUID_H

#include <string>

// The identifiers of Azure AD: 32 hexadecimal digits in the form 8-4-4-4-12.
namespace Doctor {

bool IsGUID(const std::string &text);

/// Returns the first GUID in a text; empty if there is none.
std::string FindGUID(const std::string &text);

}  // namespace Doctor

#endif
