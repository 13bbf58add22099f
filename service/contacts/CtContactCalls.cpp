// The half of CtDataManager that is about contacts and about what was changed on the device.
#include <utility>

#include "common/SyncLog.h"
#include "common/SyncService.h"
#include "contacts/CtDataManager.h"
#include "contacts/CtGroupMap.h"
#include "contacts/CtItemWriter.h"
#include "contacts/CtLocalChanges.h"
#include "contacts/CtRecordRead.h"
#include "platform/contacts_read.h"

using contacts_read::intOf;
using sync_result::kFailed;
using sync_result::kOk;

int CtDataManager::writeContacts(int accountId, CtContactBatch* batch) {
    int addressBookId = 0;
    if (getAddressBookId(accountId, &addressBookId) != kOk) return kFailed;
    for (std::vector<BulkItem>* items : {&batch->inserts, &batch->updates}) {
        for (BulkItem& item : *items) item.row.addressbook_id = addressBookId;
    }
    return CtItemWriter(mpMetaData.get(), addressBookId).writeContacts(batch);
}

int CtDataManager::insertContacts(int accountId, std::vector<BulkItem>* items) {
    CtContactBatch batch;
    batch.inserts = std::move(*items);
    const int result = writeContacts(accountId, &batch);
    *items = std::move(batch.inserts);
    return result;
}

int CtDataManager::updateContacts(int accountId, std::vector<BulkItem>* items) {
    int addressBookId = 0;
    std::vector<CtContactSyncRow> rows;
    if (getAddressBookId(accountId, &addressBookId) != kOk) return kFailed;
    if (mpMetaData->getAllContacts(addressBookId, &rows) != kOk) return kFailed;
    std::unordered_map<std::string, int> known;
    for (const CtContactSyncRow& row : rows) known.emplace(row.uri, row.contact_id);
    for (BulkItem& item : *items) {
        const auto found = known.find(item.row.uri);
        if (found == known.end()) {
            SYNC_ERR("get fail");
            return kFailed;
        }
        item.row.contact_id = found->second;
        item.rowWrite = CtRowWrite::kUpdate;
    }
    CtContactBatch batch;
    batch.updates = std::move(*items);
    const int result = writeContacts(accountId, &batch);
    *items = std::move(batch.updates);
    return result;
}

int CtDataManager::insertContactJSON(int accountId, BulkItem item) {
    std::vector<BulkItem> items;
    items.push_back(std::move(item));
    return insertContacts(accountId, &items) == kOk && !items.empty() ? kOk : kFailed;
}

int CtDataManager::updateContactJSON(int accountId, BulkItem item) {
    std::vector<BulkItem> items;
    items.push_back(std::move(item));
    return updateContacts(accountId, &items) == kOk && !items.empty() ? kOk : kFailed;
}

int CtDataManager::deleteContact(int accountId, const std::string& uri) {
    int addressBookId = 0;
    std::vector<CtContactSyncRow> rows;
    int removed = 0;
    if (getAddressBookId(accountId, &addressBookId) != kOk ||
        mpMetaData->getAllContacts(addressBookId, &rows) != kOk)
        return kFailed;
    std::erase_if(rows, [&uri](const CtContactSyncRow& row) { return row.uri != uri; });
    const std::vector<int> versions(rows.size(), kAnyVersion);
    if (!rows.empty() &&
        CtItemWriter(mpMetaData.get(), addressBookId).remove<CtContactKind>(rows, versions, &removed) ==
            kOk) {
        return kOk;
    }
    SYNC_ERR("metaDB deleteContact fail");
    return kFailed;
}

int CtDataManager::parseJson2Record(const std::string& entryText, int addressBookId, ContactsRecord* out) {
    CtGroupMap groups;
    if (!isDBPrepared() || groups.load(*mpMetaData, addressBookId) != kOk) return kFailed;
    try {
        return groups.converter().convert(entryText, out, addressBookId, /*withPhoto=*/true);
    } catch (const JsonException& error) {
        SYNC_ERR("Handle this execption! (%s)", error.what());
        return kFailed;
    }
}

