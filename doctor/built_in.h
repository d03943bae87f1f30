#ifndef TAVOSSO_DOCTOR_BUILT_IN_H
#define TAVOSSO_DOCTOR_BUILT_IN_H

// What the program takes from the tree that it was built from.
namespace Doctor {

extern const char kVersion[];

/// docs/operations.md and docs/integration.md, as they were then.
extern const char kOperationsGuide[];
extern const char kIntegrationGuide[];

}  // namespace Doctor

#endif
