#include "contacts/CtXml.h"

#include <algorithm>

#include "common/Handles.h"

namespace {

constexpr int kMaxDepth = 16;

struct Escape {
    char character;
    std::string_view text;
};
// Line ends and tabs would become spaces in an attribute.
constexpr Escape kEscapes[] = {{'&', "&amp;"},  {'<', "&lt;"},  {'>', "&gt;"},   {'"', "&quot;"},
                               {'\'', "&#39;"}, {'\t', "&#9;"}, {'\n', "&#10;"}, {'\r', "&#13;"}};

bool isNameCharacter(char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '_' ||
           c == '-' || c == '.';
}

bool isName(std::string_view text) {
    const bool begins = !text.empty() && ((text[0] >= 'a' && text[0] <= 'z') ||
                                          (text[0] >= 'A' && text[0] <= 'Z') || text[0] == '_');
    return begins && std::all_of(text.begin(), text.end(), isNameCharacter);
}

// A name in one of the namespaces that an entry declares.
bool isQualifiedName(std::string_view member, bool isElement) {
    const size_t separator = member.find('$');
    if (separator == std::string_view::npos) return !isElement && isName(member);
    const std::string_view prefix = member.substr(0, separator);
    return (prefix == "gd" || prefix == "gContact") && isName(member.substr(separator + 1));
}

std::string scalarText(JsonNode* node) {
    if (json_node_get_value_type(node) == G_TYPE_STRING) return json_node_get_string(node);
    if (json_node_get_value_type(node) == G_TYPE_BOOLEAN)
        return json_node_get_boolean(node) != FALSE ? "true" : "false";
    if (json_node_get_value_type(node) == G_TYPE_INT64) return std::to_string(json_node_get_int(node));
    return std::to_string(json_node_get_double(node));
}

bool readObject(JsonObject* object, CtXmlElement* out, int depth);

bool readMember(const char* name, JsonNode* node, CtXmlElement* out, int depth) {
    const std::string_view member = name;
    if (JSON_NODE_HOLDS_NULL(node)) return true;
    if (JSON_NODE_HOLDS_VALUE(node)) {
        if (member == "$t") {
            out->text = scalarText(node);
            return true;
        }
        // Declarations of namespaces come with the entry's root.
        if (member.starts_with("xmlns")) return true;
        if (!isQualifiedName(member, /*isElement=*/false)) return false;
        out->attributes.emplace_back(ctXmlName(member), scalarText(node));
        return true;
    }
    if (!isQualifiedName(member, /*isElement=*/true)) return false;
    const auto addChild = [&](JsonNode* item) {
        CtXmlElement child{.name = ctXmlName(member)};
        if (!JSON_NODE_HOLDS_OBJECT(item) || !readObject(json_node_get_object(item), &child, depth + 1))
            return false;
        out->children.push_back(std::move(child));
        return true;
    };
    if (JSON_NODE_HOLDS_OBJECT(node)) return addChild(node);
    JsonArray* items = json_node_get_array(node);
    for (guint i = 0; i < json_array_get_length(items); ++i) {
        if (!addChild(json_array_get_element(items, i))) return false;
    }
    return true;
}

bool readObject(JsonObject* object, CtXmlElement* out, int depth) {
    if (depth > kMaxDepth) return false;
    JsonObjectIter iterator;
    const char* name = nullptr;
    JsonNode* node = nullptr;
    json_object_iter_init(&iterator, object);
    while (json_object_iter_next(&iterator, &name, &node) != FALSE) {
        if (!readMember(name, node, out, depth)) return false;
    }
    return true;
}

}  // namespace

std::string ctXmlText(std::string_view text) {
    const GChars valid(g_utf8_make_valid(text.data(), static_cast<gssize>(text.size())));
    const std::string_view input = valid.get();
    std::string carried;
    carried.reserve(input.size());
    for (size_t i = 0; i < input.size(); ++i) {
        const char c = input[i];
        const bool isSpace = c == '\t' || c == '\n' || c == '\r';
        if (static_cast<unsigned char>(c) < ' ' && !isSpace) continue;
        if (input.substr(i, 2) == "\xEF\xBF" && (input[i + 2] == '\xBE' || input[i + 2] == '\xBF')) {
            i += 2;  // U+FFFE and U+FFFF
        } else {
            carried += c;
        }
    }
    return carried;
}

std::string ctXmlEscape(std::string_view text) {
    std::string escaped;
    escaped.reserve(text.size());
    for (const char c : ctXmlText(text)) {
        const auto* const escape = std::find_if(std::begin(kEscapes), std::end(kEscapes),
                                                [c](const Escape& row) { return row.character == c; });
        if (escape != std::end(kEscapes)) {
            escaped += escape->text;
        } else {
            escaped += c;
        }
    }
    return escaped;
}

std::string ctXmlName(std::string_view member) {
    std::string name(member);
    std::replace(name.begin(), name.end(), '$', ':');
    return name;
}

CtXmlElement& CtXmlElement::child(const std::string& childName) {
    for (CtXmlElement& known : children) {
        if (known.name == childName) return known;
    }
    return children.emplace_back(CtXmlElement{.name = childName});
}

void CtXmlElement::write(std::string* out) const {
    *out += "<" + name;
    for (const auto& [attribute, value] : attributes)
        *out += " " + attribute + "=\"" + ctXmlEscape(value) + "\"";
    if (text.empty() && children.empty()) {
        *out += " />";
        return;
    }
    *out += ">" + ctXmlEscape(text);
    for (const CtXmlElement& element : children) element.write(out);
    *out += "</" + name + ">";
}

bool CtXmlElement::fromJson(std::string_view member, JsonObject* object, CtXmlElement* out) {
    const bool isContent = member == "content";
    if (object == nullptr || (!isContent && !isQualifiedName(member, /*isElement=*/true))) return false;
    CtXmlElement element{.name = isContent ? "atom:content" : ctXmlName(member)};
    if (!readObject(object, &element, 0)) return false;
    *out = std::move(element);
    return true;
}
