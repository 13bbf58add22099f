#include "contacts/CtDataManager.h"

#include <utility>

#include "common/SyncLog.h"
#include "contacts/CtGroupMap.h"
#include "contacts/CtItemWriter.h"
#include "contacts/GroupComposer.h"
#include "platform/contacts_read.h"

using contacts_read::intOf;
using contacts_read::textOf;
using sync_result::kFailed;
using sync_result::kOk;

namespace {

// Part of the address book's name. Not the account's own server: that may change its address, and the contacts stay.
constexpr const char* kNameBase = "https://contacts.provider.example/m8/feeds";

std::string addressBookName(int accountId) {
    return std::string(kNameBase) + "/" + std::to_string(accountId);
}

}  // namespace

CtDataManager& CtDataManager::getInstance() {
    static CtDataManager* const instance = new CtDataManager;
    return *instance;
}

CtDataManager::~CtDataManager() {
    if (!mIsPrepared) return;
    contacts_db_remove_changed_cb(_contacts_contact, changedContactCallback, this);
    contacts_db_remove_changed_cb(_contacts_group, changedGroupCallback, this);
    contacts_disconnect();
}

int CtDataManager::prepareSync() {
    const std::lock_guard lock(mPrepareMutex);
    if (mIsPrepared) return kOk;
    if (contacts_connect_with_flags(0) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("contacts_connect fail");
        return kFailed;
    }
    if (contacts_db_add_changed_cb(_contacts_contact, changedContactCallback, this) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("add_changed_cb fail");
        contacts_disconnect();
        return kFailed;
    }
    if (contacts_db_add_changed_cb(_contacts_group, changedGroupCallback, this) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("add_changed_cb fail");
        contacts_db_remove_changed_cb(_contacts_contact, changedContactCallback, this);
        contacts_disconnect();
        return kFailed;
    }
    return prepareStore();
}

int CtDataManager::prepareStore() {
    auto store = std::make_unique<CtMetaDataDBHelper>();
    if (store->openDb() != kOk) {
        SYNC_ERR("MetaDB fail");
        contacts_db_remove_changed_cb(_contacts_contact, changedContactCallback, this);
        contacts_db_remove_changed_cb(_contacts_group, changedGroupCallback, this);
        contacts_disconnect();
        return kFailed;
    }
    mpMetaData = std::move(store);
    mIsPrepared = true;
    return kOk;
}

bool CtDataManager::isDBPrepared() const {
    if (mIsPrepared) return true;
    if (mpMetaData) {
        SYNC_ERR("the prepared flag doesn't match with value.");
    } else {
        SYNC_ERR("DB haven't prepared yet");
    }
    return false;
}

// --- address books

int CtDataManager::inspectVacancy(int accountId, const std::string& name) {
    if (!isDBPrepared()) return kFailed;
    contacts_query_h rawQuery = nullptr;
    if (contacts_query_create(_contacts_address_book, &rawQuery) != PLATFORM_ERROR_NONE) return kFailed;
    const ContactsQuery query(rawQuery);
    if (contacts_query_add_filter_int(rawQuery, CONTACTS_ADDRESS_BOOK_ACCOUNT_ID, accountId) !=
        PLATFORM_ERROR_NONE) {
        SYNC_ERR("Invalid parameter : contacts_filter_add_int is failed");
        return kFailed;
    }
    if (contacts_query_add_filter_str(rawQuery, CONTACTS_ADDRESS_BOOK_NAME, name.c_str()) !=
        PLATFORM_ERROR_NONE) {
        SYNC_ERR("Invalid parameter : contacts_filter_add_str is failed");
        return kFailed;
    }
    contacts_list_h rawList = nullptr;
    if (contacts_db_get_records_with_query(rawQuery, 0, 1, &rawList) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("SEARCH FAILED -> Contacts Service Failure");
        return kFailed;
    }
    const ContactsList list(rawList);
    int found = 0;
    contacts_read::forEach(
        rawList, [&found](contacts_record_h book) { found = intOf(book, CONTACTS_ADDRESS_BOOK_ID); });
    return found;
}

