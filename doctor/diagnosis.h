#ifndef TAVOSSO_DOCTOR_DIAGNOSIS_H
#define TAVOSSO_DOCTOR_DIAGNOSIS_H

#include <string>

#include "doctor/watch.h"

namespace Doctor {

struct Diagnosis {
    std::string cause;
    std::string remedy;
};

/// Explains a transfer without a response. `key` is the setting with the address.
Diagnosis Diagnose(const Transfer &transfer, const std::string &key);

}  // namespace Doctor

#endif
