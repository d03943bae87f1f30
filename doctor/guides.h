#ifndef TAVOSSO_DOCTOR_GUIDES_H
#define TAVOSSO_DOCTOR_GUIDES_H

namespace Doctor {

/// docs/operations.md and docs/integration.md, as they were when the program was built.
extern const char kOperationsGuide[];
extern const char kIntegrationGuide[];

}  // namespace Doctor

#endif
