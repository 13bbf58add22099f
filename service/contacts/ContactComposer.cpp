#include "contacts/ContactComposer.h"

#include <algorithm>
#include <cstdio>

#include "common/JsonAccess.h"
#include "common/JsonText.h"
#include "common/SyncLog.h"
#include "contacts/CtIdUtil.h"
#include "contacts/CtRecordRead.h"
#include "platform/contacts_read.h"

using contacts_read::forEachChild;
using contacts_read::intOf;
using contacts_read::textOf;

namespace {

std::string dateText(int date) {
    char text[32];
    std::snprintf(text, sizeof text, "%04d-%02d-%02d", date / 10000, date / 100 % 100, date % 100);
    return text;
}

std::string onWire(const CtTypeTable& types, const char* word) {
    return types.isFragment ? std::string(ct_wire::kKindNamespace) + "#" + word : word;
}

std::pair<std::string, std::string> typeOf(const CtSection& section, contacts_record_h child) {
    const CtTypeTable& types = *section.types;
    const int code = intOf(child, section.typeProperty);
    const std::string label = ctXmlText(textOf(child, section.labelProperty));
    // Of relations, 1 is a word and, with a label, a custom one.
    const bool isNamedByLabel = !label.empty() && (code == 0 || code == 1);
    if (const char* word = contact_types::wordOf(types.rows, code); word != nullptr && !isNamedByLabel)
        return {types.attribute, onWire(types, word)};
    if (!label.empty()) return {"label", label};
    if (!types.labels.empty()) {
        const char* word = contact_types::wordOf(types.labels, code);
        return {"label", word != nullptr ? word : types.labels.front().word};
    }
    return {types.attribute, onWire(types, kCtOtherWord)};
}

void addType(const CtSection& section, contacts_record_h child, CtXmlElement* element) {
    const std::pair<std::string, std::string> type = typeOf(section, child);
    if (section.typeComesLast && type.first != "label") {
        if (section.restRel != nullptr)
            element->attributes.emplace(element->attributes.begin(), "rel",
                                        onWire(*section.types, section.restRel));
        element->attributes.push_back(type);
    } else if (section.typeComesLast && section.restRel == nullptr) {
        element->attributes.push_back(type);
    } else {
        element->attributes.insert(element->attributes.begin(), type);
    }
}

// The records of a view that a section writes. The first birthday is one, a further one is an event like others.
std::vector<contacts_record_h> recordsOf(const CtSection& section, contacts_record_h contact) {
    std::vector<contacts_record_h> records;
    forEachChild(contact, section.children, [&](contacts_record_h child) {
        if (section.markProperty == 0 || intOf(child, section.markProperty) == section.mark)
            records.push_back(child);
    });
    if (!section.isList && records.size() > 1) records.resize(1);
    if (&section == &ct_mappings::kEvent) {
        for (const contacts_record_h birthday : recordsOf(ct_mappings::kBirthday, contact))
            std::erase(records, birthday);
    }
    return records;
}

// A membership whose group the device did not have when it took the contact: which one it is, nobody knows any more.
bool isOfUnknownGroup(const CtSection& section, contacts_record_h child) {
    return &section == &ct_mappings::kMembership && intOf(child, CONTACTS_GROUP_RELATION_GROUP_ID) == 0;
}

bool isSectionMember(const std::string& name) {
    return std::any_of(std::begin(ct_mappings::kReadOrder), std::end(ct_mappings::kReadOrder),
                       [&](const CtSection* section) { return name == section->member; });
}

void carryOver(JsonObject* origin, const std::string& member, CtXmlElement* entry) {
    JsonNode* node = json_access::member(origin, member.c_str());
    if (node == nullptr || JSON_NODE_HOLDS_VALUE(node) || JSON_NODE_HOLDS_NULL(node)) return;
    try {
        forEachElement(origin, member.c_str(), [&](JsonObject* object) {
            CtXmlElement element;
            if (CtXmlElement::fromJson(member, object, &element)) {
                entry->children.push_back(std::move(element));
            } else {
                SYNC_ERR_AS("carryOver", "the server's element %s cannot be written back", member.c_str());
            }
        });
    } catch (const JsonException& error) {
        SYNC_ERR("Handle this execption! (%s)", error.what());
    }
}

// What the server keeps of the contact and no field stands for.
void carryOverExtensions(JsonObject* origin, CtXmlElement* entry) {
    if (origin == nullptr) return;
    std::vector<std::string> names;
    for (const char* element : ct_mappings::kExtensionElements) {
        std::string member(element);
        std::replace(member.begin(), member.end(), ':', '$');
        names.push_back(std::move(member));
    }
    JsonObjectIter iterator;
    const char* name = nullptr;
    json_object_iter_init(&iterator, origin);
    while (json_object_iter_next(&iterator, &name, nullptr) != FALSE) {
        const std::string member = name;
        const bool isExtension =
            (member.starts_with("gd$") || member.starts_with("gContact$")) && member != "gd$deleted";
        if (isExtension && std::find(names.begin(), names.end(), member) == names.end())
            names.push_back(member);
    }
    for (const std::string& member : names) {
        if (!isSectionMember(member)) carryOver(origin, member, entry);
    }
}

}  // namespace

