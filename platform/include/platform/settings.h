// settings.h: the device's settings store: named int, bool and string values shared by all processes.
// Keys are paths of [A-Za-z0-9._-] components separated by "/": "db/..." and "file/..." persist across
// restarts, "memory/..." lives until the machine restarts. Any other first component, an empty component,
// "." and ".." are PLATFORM_ERROR_INVALID_PARAMETER.
// Storage: one file a key under the root, replaced whole, so a reader sees the old value or the new one.
// Threads: reads and writes from any; watches are added, removed and delivered on the main thread.
#pragma once

#include <string>
#include <vector>

enum vconf_type_e { VCONF_TYPE_NONE = 0, VCONF_TYPE_STRING = 40, VCONF_TYPE_INT = 41, VCONF_TYPE_BOOL = 42 };

// A key with its value, as handed to a watch. Valid during the callback only.
struct keynode_s;
using keynode_t = keynode_s;

using vconf_callback_fn = void (*)(keynode_t* node, void* user_data);

// Reads: PLATFORM_ERROR_NOT_FOUND for an unset key, PLATFORM_ERROR_INVALID_PARAMETER for a value of another type.
[[nodiscard]] int vconf_get_int(const char* key, int* value);
[[nodiscard]] int vconf_get_bool(const char* key, bool* value);
[[nodiscard]] int vconf_get_str(const char* key, std::string* value);
// The type that the key holds, VCONF_TYPE_NONE when unset.
vconf_type_e vconf_get_type(const char* key);

// Writes: the value is on disk ("db/", "file/") when the call returns.
[[nodiscard]] int vconf_set_int(const char* key, int value);
[[nodiscard]] int vconf_set_bool(const char* key, bool value);
[[nodiscard]] int vconf_set_str(const char* key, const char* value);
// Removes a key; one that is not set is success.
int vconf_unset(const char* key);

// All set keys that begin with `prefix`, sorted.
std::vector<std::string> vconf_list_keys(const char* prefix);

// Watches tell of every write of the key, in every process, the writer's own included. Delivered by the
// default main context, never from inside the writing call; writes that fall together may be told once.
// The same (key, callback) pair may be watched once.
[[nodiscard]] int vconf_notify_key_changed(const char* key, vconf_callback_fn callback, void* user_data);
int vconf_ignore_key_changed(const char* key, vconf_callback_fn callback);

const char* vconf_keynode_get_name(const keynode_t* node);
vconf_type_e vconf_keynode_get_type(const keynode_t* node);
// 0 when the key was unset or has another type.
int vconf_keynode_get_int(const keynode_t* node);
