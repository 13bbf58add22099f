#include "contacts/CtJsonEntryConverter.h"

#include <cstring>
#include <ctime>

#include "common/JsonAccess.h"
#include "common/JsonText.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "contacts/CtIdUtil.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace {

constexpr const char* kRefused = "the contacts service refuses a value";

void setText(contacts_record_h record, unsigned property, const std::string& value) {
    if (contacts_record_set_str(record, property, value.c_str()) != PLATFORM_ERROR_NONE)
        throw JsonException(kRefused);
}

void setNumber(contacts_record_h record, unsigned property, int value) {
    if (contacts_record_set_int(record, property, value) != PLATFORM_ERROR_NONE)
        throw JsonException(kRefused);
}

ContactsRecord create(const char* view) {
    contacts_record_h raw = nullptr;
    if (contacts_record_create(view, &raw) != PLATFORM_ERROR_NONE) throw JsonException("create fail");
    return ContactsRecord(raw);
}

// The fragment of a rel, or the plain word.
int codeOf(const CtTypeTable& types, const std::string& value) {
    const size_t hash = types.isFragment ? value.rfind('#') : std::string::npos;
    const std::string word = hash == std::string::npos ? value : value.substr(hash + 1);
    const CtTypeRow* row = contact_types::rowOf(types.rows, word);
    return row != nullptr ? row->code : types.unknownCode;
}

void readType(const CtSection& section, JsonObject* element, contacts_record_h child) {
    const CtTypeTable& types = *section.types;
    const std::optional<std::string> word = json_access::text(element, types.attribute);
    const std::optional<std::string> label = json_access::text(element, "label");
    if (word) {
        setNumber(child, section.typeProperty, codeOf(types, *word));
    } else if (label) {
        setNumber(child, section.typeProperty, types.labelCode);
        setText(child, section.labelProperty, *label);
    } else if (types.mustBeThere) {
        SYNC_ERR("Spec[rel/label] out!");
        throw JsonException("Spec[rel/label] out!");
    }
}

void addImage(JsonObject* entry, contacts_record_h contact) {
    std::string href;
    std::string etag;
    if (!photoLinkOf(entry, &href, &etag)) return;
    if (href.empty()) {
        SYNC_ERR("Spec[website.href] out!");
        throw JsonException("Spec[website.href] out!");
    }
    const std::string id = CtIdUtil::idAfterCom(href);
    if (!CtIdUtil::isFileName(id)) {
        SYNC_ERR("the photo's id(%.64s) cannot name a file", id.c_str());
        return;
    }
    ContactsRecord image = create(_contacts_image);
    setText(image.get(), CONTACTS_IMAGE_PATH, "/tmp/" + id);
    addChild(contact, CONTACTS_CONTACT_IMAGES, std::move(image));
}

void addOrigin(const std::string& entryText, contacts_record_h contact) {
    ContactsRecord origin = create(_contacts_extension);
    setNumber(origin.get(), CONTACTS_EXTENSION_DATA1, ct_wire::kOriginExtension);
    setText(origin.get(), CONTACTS_EXTENSION_DATA2, ct_wire::kOriginName);
    setText(origin.get(), CONTACTS_EXTENSION_DATA3, entryText);
    addChild(contact, CONTACTS_CONTACT_EXTENSIONS, std::move(origin));
}

}  // namespace

int convertDateString(const std::string& text) {
    tm date{};
    if (strptime(text.c_str(), "%EY-%Om-%d", &date) == nullptr) {
        SYNC_ERR("there is no matching delim");
        return 0;
    }
    constexpr int kFirstYear = 1900;
    return (date.tm_year + kFirstYear) * 10000 + (date.tm_mon + 1) * 100 + date.tm_mday;
}

void addChild(contacts_record_h contact, unsigned property, ContactsRecord child) {
    if (contacts_record_add_child_record(contact, property, child.get()) != PLATFORM_ERROR_NONE)
        throw JsonException("add child fail");
    (void)child.release();
}

void forEachElement(JsonObject* entry, const char* member, const std::function<void(JsonObject*)>& use) {
    JsonNode* node = json_access::member(entry, member);
    if (node == nullptr || JSON_NODE_HOLDS_NULL(node)) return;
    const auto useNode = [&](JsonNode* item) {
        if (!JSON_NODE_HOLDS_OBJECT(item)) throw JsonException(std::string(member) + " is no object");
        use(json_node_get_object(item));
    };
    if (!JSON_NODE_HOLDS_ARRAY(node)) return useNode(node);
    JsonArray* items = json_node_get_array(node);
    for (guint i = 0; i < json_array_get_length(items); ++i) useNode(json_array_get_element(items, i));
}