CtXmlElement makeAtomEntry(const char* term, const std::string& etag, bool withContactNamespace) {
    CtXmlElement entry{
        .name = "atom:entry",
        .attributes = {{"xmlns:atom", ct_wire::kAtomNamespace}, {"xmlns:gd", ct_wire::kKindNamespace}}};
    if (withContactNamespace) entry.attributes.emplace_back("xmlns:gContact", ct_wire::kContactNamespace);
    if (!etag.empty()) entry.attributes.emplace_back("gd:etag", etag);
    entry.children.push_back(
        {.name = "atom:category", .attributes = {{"scheme", ct_wire::kKindScheme}, {"term", term}}});
    return entry;
}

std::string ContactComposer::fieldValue(const CtField& field, contacts_record_h child) const {
    if (field.at == CtAt::kFlag) return intOf(child, field.property) != 0 ? "true" : "";
    if (field.at == CtAt::kDate || field.at == CtAt::kChildDate) {
        const int date = intOf(child, field.property);
        return date > 0 ? dateText(date) : "";
    }
    if (field.at == CtAt::kGroup) {
        const std::string uri = mUriOf(intOf(child, field.property));
        return uri.empty() ? uri : CtIdUtil::makeGroupBaseHref(mFeedBase, uri);
    }
    // What the wire cannot carry is no content.
    return ctXmlText(textOf(child, field.property));
}

void ContactComposer::composeField(const CtField& field, contacts_record_h child, Composed* out) const {
    const std::string value = fieldValue(field, child);
    if (value.empty()) return;
    // That a number is the preferred one does not make it a number.
    if (field.at != CtAt::kFlag) out->hasContent = true;
    if (field.at == CtAt::kText) {
        out->element.text = value;
    } else if (field.at == CtAt::kChildText) {
        out->element.child(ctXmlName(field.name)).text = value;
    } else if (field.at == CtAt::kChildAttribute || field.at == CtAt::kChildDate) {
        out->element.child(ctXmlName(field.name)).attributes.emplace_back(field.attribute, value);
    } else {
        out->element.attributes.emplace_back(field.name, value);
    }
}

ContactComposer::Composed ContactComposer::composeElement(const CtSection& section,
                                                          contacts_record_h child) const {
    const bool isNote = &section == &ct_mappings::kNote;
    Composed composed{.element = {.name = isNote ? "atom:content" : ctXmlName(section.member)}};
    for (const CtField& field : section.fields) composeField(field, child, &composed);
    // A field of the user's may be empty, but the wire wants its value.
    auto& attributes = composed.element.attributes;
    if (&section == &ct_mappings::kUserDefined && attributes.size() == 1 && attributes[0].first == "key")
        attributes.emplace_back("value", "");
    if (section.types != nullptr) addType(section, child, &composed.element);
    return composed;
}

