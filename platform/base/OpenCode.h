// The platform's code for a store that db_util_open did not open.
#pragma once

#include <sqlite3.h>
#include <unistd.h>

#include <cerrno>
#include <string>

#include "platform/database.h"
#include "platform/error.h"

namespace platform {

inline int codeOfOpen(int databaseCode, const std::string& path) {
    if (databaseCode == SQLITE_OK) return PLATFORM_ERROR_NONE;
    if (databaseCode == kDatabaseIsNewer) return PLATFORM_ERROR_NEWER;
    const bool isRefused =
        databaseCode == SQLITE_CANTOPEN && access(path.c_str(), R_OK) != 0 && errno == EACCES;
    return isRefused ? PLATFORM_ERROR_PERMISSION_DENIED : PLATFORM_ERROR_DATABASE;
}

}  // namespace platform
