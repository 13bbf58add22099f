// CalJsonObject: a JSON object that is being written; a small wrapper over the JSON library's.
// Owner: whoever builds a body.   Threads: one.   Errors: -1, logged. Texts are made valid UTF-8.
#pragma once

#include <json-glib/json-glib.h>

#include <string>
#include <vector>

#include "common/Handles.h"

class CalJsonObject {
public:
    // Makes the node and its object; needed before anything else.
    [[nodiscard]] int initialize();

    void addStringMember(const char* name, const std::string& text);
    void addIntegerMember(const char* name, int64_t value);
    void addBooleanMember(const char* name, bool value);
    void addNullMember(const char* name);
    void addObjectMember(const char* name, const CalJsonObject& object);
    void addArrayMember(const char* name, const std::vector<std::string>& texts);
    void addArrayMember(const char* name, const std::vector<CalJsonObject>& objects);
    void removeMember(const char* name);
    [[nodiscard]] bool hasMember(const char* name) const;

    [[nodiscard]] std::string getJsonString() const;
    // Ends with this.
    [[nodiscard]] JsonObject* object() const { return json_node_get_object(mpNode.get()); }

private:
    JsonNodePtr mpNode;
};
