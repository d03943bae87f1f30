#ifndef TAVOSSO_UTILS_ROOT_PRIVILEGE_H
#define TAVOSSO_UTILS_ROOT_PRIVILEGE_H

#include <json/json.h>

namespace TAVO::Utils {

/// Loads a JSON file as LoadJsonFile does, with root's effective ids, and restores the ids. If an id cannot be changed,
/// logs it under LOG_AUTH with the caller's source and line, and reads the file anyway. errno is 0 or 1 afterwards.
bool LoadJsonFileAsRoot(const char *source, int line, const char *path, Json::Value &document);

}  // namespace TAVO::Utils

#endif