int CtDataManager::createAddressBook(int accountId, const std::string& name, int* addressBookId) {
    contacts_record_h raw = nullptr;
    if (const int code = contacts_record_create(_contacts_address_book, &raw); code != PLATFORM_ERROR_NONE) {
        SYNC_ERR("contacts_record_create(_contacts_address_book._uri) failed(%d) !!", code);
        return kFailed;
    }
    const ContactsRecord book(raw);
    int code = contacts_record_set_int(raw, CONTACTS_ADDRESS_BOOK_ACCOUNT_ID, accountId);
    if (code == PLATFORM_ERROR_NONE) code = contacts_record_set_int(raw, CONTACTS_ADDRESS_BOOK_MODE, 0);
    if (code == PLATFORM_ERROR_NONE)
        code = contacts_record_set_str(raw, CONTACTS_ADDRESS_BOOK_NAME, name.c_str());
    if (code == PLATFORM_ERROR_NONE) code = contacts_db_insert_record(raw, addressBookId, {.by_sync = true});
    if (code == PLATFORM_ERROR_NONE) return kOk;
    SYNC_ERR("contacts_db_insert_record(_contacts_address_book._uri) failed(%d) !!", code);
    return kFailed;
}

int CtDataManager::addAccount(int accountId) {
    if (!isDBPrepared()) return kFailed;
    const std::string name = addressBookName(accountId);
    int addressBookId = inspectVacancy(accountId, name);
    if (addressBookId < 0) {
        SYNC_ERR("Error occurred when finding available address book id!");
        return kFailed;
    }
    if (addressBookId == 0 && createAddressBook(accountId, name, &addressBookId) != kOk) return kFailed;
    int known = 0;
    const bool hasRow = mpMetaData->getAddressBookId(accountId, &known) == kOk;
    if (hasRow && known == addressBookId) return kOk;
    // An address book that was deleted on the device: its rows go, the next download makes its contacts again.
    if (hasRow) {
        SYNC_ERR("the address book(%d) of account(%d) is gone, it is made again", known, accountId);
        if (mpMetaData->deleteAddressBook(known) != kOk) return kFailed;
    }
    if (const int code = mpMetaData->insertAddressBook(accountId, addressBookId); code != kOk)
        SYNC_ERR("metaDB insertAddressBook fail(%d)", code);
    return kOk;
}

int CtDataManager::getAddressBookId(int accountId, int* addressBookId) {
    return forward("getAddressBookId fail", &CtMetaDataDBHelper::getAddressBookId, accountId, addressBookId);
}

int CtDataManager::deleteAccount(int accountId) {
    int addressBookId = 0;
    if (getAddressBookId(accountId, &addressBookId) != kOk) return kFailed;
    const int code = contacts_db_delete_record(_contacts_address_book, addressBookId, {.by_sync = true});
    if (code != PLATFORM_ERROR_NONE && code != PLATFORM_ERROR_NOT_FOUND) {
        SYNC_ERR("db_delete_record fail");
        return kFailed;
    }
    if (const int result = mpMetaData->deleteAddressBook(addressBookId); result != kOk) {
        SYNC_ERR("metaDB deleteAddressBook fail(%d)", result);
        return kFailed;
    }
    forgetPending(accountId);
    const std::lock_guard lock(mPendingMutex);
    mPending.erase(addressBookId);
    return kOk;
}

// --- groups

namespace {

// The group's row as the server has it, for the single forms.
CtGroupItem groupItem(int addressBookId, const std::string& name, const std::string& etag,
                      const std::string& updated, const std::string& uri) {
    CtGroupItem item;
    item.entry = std::make_shared<GroupInfo>();
    item.entry->id = uri;
    item.entry->title = name;
    item.row.addressbook_id = addressBookId;
    item.row.starred = name == ct_wire::kStarredGroup ? 1 : 0;
    item.row.uri = uri;
    item.row.etag = etag;
    item.row.updated = updated;
    return item;
}

}  // namespace

int CtDataManager::insertGroup(int accountId, const std::string& name, const std::string& etag,
                               const std::string& updated, const std::string& uri, const std::string& source,
                               const std::string& systemId, bool isReadOnly) {
    int addressBookId = 0;
    if (getAddressBookId(accountId, &addressBookId) != kOk) return kFailed;
    std::vector<CtGroupItem> items;
    items.push_back(groupItem(addressBookId, name, etag, updated, uri));
    items[0].entry->isSystem = isReadOnly;
    items[0].entry->systemId = systemId;
    items[0].row.source = source;
    return CtItemWriter(mpMetaData.get(), addressBookId).writeGroups(&items);
}

