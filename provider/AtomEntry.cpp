#include "AtomEntry.h"

#include <algorithm>
#include <cctype>
#include <charconv>
#include <cstdint>
#include <pugixml.hpp>

#include "FeedNames.h"

namespace provider {

namespace {

constexpr int kMaxXmlDepth = 16;

[[noreturn]] void malformed(const std::string& why) {
    throw ApiError{400, "parseError", "Invalid entry: " + why, ""};
}

struct Namespace {
    const char* uri;
    const char* member;  // what a member of it begins with
};
constexpr Namespace kNamespaces[] = {
    {kAtomNamespace, ""}, {kKindNamespace, "gd$"}, {kContactNamespace, "gContact$"}};

// An element's or attribute's name; `uri` is empty without a namespace.
struct Name {
    std::string uri;
    std::string local;

    [[nodiscard]] bool isAtom(std::string_view wanted) const {
        return uri == kAtomNamespace && local == wanted;
    }
    [[nodiscard]] std::string member() const {
        const auto* row = std::find_if(std::begin(kNamespaces), std::end(kNamespaces),
                                       [this](const Namespace& known) { return uri == known.uri; });
        if (row == std::end(kNamespaces)) malformed("'" + local + "' is in no known namespace");
        return row->member + local;
    }
};

std::string declared(pugi::xml_node node, const std::string& prefix) {
    const std::string attribute = prefix.empty() ? "xmlns" : "xmlns:" + prefix;
    for (; node; node = node.parent()) {
        if (const pugi::xml_attribute found = node.attribute(attribute.c_str())) return found.value();
    }
    if (!prefix.empty()) malformed("the prefix '" + prefix + "' is not declared");
    return "";
}

Name nameOf(pugi::xml_node node, const std::string& qualified) {
    const std::size_t colon = qualified.find(':');
    if (colon == std::string::npos) return {declared(node, ""), qualified};
    return {declared(node, qualified.substr(0, colon)), qualified.substr(colon + 1)};
}

std::string attributeMember(pugi::xml_node node, const std::string& qualified) {
    if (qualified.find(':') == std::string::npos) return qualified;
    if (qualified.starts_with("xml:")) return "xml$" + qualified.substr(4);
    return nameOf(node, qualified).member();
}

bool isBlank(const std::string& text) {
    return std::all_of(text.begin(), text.end(), [](unsigned char c) { return std::isspace(c) != 0; });
}

void addMember(Json& to, const std::string& member, Json value) {
    if (isListMember(member)) {
        if (!to.contains(member)) to[member] = Json::array();
        to[member].push_back(std::move(value));
    } else if (to.contains(member)) {
        malformed("'" + member + "' is there twice");
    } else {
        to[member] = std::move(value);
    }
}

Json elementJson(pugi::xml_node node, int depth) {
    if (depth > kMaxXmlDepth) malformed("nested too deeply");
    Json out = Json::object();
    for (const pugi::xml_attribute attribute : node.attributes()) {
        const std::string name = attribute.name();
        if (name == "xmlns" || name.starts_with("xmlns:")) continue;
        addMember(out, attributeMember(node, name), attribute.value());
    }
    std::string text;
    for (const pugi::xml_node child : node.children()) {
        if (child.type() == pugi::node_pcdata || child.type() == pugi::node_cdata) text += child.value();
        if (child.type() == pugi::node_element)
            addMember(out, nameOf(child, child.name()).member(), elementJson(child, depth + 1));
    }
    const bool hasChildren =
        node.find_child([](pugi::xml_node child) { return child.type() == pugi::node_element; });
    if (hasChildren ? !isBlank(text) : !text.empty() || out.empty()) out["$t"] = text;
    return out;
}

// Whether XML has a character of this code.
bool isCharacter(std::uint32_t code) {
    return code == '\t' || code == '\n' || code == '\r' || (code >= 0x20 && code <= 0xD7FF) ||
           (code >= 0xE000 && code <= 0xFFFD) || (code >= 0x10000 && code <= 0x10FFFF);
}

// Whether an ampersand begins a reference that every reader knows.
bool isReference(std::string_view rest) {
    const std::string_view name = rest.substr(0, std::min(rest.find(';'), rest.size()));
    if (name.size() == rest.size()) return false;
    for (const std::string_view known : {"amp", "lt", "gt", "quot", "apos"}) {
        if (name == known) return true;
    }
    if (name.size() < 2 || name[0] != '#') return false;
    const bool isHex = name[1] == 'x';
    const std::string_view digits = name.substr(isHex ? 2 : 1);
    std::uint32_t code = 0;
    const auto [end, error] =
        std::from_chars(digits.data(), digits.data() + digits.size(), code, isHex ? 16 : 10);
    return error == std::errc() && end == digits.data() + digits.size() && isCharacter(code);
}

// What the parser lets pass although it is not well formed.
void checkCharacters(const std::string& body) {
    constexpr std::string_view kCdata = "<![CDATA[";
    constexpr std::string_view kComment = "<!--";
    const std::string_view text = body;
    for (std::size_t i = 0; i < text.size(); ++i) {
        const auto byte = static_cast<unsigned char>(text[i]);
        if (byte < 0x20 && byte != '\t' && byte != '\n' && byte != '\r') malformed("a control character");
        if (text.substr(i).starts_with(kCdata)) i = std::min(text.find("]]>", i), text.size() - 1);
        if (text.substr(i).starts_with(kComment)) i = std::min(text.find("-->", i), text.size() - 1);
        if (text[i] == '&' && !isReference(text.substr(i + 1))) malformed("'&' that begins no reference");
    }
    try {
        (void)Json(body).dump();
    } catch (const Json::exception&) {
        malformed("not UTF-8");
    }
}

pugi::xml_node rootOf(const pugi::xml_document& document) {
    pugi::xml_node root;
    for (const pugi::xml_node child : document.children()) {
        if (child.type() == pugi::node_doctype) malformed("it has a document type");
        if (child.type() == pugi::node_pcdata || child.type() == pugi::node_cdata) {
            if (!isBlank(child.value())) malformed("there is text outside the root");
        }
        if (child.type() != pugi::node_element) continue;
        if (root) malformed("there is more than one root");
        root = child;
    }
    if (!root || !nameOf(root, root.name()).isAtom("entry")) malformed("the root is no Atom entry");
    for (const pugi::xml_attribute attribute : root.attributes()) {
        const std::string name = attribute.name();
        if (!name.starts_with("xmlns")) attributeMember(root, name);
    }
    return root;
}

bool isOfKind(pugi::xml_node category, FeedKind kind) {
    return std::string_view(category.attribute("scheme").value()) == kKindScheme &&
           std::string_view(category.attribute("term").value()) ==
               (kind == FeedKind::kContact ? kContactTerm : kGroupTerm);
}

}  // namespace

Json atomBody(const Call& call, FeedKind kind) {
    requireBody(call, "application/atom+xml");
    checkCharacters(call.body);
    pugi::xml_document document;
    const pugi::xml_parse_result result = document.load_buffer(
        call.body.data(), call.body.size(),
        pugi::parse_default | pugi::parse_doctype | pugi::parse_fragment | pugi::parse_ws_pcdata_single,
        pugi::encoding_utf8);
    if (!result) malformed(std::string(result.description()) + " at byte " + std::to_string(result.offset));
    Json fields = Json::object();
    bool isKnown = false;
    for (const pugi::xml_node node : rootOf(document).children()) {
        if (node.type() != pugi::node_element) continue;
        const Name name = nameOf(node, node.name());
        if (name.isAtom("category")) {
            isKnown = isKnown || isOfKind(node, kind);
        } else if (name.isAtom("link") || (name.uri.empty() && name.local == "id")) {
            continue;  // the provider's own
        } else {
            addMember(fields, name.member(), elementJson(node, 0));
        }
    }
    if (!isKnown)
        malformed(std::string("the category of a ") + (kind == FeedKind::kContact ? "contact" : "group") +
                  " is missing");
    return fields;
}

}  // namespace provider