std::vector<ContactComposer::Original> ContactComposer::readOriginals(const CtSection& section,
                                                                      JsonObject* origin) const {
    std::vector<Original> originals;
    if (origin == nullptr) return originals;
    try {
        forEachElement(origin, section.member, [&](JsonObject* object) {
            Original original;
            if (!CtXmlElement::fromJson(section.member, object, &original.verbatim)) return;
            if (const ContactsRecord child = mConverter.convertElement(section, object)) {
                original.isShown = true;
                original.composed = composeElement(section, child.get());
            }
            originals.push_back(std::move(original));
        });
    } catch (const JsonException& error) {
        SYNC_ERR("Handle this execption! (%s)", error.what());
    }
    return originals;
}

std::vector<CtXmlElement> ContactComposer::composeSection(const CtSection& section, contacts_record_h contact,
                                                          JsonObject* origin) const {
    std::vector<Original> originals = readOriginals(section, origin);
    std::vector<CtXmlElement> elements;
    int unknownGroups = 0;
    for (const contacts_record_h child : recordsOf(section, contact)) {
        Composed composed = composeElement(section, child);
        const auto same = std::find_if(originals.begin(), originals.end(), [&](const Original& original) {
            return original.isShown && !original.isUsed && original.composed.element == composed.element;
        });
        if (same != originals.end()) {
            same->isUsed = true;
            elements.push_back(std::move(same->verbatim));
        } else if (composed.hasContent) {
            elements.push_back(std::move(composed.element));
        } else if (isOfUnknownGroup(section, child)) {
            ++unknownGroups;  // the group came later: it is one of those that no record stands for
        }
    }
    for (Original& original : originals) {
        const bool isKept = !original.isShown || (!original.isUsed && unknownGroups-- > 0);
        if (isKept) elements.push_back(std::move(original.verbatim));
    }
    return elements;
}

std::string ContactComposer::compose(contacts_record_h contact, const std::string& etag,
                                     const std::string& originText) const {
    const JsonNodePtr root = json_text::parse(originText.empty() ? ct_record::originOf(contact) : originText);
    JsonObject* origin = json_access::objectIn(root.get());
    CtXmlElement entry = makeAtomEntry(ct_wire::kContactTerm, etag, /*withContactNamespace=*/true);
    const std::string id = json_access::textOr(json_access::object(origin, "id"), "$t", "");
    for (const CtSection* section : ct_mappings::kWriteOrder) {
        // A new entry is in the groups that the device knows: of others nobody can say that they are still there.
        const bool isFresh = etag.empty() && section == &ct_mappings::kMembership;
        for (CtXmlElement& element : composeSection(*section, contact, isFresh ? nullptr : origin))
            entry.children.push_back(std::move(element));
        if (section == &ct_mappings::kUserDefined) carryOverExtensions(origin, &entry);
    }
    // A new entry gets an id of its own.
    if (!id.empty() && !etag.empty()) entry.children.push_back({.name = "id", .text = id});
    std::string text;
    entry.write(&text);
    return text;
}

std::string ContactComposer::composeFields(contacts_record_h contact) const {
    std::vector<std::string> fields;
    for (const CtSection* section : ct_mappings::kWriteOrder) {
        for (const CtXmlElement& element : composeSection(*section, contact, nullptr)) {
            fields.emplace_back();
            element.write(&fields.back());
        }
    }
    // Servers are free to list what may be there several times in an order of their own.
    std::sort(fields.begin(), fields.end());
    std::string text;
    for (const std::string& field : fields) text += field;
    return text;
}

std::string ContactComposer::composeFields(JsonObject* entry) const {
    try {
        ContactsRecord record;
        if (mConverter.convert(entry, {}, &record, 0, /*withPhoto=*/false) == 0)
            return composeFields(record.get());
    } catch (const JsonException& error) {
        SYNC_DBG("Handle this execption! (%s)", error.what());
    }
    return {};
}