bool photoLinkOf(JsonObject* entry, std::string* href, std::string* etag) {
    bool found = false;
    forEachElement(entry, "link", [&](JsonObject* link) {
        const std::string rel = json_access::textOr(link, "rel", "");
        const std::string linkEtag = json_access::textOr(link, "gd$etag", "");
        if (found || !rel.ends_with(ct_wire::kPhotoRelEnd) || linkEtag.empty()) return;
        found = true;
        *href = json_access::textOr(link, "href", "");
        *etag = linkEtag;
    });
    return found;
}

int CtJsonEntryConverter::convert(const std::string& entryText, ContactsRecord* out, int addressBookId,
                                  bool withPhoto) const {
    const JsonNodePtr root = json_text::parse(entryText);
    if (!root) {
        SYNC_ERR("load json fail! %s", "the entry is no JSON");
        throw JsonException("load json fail!");
    }
    if (!JSON_NODE_HOLDS_OBJECT(root.get())) {
        SYNC_ERR("parsing error");
        throw JsonException("parsing error");
    }
    JsonObject* entry = json_access::objectIn(root.get());
    if (entry == nullptr) {
        SYNC_ERR("json_node_get_object is failed");
        throw JsonException("json_node_get_object is failed");
    }
    return convert(entry, entryText, out, addressBookId, withPhoto);
}

int CtJsonEntryConverter::convert(JsonObject* entry, const std::string& entryText, ContactsRecord* out,
                                  int addressBookId, bool withPhoto) const {
    contacts_record_h raw = nullptr;
    if (contacts_record_create(_contacts_contact, &raw) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("contacts_record_create failed!");
        return kFailed;
    }
    ContactsRecord record(raw);
    if (addressBookId != 0) setNumber(raw, CONTACTS_CONTACT_ADDRESS_BOOK_ID, addressBookId);
    if (withPhoto) addImage(entry, raw);
    for (const CtSection* section : ct_mappings::kReadOrder) addSection(*section, entry, raw);
    if (!entryText.empty()) addOrigin(entryText, raw);
    *out = std::move(record);
    return kOk;
}

void CtJsonEntryConverter::addSection(const CtSection& section, JsonObject* entry,
                                      contacts_record_h contact) const {
    forEachElement(entry, section.member, [&](JsonObject* element) {
        if (ContactsRecord child = convertElement(section, element))
            addChild(contact, section.children, std::move(child));
    });
}

ContactsRecord CtJsonEntryConverter::convertElement(const CtSection& section, JsonObject* element) const {
    ContactsRecord child = create(section.view);
    bool isMain = true;
    for (const CtField& field : section.fields) {
        const bool isThere = readField(field, element, child.get());
        if (isMain && !isThere && section.missingText != nullptr) {
            SYNC_ERR("%s", section.missingText);
            if (section.missingIsFatal) throw JsonException(section.missingText);
            return nullptr;
        }
        isMain = false;
    }
    if (section.types != nullptr) readType(section, element, child.get());
    if (section.markProperty != 0) setNumber(child.get(), section.markProperty, section.mark);
    return child;
}

bool CtJsonEntryConverter::readField(const CtField& field, JsonObject* element,
                                     contacts_record_h child) const {
    const bool ofChild =
        field.at == CtAt::kChildText || field.at == CtAt::kChildAttribute || field.at == CtAt::kChildDate;
    JsonObject* holder = ofChild ? json_access::object(element, field.name) : element;
    const bool isText = field.at == CtAt::kText || field.at == CtAt::kChildText;
    const char* name = isText ? "$t" : (ofChild ? field.attribute : field.name);
    std::optional<std::string> value = json_access::text(holder, name);
    if (!value && field.readsText) value = json_access::text(holder, "$t");
    if (!value) return false;
    if (field.at == CtAt::kFlag) {
        setNumber(child, field.property, *value == "true" ? 1 : 0);
    } else if (field.at == CtAt::kDate || field.at == CtAt::kChildDate) {
        setNumber(child, field.property, convertDateString(*value));
    } else if (field.at == CtAt::kGroup) {
        setNumber(child, field.property, mGroupOf(CtIdUtil::idAfterBase(*value)));
    } else {
        setText(child, field.property, *value);
    }
    return true;
}
