// SettingsFile: the value of one settings key in its file: "TYPE BOOT\nVALUE". BOOT is the boot id for memory keys and "-"
// for the others.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "platform/settings.h"

namespace platform::settings {

struct Value {
    vconf_type_e type = VCONF_TYPE_NONE;
    int number = 0;    // int and bool
    std::string text;  // str
};

// Whether `key` is well formed (see settings.h).
bool isValidKey(std::string_view key);
// Where the key's file lies, the root applied; its folder and its name in it.
std::string folderOf(const std::string& key);
std::string fileOf(const std::string& key);

// Nothing when the key is unset, of another boot, or damaged (logged).
std::optional<Value> read(const std::string& key);
// Old or new value, never half. A code of platform/error.h.
[[nodiscard]] int write(const std::string& key, const Value& value);
[[nodiscard]] int remove(const std::string& key);

}  // namespace platform::settings
