#include "ContactJson.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <set>

#include "ContactFields.h"
#include "RecordAccess.h"
#include "RecordJson.h"
#include "TimeText.h"
#include "platform/root.h"

namespace contact_json {

namespace {

using contact_fields::Kind;
using contact_fields::kLists;
using contact_fields::kTexts;
using record_access::forEachChild;
using record_access::intOf;
using record_access::textOf;

constexpr std::string_view kNamePrefix = "name.";
constexpr const char* kOther = "other";
constexpr const char* kCustom = "custom";
constexpr int kYearPlace = 10000;
constexpr int kMonthPlace = 100;

constexpr unsigned kProjection[] = {CONTACTS_CONTACT_ID,
                                    CONTACTS_CONTACT_ADDRESS_BOOK_ID,
                                    CONTACTS_CONTACT_VERSION,
                                    CONTACTS_CONTACT_NAMES,
                                    CONTACTS_CONTACT_NUMBERS,
                                    CONTACTS_CONTACT_EMAILS,
                                    CONTACTS_CONTACT_MESSENGERS,
                                    CONTACTS_CONTACT_COMPANIES,
                                    CONTACTS_CONTACT_ADDRESSES,
                                    CONTACTS_CONTACT_EVENTS,
                                    CONTACTS_CONTACT_RELATIONSHIPS,
                                    CONTACTS_CONTACT_URLS,
                                    CONTACTS_CONTACT_NICKNAMES,
                                    CONTACTS_CONTACT_NOTES,
                                    CONTACTS_CONTACT_IMAGES,
                                    CONTACTS_CONTACT_GROUP_RELATIONS,
                                    CONTACTS_CONTACT_EXTENSIONS};

ContactsRecord create(const char* view) {
    contacts_record_h record = nullptr;
    check(contacts_record_create(view, &record), "making a record");
    return ContactsRecord(record);
}

void addChild(contacts_record_h contact, unsigned property, ContactsRecord child) {
    check(contacts_record_add_child_record(contact, property, child.get()), "making a record");
    static_cast<void>(child.release());  // the contact has it now
}

std::vector<contacts_record_h> childrenOf(contacts_record_h contact, unsigned property) {
    std::vector<contacts_record_h> children;
    forEachChild(contact, property, [&children](contacts_record_h child) { children.push_back(child); });
    return children;
}

ContactsRecord takeChild(contacts_record_h contact, unsigned property, contacts_record_h child) {
    check(contacts_record_remove_child_record(contact, property, child), "changing a record");
    return ContactsRecord(child);
}

// --- record to JSON ---------------------------------------------------------------------------------------------

std::string typeWordOf(const ContactTypeField& type, contacts_record_h item) {
    const int code = intOf(item, type.code);
    // With a label, 1 is custom also where the code alone has a word.
    const bool isNamedByLabel = (code == 0 || code == 1) && !textOf(item, type.label).empty();
    if (isNamedByLabel) return kCustom;
    const char* word = contact_types::wordOf(type.words, code);
    return word != nullptr ? word : kOther;
}

std::string dateText(int date) {
    if (date <= 0) return {};
    std::array<char, 32> text{};
    std::snprintf(text.data(), text.size(), "%04d-%02d-%02d", date / kYearPlace,
                  date / kMonthPlace % kMonthPlace, date % kMonthPlace);
    return text.data();
}

Json composeItem(const ContactItems& list, contacts_record_h item) {
    Json object = Json::object();
    for (const ContactItemField& field : list.fields) {
        if (field.kind == Kind::kText) object[std::string(field.name)] = textOf(item, field.property);
        if (field.kind == Kind::kDate)
            object[std::string(field.name)] = dateText(intOf(item, field.property));
    }
    if (list.type != nullptr) {
        object[std::string(list.type->name)] = typeWordOf(*list.type, item);
        object["label"] = textOf(item, list.type->label);
    }
    for (const ContactItemField& field : list.fields) {
        if (field.kind == Kind::kFlag) object[std::string(field.name)] = intOf(item, field.property) != 0;
    }
    return object;
}

bool belongs(const ContactItems& list, contacts_record_h item) {
    return list.markProperty == 0 || intOf(item, list.markProperty) == list.mark;
}

Json composeList(const ContactItems& list, contacts_record_h contact) {
    Json array = Json::array();
    forEachChild(contact, list.children, [&](contacts_record_h item) {
        if (belongs(list, item)) array.push_back(composeItem(list, item));
    });
    return array;
}

std::string textIn(contacts_record_h contact, const ContactText& text) {
    const std::vector<contacts_record_h> children = childrenOf(contact, text.children);
    return children.empty() ? std::string() : textOf(children.front(), text.property);
}

Json composeGroups(contacts_record_h contact) {
    Json ids = Json::array();
    forEachChild(contact, CONTACTS_CONTACT_GROUP_RELATIONS, [&ids](contacts_record_h relation) {
        const int id = intOf(relation, CONTACTS_GROUP_RELATION_GROUP_ID);
        if (id > 0) ids.push_back(id);
    });
    return ids;
}

// --- JSON to record ---------------------------------------------------------------------------------------------

int dateFrom(const std::string& text, const std::string& member) {
    if (text.empty()) return 0;
    const auto time = time_text::parseRfc3339(text);
    if (!time || !time_text::isDate(*time)) record_json::refuse(member, "must be a date as 2014-05-01");
    return time->year * kYearPlace + time->month * kMonthPlace + time->mday;
}

void setType(contacts_record_h item, const ContactTypeField& type, const Json& object,
             const std::string& member) {
    const std::string name(type.name);
    const std::string word =
        object.contains(name) ? record_json::textFrom(object[name], member + "." + name) : std::string();
    const std::string label =
        object.contains("label") ? record_json::textFrom(object["label"], member + ".label") : std::string();
    if (word == kCustom && label.empty()) record_json::refuse(member + ".label", "must name a custom type");
    int code = 0;
    if (word.empty() || word == kOther || word == kCustom) {
        code = label.empty() ? 0 : type.customCode;
    } else if (const contact_type_word_s* row = contact_types::rowOf(type.words, word)) {
        code = row->code;
    } else {
        std::string known;
        for (const contact_type_word_s& other : type.words) known += std::string(other.word) + ", ";
        record_json::refuse(member + "." + name, "must be one of " + known + "custom or other");
    }
    record_access::setInt(item, type.code, code, member);
    // Beside a code that is custom with a label, the label would say something else than the word.
    if (code != 1 || word.empty() || word == kOther || word == kCustom)
        record_access::setText(item, type.label, label, member);
}

void setItemField(contacts_record_h item, const ContactItemField& field, const Json& value,
                  const std::string& member) {
    switch (field.kind) {
        case Kind::kText:
            record_access::setText(item, field.property, record_json::textFrom(value, member), member);
            return;
        case Kind::kDate:
            record_access::setInt(item, field.property,
                                  dateFrom(record_json::textFrom(value, member), member), member);
            return;
        case Kind::kFlag:
            if (!value.is_boolean() && !value.is_null()) record_json::refuse(member, "must be true or false");
            record_access::setInt(item, field.property, value.is_boolean() && value.get<bool>() ? 1 : 0,
                                  member);
            return;
    }
}

bool isKnown(const ContactItems& list, const std::string& name) {
    const bool isOfType = list.type != nullptr && (name == list.type->name || name == "label");
    return isOfType || std::any_of(list.fields.begin(), list.fields.end(),
                                   [&name](const ContactItemField& field) { return field.name == name; });
}

ContactsRecord itemFrom(const ContactItems& list, const Json& object) {
    const std::string member(list.name);
    if (!object.is_object()) record_json::refuse(member, "must be a list of objects");
    for (const auto& entry : object.items()) {
        if (!isKnown(list, entry.key())) record_json::refuse(member + "." + entry.key(), "is not known");
    }
    ContactsRecord item = create(list.view);
    for (const ContactItemField& field : list.fields) {
        const auto value = object.find(std::string(field.name));
        if (value != object.end())
            setItemField(item.get(), field, *value, member + "." + std::string(field.name));
    }
    if (list.needsFirst && textOf(item.get(), list.fields.front().property).empty())
        record_json::refuse(member + "." + std::string(list.fields.front().name), "is missing");
    if (list.type != nullptr) setType(item.get(), *list.type, object, member);
    if (list.markProperty != 0) record_access::setInt(item.get(), list.markProperty, list.mark, member);
    return item;
}

// What stays as it is keeps its record, and with it what the JSON does not show.
void setList(contacts_record_h contact, const ContactItems& list, const Json& value) {
    std::vector<ContactsRecord> wanted;
    for (const Json& object : record_json::listFrom(value, std::string(list.name)))
        wanted.push_back(itemFrom(list, object));
    std::vector<ContactsRecord> former;
    for (const contacts_record_h item : childrenOf(contact, list.children)) {
        if (belongs(list, item)) former.push_back(takeChild(contact, list.children, item));
    }
    for (ContactsRecord& item : wanted) {
        const Json shown = composeItem(list, item.get());
        const auto same = std::find_if(former.begin(), former.end(), [&](const ContactsRecord& kept) {
            return kept != nullptr && composeItem(list, kept.get()) == shown;
        });
        addChild(contact, list.children, std::move(same != former.end() ? *same : item));
    }
}

void setText(contacts_record_h contact, const ContactText& text, const std::string& value) {
    const std::vector<contacts_record_h> children = childrenOf(contact, text.children);
    const std::string name(text.name);
    if (!children.empty() && (!value.empty() || !text.isAlone)) {
        record_access::setText(children.front(), text.property, value, name);
    } else if (!children.empty()) {
        takeChild(contact, text.children, children.front());
    } else if (!value.empty()) {
        ContactsRecord child = create(text.view);
        record_access::setText(child.get(), text.property, value, name);
        addChild(contact, text.children, std::move(child));
    }
}

// A part of the name may be called without the object that it stands in.
const ContactText* findText(const std::string& name) {
    const auto* found = std::find_if(std::begin(kTexts), std::end(kTexts), [&name](const ContactText& text) {
        return text.name == name || text.name == std::string(kNamePrefix) + name;
    });
    return found != std::end(kTexts) ? found : nullptr;
}

const ContactItems* findList(const std::string& name) {
    const auto* found = std::find_if(std::begin(kLists), std::end(kLists),
                                     [&name](const ContactItems& list) { return list.name == name; });
    return found != std::end(kLists) ? found : nullptr;
}

void setName(contacts_record_h contact, const Json& object) {
    if (object.is_null()) return;
    if (!object.is_object()) record_json::refuse("name", "must be an object");
    for (const auto& part : object.items()) {
        const std::string member = std::string(kNamePrefix) + part.key();
        const ContactText* text = findText(member);
        if (text == nullptr || text->name != member) record_json::refuse(member, "is not known");
        setText(contact, *text, record_json::textFrom(part.value(), member));
    }
}

void setMember(NewContact& contact, const std::string& name, const Json& value) {
    const ContactText* text = findText(name);
    if (text != nullptr && text->name == name && text->isAlone) {
        setText(contact.record.get(), *text, record_json::textFrom(value, name));
    } else if (const ContactItems* list = findList(name)) {
        setList(contact.record.get(), *list, value);
    } else if (name == "name") {
        setName(contact.record.get(), value);
    } else if (name == kGroups) {
        contact.groups = groupsFrom(value);
    } else if (name == kPhoto) {
        contact.photo = record_json::textFrom(value, name);
    } else if (name == "account") {
        contact.account = record_json::idFrom(value, name);
    } else if (name == "id") {
        static_cast<void>(record_json::idFrom(value, name));
    } else {
        record_json::refuse(name, "is not known");
    }
}

}  // namespace

std::span<const unsigned> projection() {
    return kProjection;
}

Json compose(contacts_record_h contact, int account) {
    Json object = {{"id", intOf(contact, CONTACTS_CONTACT_ID)}, {"account", account}};
    Json name = Json::object();
    for (const ContactText& text : kTexts) {
        if (text.name.starts_with(kNamePrefix))
            name[std::string(text.name.substr(kNamePrefix.size()))] = textIn(contact, text);
    }
    object["name"] = std::move(name);
    const auto addText = [&](std::string_view member) {
        object[std::string(member)] = textIn(contact, *findText(std::string(member)));
    };
    addText("nickname");
    const std::span<const ContactItems> lists(kLists);
    for (const ContactItems& list : lists.first(lists.size() - 1))
        object[std::string(list.name)] = composeList(list, contact);
    object[kGroups] = composeGroups(contact);
    addText("note");
    object[kPhoto] = photoOf(contact);
    object[std::string(lists.back().name)] = composeList(lists.back(), contact);
    return object;
}

NewContact parse(const Json& object) {
    if (!object.is_object()) throw Failure("the file must hold one contact as a JSON object");
    NewContact contact;
    contact.record = create(_contacts_contact);
    for (const auto& member : object.items()) setMember(contact, member.key(), member.value());
    return contact;
}

unsigned Change::children() const {
    if (field == kGroups) return CONTACTS_CONTACT_GROUP_RELATIONS;
    if (field == kPhoto) return CONTACTS_CONTACT_IMAGES;
    if (const ContactText* text = findText(field)) return text->children;
    return findList(field)->children;
}

std::vector<Change> readChanges(const std::vector<std::string>& texts) {
    std::vector<Change> changes;
    std::set<std::string> seen;
    for (const std::string& text : texts) {
        const size_t equals = text.find('=');
        const std::string name = text.substr(0, equals);
        if (equals == std::string::npos) throw Misuse("\"" + text + "\" is not FIELD=VALUE");
        const ContactText* scalar = findText(name);
        if (scalar == nullptr && findList(name) == nullptr && name != kGroups && name != kPhoto)
            throw Misuse("\"" + name + "\" is no field that can be set (see --help)");
        if (!seen.insert(scalar != nullptr ? std::string(scalar->name) : name).second)
            throw Misuse("\"" + name + "\" is set twice");
        changes.push_back({name, text.substr(equals + 1)});
    }
    return changes;
}

Json parseValue(const Change& change) {
    try {
        return Json::parse(change.value.empty() ? "[]" : change.value);
    } catch (const Json::parse_error&) {
        record_json::refuse(change.field, "must be a list as JSON, as 'contact show --json' prints it");
    }
}

void apply(contacts_record_h contact, const Change& change) {
    if (const ContactText* text = findText(change.field)) {
        setText(contact, *text, change.value);
    } else if (const ContactItems* list = findList(change.field)) {
        setList(contact, *list, parseValue(change));
    }
}

std::vector<int> groupsFrom(const Json& value) {
    std::vector<int> ids;
    for (const Json& id : record_json::listFrom(value, kGroups)) {
        const int group = record_json::numberFrom(id, kGroups, 1, INT32_MAX);
        if (std::find(ids.begin(), ids.end(), group) == ids.end()) ids.push_back(group);
    }
    return ids;
}

void setGroups(contacts_record_h contact, const std::vector<int>& groups) {
    std::set<int> missing(groups.begin(), groups.end());
    for (const contacts_record_h relation : childrenOf(contact, CONTACTS_CONTACT_GROUP_RELATIONS)) {
        const int id = intOf(relation, CONTACTS_GROUP_RELATION_GROUP_ID);
        if (missing.erase(id) == 0 && id > 0) takeChild(contact, CONTACTS_CONTACT_GROUP_RELATIONS, relation);
    }
    for (const int id : groups) {
        if (!missing.contains(id)) continue;
        ContactsRecord relation = create(_contacts_group_relation);
        record_access::setInt(relation.get(), CONTACTS_GROUP_RELATION_GROUP_ID, id, kGroups);
        addChild(contact, CONTACTS_CONTACT_GROUP_RELATIONS, std::move(relation));
    }
}

void setPhoto(contacts_record_h contact, const std::string& path) {
    for (const contacts_record_h image : childrenOf(contact, CONTACTS_CONTACT_IMAGES))
        takeChild(contact, CONTACTS_CONTACT_IMAGES, image);
    if (path.empty()) return;
    ContactsRecord image = create(_contacts_image);
    record_access::setText(image.get(), CONTACTS_IMAGE_PATH, path, kPhoto);
    addChild(contact, CONTACTS_CONTACT_IMAGES, std::move(image));
}

std::string photoOf(contacts_record_h contact) {
    const std::vector<contacts_record_h> images = childrenOf(contact, CONTACTS_CONTACT_IMAGES);
    const std::string path = images.empty() ? std::string() : textOf(images.front(), CONTACTS_IMAGE_PATH);
    return path.empty() ? path : platform::rootedPath(path);
}

std::string displayNameOf(const Json& contact) {
    std::string text;
    for (const char* part : {"prefix", "first", "middle", "last", "suffix"}) {
        const auto& value = contact["name"][part].get_ref<const std::string&>();
        if (!value.empty()) text += (text.empty() ? "" : " ") + value;
    }
    if (text.empty()) text = contact["nickname"];
    const auto& companies = contact["companies"];
    return text.empty() && !companies.empty() ? companies[0]["name"].get<std::string>() : text;
}

}  // namespace contact_json
