// CtJsonEntryConverter: one entry of the contacts feed as a contact record with all its child records.
// Owner: a data manager call.   Threads: one at a time.
#pragma once

#include <json-glib/json-glib.h>

#include <functional>
#include <stdexcept>
#include <string>

#include "contacts/CtMappings.h"
#include "platform/contacts.h"

// An entry that cannot be read.
class JsonException : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

class CtJsonEntryConverter {
public:
    // The device's group for the server's id of one, 0 when there is none.
    using GroupLookup = std::function<int(const std::string& uri)>;
    explicit CtJsonEntryConverter(GroupLookup groupOf) : mGroupOf(std::move(groupOf)) {}

    // A new record, in `addressBookId` unless that is 0; with an image record for the photo when `withPhoto`. Throws JsonException;
    // -1 when the contacts service refuses.
    [[nodiscard]] int convert(const std::string& entryText, ContactsRecord* out, int addressBookId,
                              bool withPhoto) const;
    // The same of an entry that is parsed already; `entryText` is what is kept with the record.
    [[nodiscard]] int convert(JsonObject* entry, const std::string& entryText, ContactsRecord* out,
                              int addressBookId, bool withPhoto) const;

    // One element of a section as a child record; NULL (logged) when there is nothing to keep of it. Throws JsonException.
    [[nodiscard]] ContactsRecord convertElement(const CtSection& section, JsonObject* element) const;

private:
    void addSection(const CtSection& section, JsonObject* entry, contacts_record_h contact) const;
    [[nodiscard]] bool readField(const CtField& field, JsonObject* element, contacts_record_h child) const;

    GroupLookup mGroupOf;
};

// A date "YYYY-MM-DD" as year * 10000 + month * 100 + day, 0 (logged) when it is none.
int convertDateString(const std::string& text);

// Calls `use` for each element of a member, which may be one object or several. Throws JsonException when it is neither.
void forEachElement(JsonObject* entry, const char* member, const std::function<void(JsonObject*)>& use);

// Throws JsonException when the service refuses.
void addChild(contacts_record_h contact, unsigned property, ContactsRecord child);

// The photo link of an entry that has a photo: href and etag. False without one.
bool photoLinkOf(JsonObject* entry, std::string* href, std::string* etag);