int CtDataManager::updateGroup(int accountId, const std::string& name, const std::string& etag,
                               const std::string& updated, const std::string& uri) {
    int addressBookId = 0;
    int groupId = 0;
    contacts_record_h raw = nullptr;
    if (getAddressBookId(accountId, &addressBookId) != kOk ||
        getGroupId(uri, addressBookId, &groupId) != kOk ||
        contacts_db_get_record(_contacts_group, groupId, &raw) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("metaDB updateGroup fail");
        return kFailed;
    }
    const ContactsRecord record(raw);
    std::vector<CtGroupItem> items;
    items.push_back(groupItem(addressBookId, name, etag, updated, uri));
    items[0].entry->isSystem = intOf(raw, CONTACTS_GROUP_IS_READ_ONLY) != 0;
    items[0].entry->systemId = textOf(raw, CONTACTS_GROUP_SYSTEM_ID);
    items[0].row.group_id = groupId;
    items[0].rowWrite = CtRowWrite::kUpdate;
    return CtItemWriter(mpMetaData.get(), addressBookId).writeGroups(&items);
}

int CtDataManager::deleteGroup(int accountId, const std::string& uri) {
    int addressBookId = 0;
    CtGroupSyncRow row;
    int removed = 0;
    if (getAddressBookId(accountId, &addressBookId) != kOk ||
        getGroupId(uri, addressBookId, &row.group_id) != kOk ||
        CtItemWriter(mpMetaData.get(), addressBookId).remove<CtGroupKind>({row}, {kAnyVersion}, &removed) !=
            kOk) {
        SYNC_ERR("metaDB deleteGroup fail");
        return kFailed;
    }
    return kOk;
}

int CtDataManager::updateGroupEtag(int groupId, const std::string& etag) {
    std::string uri;
    return getGroupUri(groupId, &uri) == kOk ? updateGroupUri(groupId, uri, etag) : kFailed;
}

int CtDataManager::updateGroupUri(int groupId, const std::string& uri, const std::string& etag) {
    if (!isDBPrepared()) return kFailed;
    CtGroupSyncRow row;
    if (mpMetaData->getStoredGroup(groupId, &row) != kOk) {
        SYNC_ERR("get fail");
        return kFailed;
    }
    row.uri = uri;
    row.etag = etag;
    if (mpMetaData->updateGroup(row) == kOk) return kOk;
    SYNC_ERR("metaDB updateGroupEtag fail");
    return kFailed;
}

int CtDataManager::getGroupData(int groupId, std::string* entry, std::string* etag, int* version) {
    CtGroupSyncRow row;
    contacts_record_h raw = nullptr;
    if (!isDBPrepared()) return kFailed;
    if (mpMetaData->getGroup(groupId, &row) != kOk) {
        SYNC_ERR("get fail %d", groupId);
        return kFailed;
    }
    if (contacts_db_get_record(_contacts_group, groupId, &raw) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("db_get_record fail");
        return kFailed;
    }
    const ContactsRecord record(raw);
    const bool isKnown = !row.uri.empty();
    std::string text =
        GroupComposer::compose(textOf(raw, CONTACTS_GROUP_NAME), isKnown ? row.etag : std::string());
    if (text.empty()) return kFailed;
    *entry = std::move(text);
    *etag = row.etag;
    *version = intOf(raw, CONTACTS_GROUP_VERSION);
    return kOk;
}

int CtDataManager::getGroupUri(int groupId, std::string* uri) {
    return forwardById(&CtMetaDataDBHelper::getGroupUri, groupId, uri);
}

int CtDataManager::getGroupId(const std::string& uri, int addressBookId, int* groupId) {
    return forward("get fail", &CtMetaDataDBHelper::getGroupId, uri, addressBookId, groupId);
}

int CtDataManager::getGroupStarredInMerrow(int addressBookId, int* groupId) {
    return forwardById(&CtMetaDataDBHelper::getGroupStarredInMerrow, addressBookId, groupId);
}

int CtDataManager::getAllDirtyGroupIds(int accountId, std::vector<int>* groupIds) {
    return forward("metaDB getAllDirtyGroupIds fail", &CtMetaDataDBHelper::getAllDirtyGroupIds, accountId,
                   groupIds);
}

int CtDataManager::getAllDeletedGroupIds(int accountId, std::vector<int>* groupIds) {
    return forward("metaDB getAllDeletedGroupIds fail", &CtMetaDataDBHelper::getAllDeletedGroupIds, accountId,
                   groupIds);
}

int CtDataManager::getAllGroupUri(int accountId, UriMap* uris) {
    return forward("metaDB getAllGroupUri Map fail", &CtMetaDataDBHelper::getAllGroupUri, accountId, uris);
}

int CtDataManager::clearDirtyGroup(int groupId) {
    return forward("metaDB updateGroupDirty fail", &CtMetaDataDBHelper::updateGroupDirty, groupId, 0);
}

int CtDataManager::clearDeletedGroup(int groupId) {
    return forward("metaDB updateGroupDeleted fail", &CtMetaDataDBHelper::updateGroupDeleted, groupId, 0);
}
