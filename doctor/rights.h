#ifndef TAVOSSO_DOCTOR_RIGHTS_H
#define TAVOSSO_DOCTOR_RIGHTS_H

#include <sys/stat.h>

#include <string>
#include <vector>

namespace Doctor {

/// "mode 0644, owner root".
std::string DescribeRights(const struct stat &status);

/// The folders from /usr/tavo down to a file in it.
std::vector<std::string> FoldersAbove(const std::string &path);

/// Returns the first folder above a file that this process may not enter, else the file.
std::string WhatRefuses(const std::string &path);

/// Returns whether only root can change a file or folder.
bool IsChangedByRootOnly(const struct stat &status);

}  // namespace Doctor

#endif
