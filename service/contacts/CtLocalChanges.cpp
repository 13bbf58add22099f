#include "contacts/CtLocalChanges.h"

#include <unordered_map>

#include "common/SyncLog.h"
#include "platform/contacts_read.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace ct_changes {

namespace {

bool readChange(contacts_record_h record, bool hasImage, CtLocalChange* change) {
    const std::pair<unsigned, int*> fields[] = {
        {CONTACTS_UPDATED_INFO_ID, &change->itemId},
        {CONTACTS_UPDATED_INFO_ADDRESS_BOOK_ID, &change->addressBookId},
        {CONTACTS_UPDATED_INFO_TYPE, &change->type},
        {CONTACTS_UPDATED_INFO_VERSION, &change->version},
        {CONTACTS_UPDATED_INFO_SYNCED_VERSION, &change->syncedVersion},
        {CONTACTS_UPDATED_INFO_IMAGE_CHANGED, &change->imageChanged},
    };
    for (const auto& [property, value] : fields) {
        if (property == CONTACTS_UPDATED_INFO_IMAGE_CHANGED && !hasImage) continue;
        if (contacts_record_get_int(record, property, value) != PLATFORM_ERROR_NONE) {
            SYNC_ERR("record_get_int fail");
            return false;
        }
    }
    return true;
}

void checkBook(const CtLocalChange& change, int addressBookId) {
    if (change.addressBookId != addressBookId)
        SYNC_ERR("addressbook_id(%d) : ab_id(%d)?", addressBookId, change.addressBookId);
    SYNC_ASSERT_TEXT(change.addressBookId == addressBookId, "!\"What the hell of this ab_id?\"");
}

int logged(int result, const char* failureText) {
    if (result != kOk) SYNC_ERR_AS("markOne", "%s", failureText);
    return result;
}

// The feed tells of every image since the last walk, also of one that the sync wrote after it: what the row knows is older than that.
bool hasNewImage(const CtLocalChange& change, int knownVersion) {
    if (change.imageChanged == 0) return false;
    ContactsList list;
    contacts_record_h contact = nullptr;
    const int code = contacts_read::readPart(_contacts_contact, CONTACTS_CONTACT_ID, change.itemId,
                                             {CONTACTS_CONTACT_IMAGE_VERSION}, &list, &contact);
    return code != PLATFORM_ERROR_NONE ||
           contacts_read::intOf(contact, CONTACTS_CONTACT_IMAGE_VERSION) > knownVersion;
}

template <class Kind>
int markOne(CtMetaDataDBHelper& store, int addressBookId, const CtLocalChange& change,
            typename Kind::Row* known) {
    if (known != nullptr && known->version == change.version) return kOk;
    if (change.type == RECORD_DELETED) {
        if (known == nullptr) return kOk;
        return logged(Kind::markDeleted(store, change.itemId), "MetaDB update deleted fail");
    }
    if (known != nullptr) {
        known->dirty = 1;
        Kind::noteImage(known, hasNewImage(change, known->version));
        known->version = change.version;
        return logged(Kind::update(store, *known), "MetaDB update dirty fail");
    }
    // A record of the sync that has no row is taken over by the next download, as changed.
    if (change.syncedVersion != 0) return kOk;
    typename Kind::Row row;
    row.*Kind::kId = change.itemId;
    row.addressbook_id = addressBookId;
    row.version = change.version;
    row.dirty = 1;
    Kind::noteImage(&row, change.imageChanged != 0);
    return logged(Kind::insert(store, row), "MetaDB insert fail");
}

}  // namespace

template <class Kind>
int read(int addressBookId, int since, Changes* changes) {
    bool isReadable = true;
    const int code = contacts_read::forEachChange(
        Kind::kFeed, addressBookId, since, &changes->current, [&](contacts_record_h record) {
            CtLocalChange change;
            isReadable = isReadable && readChange(record, std::is_same_v<Kind, CtContactKind>, &change);
            if (!isReadable) return;
            checkBook(change, addressBookId);
            changes->any = true;
            if (!change.isOwnWrite()) changes->foreign.push_back(change);
        });
    if (code != PLATFORM_ERROR_NONE) {
        SYNC_ERR("db_get_changes_by_version fail");
        return kFailed;
    }
    return isReadable ? kOk : kFailed;
}

namespace {

// The changes since the version that is stored for the address book.
template <class Kind>
int readNew(CtMetaDataDBHelper& store, int addressBookId, Changes* changes) {
    int since = 0;
    if (Kind::getLatest(store, addressBookId, &since) != kOk) return kFailed;
    return read<Kind>(addressBookId, since, changes);
}

}  // namespace

template <class Kind>
bool some(CtMetaDataDBHelper& store, int addressBookId) {
    Changes changes;
    return readNew<Kind>(store, addressBookId, &changes) == kOk && !changes.foreign.empty();
}

template <class Kind>
int passOwn(CtMetaDataDBHelper& store, int addressBookId) {
    Changes changes;
    if (readNew<Kind>(store, addressBookId, &changes) != kOk) return kFailed;
    return !changes.any || !changes.foreign.empty()
               ? kOk
               : Kind::updateLatest(store, addressBookId, changes.current);
}

template <class Kind>
int mark(CtMetaDataDBHelper& store, int addressBookId) {
    Changes changes;
    if (readNew<Kind>(store, addressBookId, &changes) != kOk) return kFailed;
    if (!changes.any) return kOk;
    std::vector<typename Kind::Row> rows;
    if (!changes.foreign.empty() && Kind::getAll(store, addressBookId, &rows) != kOk) return kFailed;
    std::unordered_map<int, typename Kind::Row*> known;
    for (typename Kind::Row& row : rows) known.emplace(row.*Kind::kId, &row);

    // The version moves only together with the marks: a walk that was cut off is walked again.
    SyncTransaction transaction(store.database());
    if (!transaction.begun()) return kFailed;
    for (const CtLocalChange& change : changes.foreign) {
        const auto row = known.find(change.itemId);
        typename Kind::Row* knownRow = row != known.end() ? row->second : nullptr;
        if (markOne<Kind>(store, addressBookId, change, knownRow) != kOk) return kFailed;
    }
    if (Kind::updateLatest(store, addressBookId, changes.current) != kOk) return kFailed;
    return transaction.commit();
}

template int read<CtContactKind>(int, int, Changes*);
template int read<CtGroupKind>(int, int, Changes*);
template bool some<CtContactKind>(CtMetaDataDBHelper&, int);
template bool some<CtGroupKind>(CtMetaDataDBHelper&, int);
template int passOwn<CtContactKind>(CtMetaDataDBHelper&, int);
template int passOwn<CtGroupKind>(CtMetaDataDBHelper&, int);
template int mark<CtContactKind>(CtMetaDataDBHelper&, int);
template int mark<CtGroupKind>(CtMetaDataDBHelper&, int);

}  // namespace ct_changes
