#ifndef TAVOSSO_PLATFORM_CHECK_PROCESS_STATE_H
#define TAVOSSO_PLATFORM_CHECK_PROCESS_STATE_H

#include <map>
#include <string>

namespace PlatformCheck {

/// What a function must leave unchanged, by name. errno is not part of it.
using ProcessState = std::map<std::string, std::string>;

ProcessState CaptureProcessState();

/// Describes one difference. Returns an empty text if there is none.
std::string FirstDifference(const ProcessState &before, const ProcessState &after);

}  // namespace PlatformCheck

#endif
