#include "contacts/CtJsonOrbitPeopleConverter.h"

#include <cstdio>

#include "common/JsonAccess.h"
#include "common/JsonText.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "contacts/CtJsonEntryConverter.h"
#include "contacts/CtMappings.h"
#include "contacts/CtRecordRead.h"
#include "platform/contacts_read.h"

using json_access::textOr;
using sync_result::kFailed;
using sync_result::kOk;

namespace {

struct NameRow {
    const char* member;
    unsigned property;
};
constexpr NameRow kNameRows[] = {{"givenName", CONTACTS_NAME_FIRST},
                                 {"familyName", CONTACTS_NAME_LAST},
                                 {"honorificPrefix", CONTACTS_NAME_PREFIX},
                                 {"honorificSuffix", CONTACTS_NAME_SUFFIX}};

constexpr const char* kNicknameMember = "nickname";
constexpr const char* kBirthdayMember = "birthday";

std::string dateText(int date) {
    char text[32];
    std::snprintf(text, sizeof text, "%04d-%02d-%02d", date / 10000, date / 100 % 100, date % 100);
    return text;
}

// Members of the name may stand in an object of their own.
std::string memberOf(JsonObject* profile, const char* member) {
    const std::string value = textOr(profile, member, "");
    return value.empty() ? textOr(json_access::object(profile, "name"), member, "") : value;
}

bool has(contacts_record_h contact, unsigned property) {
    unsigned count = 0;
    return contacts_record_get_child_record_count(contact, property, &count) == PLATFORM_ERROR_NONE &&
           count > 0;
}

bool hasBirthday(contacts_record_h contact) {
    bool found = false;
    contacts_read::forEachChild(contact, CONTACTS_CONTACT_EVENTS, [&found](contacts_record_h event) {
        found = found || contacts_read::intOf(event, CONTACTS_EVENT_TYPE) == ct_wire::kBirthday;
    });
    return found;
}

// `set` fills the new child and says whether there is anything in it.
template <class Set>
bool addFilled(contacts_record_h contact, unsigned property, const char* view, Set set) {
    contacts_record_h raw = nullptr;
    if (contacts_record_create(view, &raw) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("create fail");
        return false;
    }
    ContactsRecord child(raw);
    if (!set(raw)) return true;
    if (contacts_record_add_child_record(contact, property, raw) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("add child fail");
        return false;
    }
    (void)child.release();
    return true;
}

bool setText(contacts_record_h record, unsigned property, const std::string& value) {
    return !value.empty() && contacts_record_set_str(record, property, value.c_str()) == PLATFORM_ERROR_NONE;
}

}  // namespace

int CtJsonOrbitPeopleConverter::getPhotoUrl(const std::string& profile, const std::string& peopleBase,
                                            std::string* url) {
    const JsonNodePtr root = json_text::parse(profile);
    JsonObject* person = json_access::objectIn(root.get());
    if (person == nullptr) {
        SYNC_ERR("record is null or mObject is null");
        return kFailed;
    }
    JsonObject* image = json_access::object(person, "image");
    const std::string found = image != nullptr ? textOr(image, "url", "") : textOr(person, "image", "");
    const bool isDefault =
        json_access::isTrue(image, "isDefault") || found.starts_with(peopleBase + ct_wire::kDefaultAvatar);
    *url = isDefault ? std::string() : found;
    return kOk;
}

int CtJsonOrbitPeopleConverter::convert(const std::string& profile, contacts_record_h contact) {
    const JsonNodePtr root = json_text::parse(profile);
    JsonObject* person = json_access::objectIn(root.get());
    if (contact == nullptr || person == nullptr) {
        SYNC_ERR("record is null or mObject is null");
        return kFailed;
    }
    bool isAdded = true;
    if (!has(contact, CONTACTS_CONTACT_NAMES)) {
        isAdded =
            addFilled(contact, CONTACTS_CONTACT_NAMES, _contacts_name, [person](contacts_record_h name) {
                bool isSet = false;
                for (const NameRow& row : kNameRows)
                    isSet = setText(name, row.property, memberOf(person, row.member)) || isSet;
                return isSet;
            });
    }
    if (!has(contact, CONTACTS_CONTACT_NICKNAMES)) {
        isAdded =
            addFilled(contact, CONTACTS_CONTACT_NICKNAMES, _contacts_nickname,
                      [person](contacts_record_h nickname) {
                          return setText(nickname, CONTACTS_NICKNAME_NAME, memberOf(person, kNicknameMember));
                      }) &&
            isAdded;
    }
    const std::string birthday = textOr(person, kBirthdayMember, "");
    if (!birthday.empty() && !hasBirthday(contact)) {
        isAdded = addFilled(contact, CONTACTS_CONTACT_EVENTS, _contacts_event,
                            [&birthday](contacts_record_h event) {
                                const int date = convertDateString(birthday);
                                return date != 0 &&
                                       contacts_record_set_int(event, CONTACTS_EVENT_TYPE,
                                                               ct_wire::kBirthday) == PLATFORM_ERROR_NONE &&
                                       contacts_record_set_int(event, CONTACTS_EVENT_DATE, date) ==
                                           PLATFORM_ERROR_NONE;
                            }) &&
                  isAdded;
    }
    return isAdded ? kOk : kFailed;
}

std::string CtJsonOrbitPeopleConverter::formerProfile(contacts_record_h contact) {
    const JsonNodePtr root = json_text::parse(ct_record::originOf(contact));
    JsonObject* origin = json_access::objectIn(root.get());
    if (origin == nullptr) return {};
    const JsonNodePtr profile(json_node_new(JSON_NODE_OBJECT));
    json_node_take_object(profile.get(), json_object_new());
    const auto keep = [&profile](const char* member, const std::string& value) {
        if (!value.empty())
            json_object_set_string_member(json_node_get_object(profile.get()), member, value.c_str());
    };
    const auto isOpen = [origin](const CtSection& section) {
        JsonNode* node = json_access::member(origin, section.member);
        return node == nullptr || JSON_NODE_HOLDS_NULL(node);
    };
    using contacts_read::forEachChild;
    using contacts_read::textOf;
    if (isOpen(ct_mappings::kName)) {
        forEachChild(contact, CONTACTS_CONTACT_NAMES, [&keep](contacts_record_h name) {
            for (const NameRow& row : kNameRows) keep(row.member, textOf(name, row.property));
        });
    }
    if (isOpen(ct_mappings::kNickname)) {
        forEachChild(contact, CONTACTS_CONTACT_NICKNAMES, [&keep](contacts_record_h nickname) {
            keep(kNicknameMember, textOf(nickname, CONTACTS_NICKNAME_NAME));
        });
    }
    if (isOpen(ct_mappings::kBirthday)) {
        forEachChild(contact, CONTACTS_CONTACT_EVENTS, [&keep](contacts_record_h event) {
            const int date = contacts_read::intOf(event, CONTACTS_EVENT_DATE);
            if (contacts_read::intOf(event, CONTACTS_EVENT_TYPE) == ct_wire::kBirthday && date > 0)
                keep(kBirthdayMember, dateText(date));
        });
    }
    const bool isEmpty = json_object_get_size(json_node_get_object(profile.get())) == 0;
    return isEmpty ? std::string() : json_text::textOf(profile.get());
}
