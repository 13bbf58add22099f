// keys.h: key storage: named secrets, readable by their owner alone (one file of mode 0600 a key).
// Names are [A-Za-z0-9._-]+, no leading dot. Values are never logged. Threads: any.
#pragma once

// On success *value is a heap copy, NUL-terminated, released with free().
// PLATFORM_ERROR_NOT_FOUND when there is none, PLATFORM_ERROR_PERMISSION_DENIED when the file is open to others
// or is not a plain file of this user.
[[nodiscard]] int key_storage_get(const char* name, char** value);

// Stores a value whole (old or new, never half); an empty value is PLATFORM_ERROR_INVALID_PARAMETER.
[[nodiscard]] int key_storage_set(const char* name, const char* value);
