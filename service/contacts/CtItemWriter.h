// CtItemWriter: writes contacts and groups of one address book: records in one transaction of the contacts service, rows in one
// transaction of the metadata store.
// Owner: a data manager call.   Threads: one worker.
// Errors: 0 or -1, logged. A failure leaves both stores as they were, or records without rows, which the next run takes over.
#pragma once

#include <vector>

#include "contacts/CtBulkItem.h"
#include "contacts/CtGroupMap.h"
#include "contacts/CtItemKind.h"

class CtItemWriter {
public:
    // Nothing is owned.
    CtItemWriter(CtMetaDataDBHelper* store, int addressBookId)
        : mpStore(store), mAddressBookId(addressBookId) {}

    // Takes what was not written (converted, or moved on meanwhile) out of the batch; the rows of the rest are as stored.
    [[nodiscard]] int writeContacts(CtContactBatch* batch);
    [[nodiscard]] int writeGroups(std::vector<CtGroupItem>* items);

    // Deletes records and rows; `versions` as in the records. What has moved on stays, with its row. The count of what went.
    template <class Kind>
    [[nodiscard]] int remove(const std::vector<typename Kind::Row>& rows, const std::vector<int>& versions,
                             int* removed);

private:
    [[nodiscard]] bool convert(BulkItem& item, const CtJsonEntryConverter& converter,
                               ContactsRecord* out) const;
    // The records of one bulk call.
    struct Bulk {
        ContactsList list;
        std::vector<BulkItem> items;
        std::vector<contacts_record_h> records = {};  // owned by the list
        std::vector<int> ids = {};
        std::vector<int> expected = {};
    };
    // Converts; what cannot be is left out.
    [[nodiscard]] int prepare(std::vector<BulkItem> items, const CtJsonEntryConverter& converter,
                              Bulk* out) const;
    [[nodiscard]] static int writeBulk(Bulk* bulk, bool isNew, std::vector<BulkItem>* written);
    [[nodiscard]] int writeGroupRecord(CtGroupItem& item, bool* isWritten) const;
    [[nodiscard]] int writeRows(const CtContactBatch& batch);

    CtMetaDataDBHelper* const mpStore;
    const int mAddressBookId;
};
