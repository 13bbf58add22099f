// CtXml: an XML element to be written, from the device's fields or from the JSON that the server gave for it.
// Threads: one at a time.
#pragma once

#include <json-glib/json-glib.h>

#include <string>
#include <string_view>
#include <utility>
#include <vector>

// The part of a text that XML 1.0 can carry, as valid UTF-8.
std::string ctXmlText(std::string_view text);
// Such text, escaped.
std::string ctXmlEscape(std::string_view text);

struct CtXmlElement {
    std::string name;
    std::vector<std::pair<std::string, std::string>> attributes = {};
    std::string text = {};
    std::vector<CtXmlElement> children = {};

    bool operator==(const CtXmlElement&) const = default;

    // The child of this name, made when there is none.
    CtXmlElement& child(const std::string& childName);
    void write(std::string* out) const;

    // A member of the feed's JSON as the element it was made from; false when a name in it cannot be written.
    static bool fromJson(std::string_view member, JsonObject* object, CtXmlElement* out);
};

// "gd$email" as "gd:email".
std::string ctXmlName(std::string_view member);
