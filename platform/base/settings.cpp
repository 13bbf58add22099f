#include "platform/settings.h"

#include <algorithm>
#include <filesystem>

#include "SettingsFile.h"
#include "platform/error.h"
#include "platform/root.h"

using platform::settings::Value;

namespace {

// Reads a key that must hold `type`.
int get(const char* key, vconf_type_e type, Value* value) {
    if (key == nullptr || !platform::settings::isValidKey(key)) return PLATFORM_ERROR_INVALID_PARAMETER;
    std::optional<Value> found = platform::settings::read(key);
    if (!found) return PLATFORM_ERROR_NOT_FOUND;
    if (found->type != type) return PLATFORM_ERROR_INVALID_PARAMETER;
    *value = std::move(*found);
    return PLATFORM_ERROR_NONE;
}

int set(const char* key, const Value& value) {
    if (key == nullptr || !platform::settings::isValidKey(key)) return PLATFORM_ERROR_INVALID_PARAMETER;
    return platform::settings::write(key, value);
}

}  // namespace

int vconf_get_int(const char* key, int* value) {
    Value found;
    if (value == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    if (const int code = get(key, VCONF_TYPE_INT, &found); code != PLATFORM_ERROR_NONE) return code;
    *value = found.number;
    return PLATFORM_ERROR_NONE;
}

int vconf_get_bool(const char* key, bool* value) {
    Value found;
    if (value == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    if (const int code = get(key, VCONF_TYPE_BOOL, &found); code != PLATFORM_ERROR_NONE) return code;
    *value = found.number != 0;
    return PLATFORM_ERROR_NONE;
}

int vconf_get_str(const char* key, std::string* value) {
    Value found;
    if (value == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    if (const int code = get(key, VCONF_TYPE_STRING, &found); code != PLATFORM_ERROR_NONE) return code;
    *value = std::move(found.text);
    return PLATFORM_ERROR_NONE;
}

vconf_type_e vconf_get_type(const char* key) {
    if (key == nullptr || !platform::settings::isValidKey(key)) return VCONF_TYPE_NONE;
    const std::optional<Value> found = platform::settings::read(key);
    return found ? found->type : VCONF_TYPE_NONE;
}

int vconf_set_int(const char* key, int value) {
    return set(key, {.type = VCONF_TYPE_INT, .number = value, .text = {}});
}

int vconf_set_bool(const char* key, bool value) {
    return set(key, {.type = VCONF_TYPE_BOOL, .number = value ? 1 : 0, .text = {}});
}

int vconf_set_str(const char* key, const char* value) {
    if (value == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    return set(key, {.type = VCONF_TYPE_STRING, .number = 0, .text = value});
}

int vconf_unset(const char* key) {
    if (key == nullptr || !platform::settings::isValidKey(key)) return PLATFORM_ERROR_INVALID_PARAMETER;
    return platform::settings::remove(key);
}

std::vector<std::string> vconf_list_keys(const char* prefix) {
    const std::string wanted = prefix != nullptr ? prefix : "";
    const std::string base = platform::rootedPath("/opt/usr/data/settings/");
    std::vector<std::string> keys;
    std::error_code error;
    for (std::filesystem::recursive_directory_iterator entry(base, error), end; !error && entry != end;
         entry.increment(error)) {
        const std::string key = entry->path().string().substr(base.size());
        if (key.starts_with(wanted) && platform::settings::isValidKey(key) &&
            vconf_get_type(key.c_str()) != VCONF_TYPE_NONE) {
            keys.push_back(key);
        }
    }
    std::sort(keys.begin(), keys.end());
    return keys;
}
