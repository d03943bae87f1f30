#include "doctor/rights.h"

#include <fcntl.h>
#include <pwd.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <filesystem>

namespace Doctor {

namespace {

std::string NameOfUser(uid_t id) {
    const passwd *user = getpwuid(id);
    return user != nullptr ? user->pw_name : std::to_string(id);
}

}  // namespace

std::string DescribeRights(const struct stat &status) {
    char mode[8];
    std::snprintf(mode, sizeof mode, "%04o", static_cast<unsigned int>(status.st_mode & 07777));
    return std::string("mode ") + mode + ", owner " + NameOfUser(status.st_uid);
}

std::vector<std::string> FoldersAbove(const std::string &path) {
    std::vector<std::string> folders;
    for (std::filesystem::path folder = std::filesystem::path(path).parent_path();
         folder.has_relative_path() && folder != "/usr"; folder = folder.parent_path()) {
        folders.push_back(folder);
    }
    std::reverse(folders.begin(), folders.end());
    return folders;
}

std::string WhatRefuses(const std::string &path) {
    for (const std::string &folder : FoldersAbove(path)) {
        if (faccessat(AT_FDCWD, folder.c_str(), X_OK, AT_EACCESS) != 0) {
            return folder;
        }
    }
    return path;
}

bool IsChangedByRootOnly(const struct stat &status) {
    return status.st_uid == 0 && (status.st_mode & (S_IWGRP | S_IWOTH)) == 0;
}

}  // namespace Doctor
