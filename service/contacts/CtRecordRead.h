// Reads of a contact record that several steps of the sync need. Threads: any.
#pragma once

#include <string>

#include "contacts/CtWire.h"
#include "platform/contacts_read.h"

namespace ct_record {

// The server's entry that is kept with a contact, empty when there is none.
inline std::string originOf(contacts_record_h contact) {
    std::string origin;
    contacts_read::forEachChild(contact, CONTACTS_CONTACT_EXTENSIONS, [&origin](contacts_record_h extension) {
        if (contacts_read::intOf(extension, CONTACTS_EXTENSION_DATA1) == ct_wire::kOriginExtension &&
            origin.empty()) {
            origin = contacts_read::textOf(extension, CONTACTS_EXTENSION_DATA3);
        }
    });
    return origin;
}

// The path of the contact's first image, empty when it has none.
inline std::string imageOf(contacts_record_h contact) {
    std::string path;
    contacts_read::forEachChild(contact, CONTACTS_CONTACT_IMAGES, [&path](contacts_record_h image) {
        if (path.empty()) path = contacts_read::textOf(image, CONTACTS_IMAGE_PATH);
    });
    return path;
}

}  // namespace ct_record
