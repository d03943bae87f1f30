#ifndef TAVOSSO_UTILS_ROOT_PRIVILEGE_H
#define TAVOSSO_UTILS_ROOT_PRIVILEGE_H

#include <json/json.h>

namespace TAVO::Utils {

/// Loads a JSON file (LoadJsonFile) with root's effective ids, whatever ids the process has, and puts those back. An id
/// that cannot be changed is logged under LOG_AUTH in the name of the caller's source and line, and does not stop the
/// read; errno is left at 0 or 1.
bool LoadJsonFileAsRoot(const char *source, int line, const char *path, Json::Value &document);

}  // namespace TAVO::Utils

#endif
