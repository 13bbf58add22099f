// The platform's code for a failed system call.
#pragma once

#include <cerrno>

#include "platform/error.h"

namespace platform {

inline int codeOfErrno(int error) {
    switch (error) {
        case ENOENT:
        case ENOTDIR:
            return PLATFORM_ERROR_NOT_FOUND;
        case EACCES:
        case EPERM:
        case EROFS:
        case ELOOP:
            return PLATFORM_ERROR_PERMISSION_DENIED;
        case ENOSPC:
        case EDQUOT:
            return PLATFORM_ERROR_NO_SPACE;
        default:
            return PLATFORM_ERROR_IO;
    }
}

}  // namespace platform
