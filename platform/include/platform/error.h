// error.h: the result codes of every platform function. 0 is success, negatives are failures.
// Outputs are untouched on failure unless a function says otherwise.
#pragma once

enum platform_error_e {
    PLATFORM_ERROR_NONE = 0,
    PLATFORM_ERROR_FAILED = -1,              // anything without a code of its own; the log names it
    PLATFORM_ERROR_NOT_FOUND = -2,           // no such record, key, account or alarm
    PLATFORM_ERROR_IO = -5,                  // a file or socket could not be read or written
    PLATFORM_ERROR_PERMISSION_DENIED = -13,  // refused by mode, owner or peer credentials
    PLATFORM_ERROR_INVALID_PARAMETER = -22,  // NULL, unknown property, wrong type, malformed name
    PLATFORM_ERROR_NO_SPACE = -28,           // the file system is full; nothing was written
    PLATFORM_ERROR_DATABASE = -71,           // SQLite refused: not a database, read-only, locked too long
    PLATFORM_ERROR_NEWER = -75,              // the store was written by a newer version and is left alone
    PLATFORM_ERROR_CONFLICT = -85,           // a single write whose expected version did not match
    PLATFORM_ERROR_TIMED_OUT = -110,         // no answer within the limit
};
