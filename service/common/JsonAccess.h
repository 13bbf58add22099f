// JsonAccess: typed reads of JSON from outside: a member that is missing or of another type is absent, never a crash.
#pragma once

#include <json-glib/json-glib.h>

#include <climits>
#include <cstdint>
#include <optional>
#include <string>

namespace json_access {

inline JsonNode* member(JsonObject* object, const char* name) {
    return object != nullptr ? json_object_get_member(object, name) : nullptr;
}

inline JsonObject* objectIn(JsonNode* node) {
    return node != nullptr && JSON_NODE_HOLDS_OBJECT(node) ? json_node_get_object(node) : nullptr;
}

inline JsonObject* object(JsonObject* parent, const char* name) {
    return objectIn(member(parent, name));
}

inline JsonArray* array(JsonObject* parent, const char* name) {
    JsonNode* node = member(parent, name);
    return node != nullptr && JSON_NODE_HOLDS_ARRAY(node) ? json_node_get_array(node) : nullptr;
}

inline bool holds(JsonNode* node, GType type) {
    return node != nullptr && JSON_NODE_HOLDS_VALUE(node) && json_node_get_value_type(node) == type;
}

inline std::optional<std::string> textIn(JsonNode* node) {
    if (!holds(node, G_TYPE_STRING)) return std::nullopt;
    return std::string(json_node_get_string(node));
}

inline std::optional<std::string> text(JsonObject* parent, const char* name) {
    return textIn(member(parent, name));
}

inline std::string textOr(JsonObject* parent, const char* name, const char* fallback) {
    return text(parent, name).value_or(fallback);
}

inline std::optional<int64_t> integer(JsonObject* parent, const char* name) {
    JsonNode* node = member(parent, name);
    if (!holds(node, G_TYPE_INT64)) return std::nullopt;
    return json_node_get_int(node);
}

// Absent as well when an int cannot hold it.
inline std::optional<int> number(JsonObject* parent, const char* name) {
    const std::optional<int64_t> value = integer(parent, name);
    if (!value || *value < INT_MIN || *value > INT_MAX) return std::nullopt;
    return static_cast<int>(*value);
}

// Only `true` is true.
inline bool isTrue(JsonObject* parent, const char* name) {
    JsonNode* node = member(parent, name);
    return holds(node, G_TYPE_BOOLEAN) && json_node_get_boolean(node) != FALSE;
}

}  // namespace json_access
