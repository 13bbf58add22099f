// The contacts service's functions.
#include "platform/contacts.h"

#include "ContactsViews.h"

using platform::records::contactsStore;

#define RECORD_CALL(name) contacts_##name
#define RECORD_STORE contactsStore
#include "ServiceCalls.inc"

int contacts_db_get_changes_by_version(const char* view, int address_book_id, int version,
                                       contacts_list_h* out, int* current_version) {
    const View* items = platform::records::itemsOfFeed(view);
    if (items == nullptr || current_version == nullptr) return kInvalid;
    return makeList(out, [&](RecordList* list) {
        return contactsStore().changes(*items, address_book_id, version, list, current_version);
    });
}