int CtDataManager::getContactData(int contactId, const std::string& feedBase, CtContactData* out) {
    CtContactSyncRow row;
    if (!isDBPrepared()) return kFailed;
    if (mpMetaData->getContact(contactId, &row) != kOk) {
        SYNC_ERR("get fail");
        return kFailed;
    }
    contacts_record_h raw = nullptr;
    CtGroupMap groups;
    if (contacts_db_get_record(_contacts_contact, contactId, &raw) != PLATFORM_ERROR_NONE ||
        groups.load(*mpMetaData, row.addressbook_id) != kOk) {
        SYNC_ERR("db_get_record fail");
        return kFailed;
    }
    const ContactsRecord record(raw);
    CtContactData data;
    data.etag = row.uri.empty() ? std::string() : row.etag;
    data.version = intOf(raw, CONTACTS_CONTACT_VERSION);
    data.entry = groups.composer(feedBase).compose(raw, data.etag);
    data.photoPath = ct_record::imageOf(raw);
    *out = std::move(data);
    return kOk;
}

int CtDataManager::getContactData(const std::string& uri, const std::string& feedBase, CtContactData* out) {
    CtContactSyncRow item;
    if (!isDBPrepared()) return kFailed;
    if (mpMetaData->getContact(uri, &item) != kOk) {
        SYNC_ERR("get fail");
        return kFailed;
    }
    SYNC_ASSERT_TEXT(item.uri == uri, "item.uri == uri");
    return getContactData(item.contact_id, feedBase, out);
}

int CtDataManager::updateContactEtag(const std::string& uri, const std::string& etag) {
    CtContactSyncRow row;
    if (!isDBPrepared()) return kFailed;
    if (mpMetaData->getContact(uri, &row) != kOk ||
        mpMetaData->getStoredContact(row.contact_id, &row) != kOk) {
        SYNC_ERR("get fail");
        return kFailed;
    }
    row.etag = etag;
    if (mpMetaData->updateContact(row) == kOk) return kOk;
    SYNC_ERR("metaDB updateContactEtag fail");
    return kFailed;
}

int CtDataManager::updateContactUriEtag(int contactId, const std::string& uri, const std::string& etag,
                                        const std::string& updated, const std::string& photoEtag) {
    CtContactSyncRow row;
    if (!isDBPrepared()) return kFailed;
    if (mpMetaData->getContact(contactId, &row) == kOk) {
        row.uri = uri;
        row.etag = etag;
        row.updated = updated;
        row.photo_etag = photoEtag;
        if (mpMetaData->updateContact(row) == kOk) return kOk;
    }
    SYNC_ERR("metaDB updateContact fail");
    return kFailed;
}

int CtDataManager::getContactUri(int contactId, std::string* uri) {
    return forwardById(&CtMetaDataDBHelper::getContactUri, contactId, uri);
}

int CtDataManager::getContactId(const std::string& uri, int* contactId) {
    return forward("get fail", &CtMetaDataDBHelper::getContactId, uri, contactId);
}

int CtDataManager::getAllDirtyContactIds(int accountId, std::vector<int>* contactIds) {
    return forward("metaDB getAllDirtyContactIds fail", &CtMetaDataDBHelper::getAllDirtyContactIds, accountId,
                   contactIds);
}

int CtDataManager::getAllDeletedContactIds(int accountId, std::vector<int>* contactIds) {
    return forward("metaDB getAllDeletedContactIds fail", &CtMetaDataDBHelper::getAllDeletedContactIds,
                   accountId, contactIds);
}

int CtDataManager::getAllContactUri(int accountId, UriMap* uris) {
    return forward("metaDB getAllContactUri Map fail", &CtMetaDataDBHelper::getAllContactUri, accountId,
                   uris);
}

int CtDataManager::clearDirtyContact(int contactId) {
    return forward("metaDB updateContactDirty fail", &CtMetaDataDBHelper::updateContactDirty, contactId, 0,
                   0);
}

int CtDataManager::clearDeletedContact(int contactId) {
    return forward("metaDB updateContactDeleted fail", &CtMetaDataDBHelper::updateContactDeleted, contactId,
                   0);
}

// --- local changes

