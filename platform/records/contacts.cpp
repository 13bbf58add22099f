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

int contacts_db_for_each_change(const char* view, int address_book_id, int version, contacts_record_cb use,
                                void* user_data, int* current_version) {
    const View* items = platform::records::itemsOfFeed(view);
    if (items == nullptr || use == nullptr || current_version == nullptr) return kInvalid;
    return contactsStore().visitChanges(
        *items, address_book_id, version, [use, user_data](auto& record) { use(record.get(), user_data); },
        current_version);
}
