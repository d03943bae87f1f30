#ifndef TAVOSSO_DOCTOR_ANSWER_H
#define TAVOSSO_DOCTOR_ANSWER_H

#include <string>

#include "doctor/watch.h"

namespace Doctor {

/// Describes an unexpected response: status, content type, error, title, redirect.
std::string DescribeAnswer(const Transfer &transfer, const std::string &content);

/// Returns whether the response is an error of the provider, which no setting of this machine causes.
bool IsProvidersError(const Transfer &transfer);

}  // namespace Doctor

#endif
