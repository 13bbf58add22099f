// ContactJson.h: a contact record as the JSON that scripts rely on, and back. What compose() gives, parse() takes.
#pragma once

#include <optional>
#include <span>
#include <string>
#include <vector>

#include "Output.h"
#include "platform/contacts.h"

namespace contact_json {

Json compose(contacts_record_h contact, int account);
// What compose() reads.
std::span<const unsigned> projection();

// A contact of a file; its id is not used. Groups and photo are not in the record yet: the store decides about them.
struct NewContact {
    ContactsRecord record;
    std::optional<int> account;
    std::vector<int> groups;
    std::string photo;  // a path, empty for none
};
NewContact parse(const Json& object);

// FIELD=VALUE of `contact set`. Lists are written as JSON. Misuse when it names no field.
struct Change {
    std::string field;
    std::string value;
    // The properties of the contact that the change writes.
    [[nodiscard]] unsigned children() const;
};
std::vector<Change> readChanges(const std::vector<std::string>& texts);
// Texts and lists; groups and photo are the caller's.
void apply(contacts_record_h contact, const Change& change);

// The ids of a list of groups, as JSON.
std::vector<int> groupsFrom(const Json& value);
Json parseValue(const Change& change);
// The record is then in exactly these groups. A membership of a group that the device does not have stays.
void setGroups(contacts_record_h contact, const std::vector<int>& groups);
// The contact's only photo is then this one, below the root; empty: none.
void setPhoto(contacts_record_h contact, const std::string& path);
// On this machine; empty: none.
std::string photoOf(contacts_record_h contact);
// What people call the contact by.
std::string displayNameOf(const Json& contact);

inline constexpr const char* kGroups = "groups";
inline constexpr const char* kPhoto = "photo";

}  // namespace contact_json
