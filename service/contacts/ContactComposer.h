// ContactComposer: a contact record as the Atom entry that the service takes.
// Owner: a data manager call.   Threads: one at a time.
//
// An element that the device has not changed goes up as the server had it, with all that the device cannot show; so do elements of
// the kept entry that no field stands for. Everything is escaped: the result is well-formed whatever the fields hold.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "contacts/CtJsonEntryConverter.h"
#include "contacts/CtXml.h"

class ContactComposer {
public:
    // The server's id of a group of the device, empty when it has none.
    using UriLookup = std::function<std::string(int groupId)>;
    ContactComposer(std::string feedBase, CtJsonEntryConverter::GroupLookup groupOf, UriLookup uriOf)
        : mFeedBase(std::move(feedBase)), mConverter(std::move(groupOf)), mUriOf(std::move(uriOf)) {}

    // `etag` may be empty. `originText` is the server's entry to carry over from, empty for the one kept with the record.
    [[nodiscard]] std::string compose(contacts_record_h contact, const std::string& etag,
                                      const std::string& originText = {}) const;

    // What the device's fields alone make, to compare two contacts by.
    [[nodiscard]] std::string composeFields(contacts_record_h contact) const;
    // The same of a listed entry; empty when it cannot be read.
    [[nodiscard]] std::string composeFields(JsonObject* entry) const;

private:
    struct Composed {
        CtXmlElement element;
        bool hasContent = false;
    };
    // An element of the kept entry: as the device would write it, and as it was.
    struct Original {
        Composed composed;
        CtXmlElement verbatim;
        bool isShown = false;  // a child record stands for it
        bool isUsed = false;
    };

    [[nodiscard]] Composed composeElement(const CtSection& section, contacts_record_h child) const;
    [[nodiscard]] std::string fieldValue(const CtField& field, contacts_record_h child) const;
    void composeField(const CtField& field, contacts_record_h child, Composed* out) const;
    [[nodiscard]] std::vector<Original> readOriginals(const CtSection& section, JsonObject* origin) const;
    [[nodiscard]] std::vector<CtXmlElement> composeSection(const CtSection& section,
                                                           contacts_record_h contact,
                                                           JsonObject* origin) const;

    const std::string mFeedBase;
    const CtJsonEntryConverter mConverter;
    const UriLookup mUriOf;
};

// The root of an entry: namespaces, etag and category.
CtXmlElement makeAtomEntry(const char* term, const std::string& etag, bool withContactNamespace);
