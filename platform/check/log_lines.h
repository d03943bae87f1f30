#ifndef TAVOSSO_PLATFORM_CHECK_LOG_LINES_H
#define TAVOSSO_PLATFORM_CHECK_LOG_LINES_H

#include <string>
#include <vector>

namespace PlatformCheck {

/// Returns and removes the lines that this process has logged. They do not reach the system's log.
std::vector<std::string> TakeLogLines();

}  // namespace PlatformCheck

#endif