int CtDataManager::markContactChanged(int addressBookId) {
    return isDBPrepared() ? ct_changes::mark<CtContactKind>(*mpMetaData, addressBookId) : kFailed;
}

int CtDataManager::markGroupChanged(int addressBookId) {
    return isDBPrepared() ? ct_changes::mark<CtGroupKind>(*mpMetaData, addressBookId) : kFailed;
}

int CtDataManager::passOwnWrites(int addressBookId) {
    if (!isDBPrepared()) return kFailed;
    const int contacts = ct_changes::passOwn<CtContactKind>(*mpMetaData, addressBookId);
    const int groups = ct_changes::passOwn<CtGroupKind>(*mpMetaData, addressBookId);
    return contacts == kOk ? groups : contacts;
}

bool CtDataManager::setContactChanged(int addressBookId) {
    return isDBPrepared() && ct_changes::some<CtContactKind>(*mpMetaData, addressBookId);
}

bool CtDataManager::setGroupChanged(int addressBookId) {
    return isDBPrepared() && ct_changes::some<CtGroupKind>(*mpMetaData, addressBookId);
}

int CtDataManager::setAccountChanged(int accountId) {
    int addressBookId = 0;
    if (getAddressBookId(accountId, &addressBookId) != kOk) return kFailed;
    forgetPending(accountId);
    const int contacts = markContactChanged(addressBookId);
    if (contacts != kOk) SYNC_ERR("markContactChanged fail[%d]", addressBookId);
    const int groups = markGroupChanged(addressBookId);
    if (groups != kOk) SYNC_ERR("markGroupChanged fail[%d]", addressBookId);
    return contacts == kOk && groups == kOk ? kOk : kFailed;
}

void CtDataManager::forgetPending(int accountId) {
    int addressBookId = 0;
    if (!mIsPrepared || mpMetaData->getAddressBookId(accountId, &addressBookId) != kOk) return;
    const std::lock_guard lock(mPendingMutex);
    mPending[addressBookId] = false;
}

bool CtDataManager::hasSomethingToSend(int accountId) {
    int addressBookId = 0;
    int dirty = 0;
    int deleted = 0;
    if (!mIsPrepared || mpMetaData->getAddressBookId(accountId, &addressBookId) != kOk) return false;
    if (countPending(accountId, &dirty, &deleted) == kOk && dirty + deleted > 0) return true;
    return setContactChanged(addressBookId) || setGroupChanged(addressBookId);
}

int CtDataManager::countPending(int accountId, int* dirty, int* deleted) {
    return forward(nullptr, &CtMetaDataDBHelper::countPending, accountId, dirty, deleted);
}

void CtDataManager::requestUploads(bool (CtDataManager::*isChanged)(int), bool usesPending) {
    std::vector<int> accountIds;
    if (mpMetaData->getAllAccountIds(&accountIds) != kOk) return;
    for (const int accountId : accountIds) {
        int addressBookId = 0;
        if (getAddressBookId(accountId, &addressBookId) != kOk) return;
        const std::lock_guard lock(mPendingMutex);
        if (usesPending && mPending[addressBookId]) continue;
        if (!(this->*isChanged)(addressBookId)) continue;
        const bool isTaken =
            SyncService::getInstance().requestUpSync(accountId, VANTOR_PIM_SYNC_TYPE_CONTACTS);
        if (usesPending && isTaken) mPending[addressBookId] = true;
    }
}

void CtDataManager::changedContactCallback(const char* /*view*/, void* userData) {
    auto* self = static_cast<CtDataManager*>(userData);
    if (self == nullptr || self->metaData() == nullptr) {
        SYNC_ERR("fail");
        return;
    }
    self->requestUploads(&CtDataManager::setContactChanged, /*usesPending=*/true);
}

void CtDataManager::changedGroupCallback(const char* /*view*/, void* userData) {
    auto* self = static_cast<CtDataManager*>(userData);
    if (self == nullptr || self->metaData() == nullptr) {
        SYNC_ERR("fail");
        return;
    }
    self->requestUploads(&CtDataManager::setGroupChanged, /*usesPending=*/false);
}
