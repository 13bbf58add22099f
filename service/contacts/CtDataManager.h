// CtDataManager: the provider's contacts and groups in the device's contacts service: the connection to it, one address book per
// account, the metadata store kept in step with every write, and the detection of local changes.
// Owner: process-wide, made on first use, never destroyed.   Threads: sync workers and the main loop (change callbacks); the
// stores' own locks serialise them, mPendingMutex guards the pending flags.
// Errors: 0 or -1, each failure logged; outputs untouched on failure. Everything but prepareSync() fails until that succeeded.
//
// Operations that ask by a uri alone cross accounts; the sync uses those bound to an account.
#pragma once

#include <atomic>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "contacts/CtBulkItem.h"
#include "contacts/CtMetaDataDBHelper.h"
#include "platform/contacts.h"

// A contact as it would be sent.
struct CtContactData {
    std::string entry;
    std::string etag;
    int version = 0;
    std::string photoPath;  // of its first image, empty when it has none
};

class CtDataManager {
public:
    using UriMap = CtMetaDataDBHelper::UriMap;

    static CtDataManager& getInstance();

    CtDataManager() = default;
    ~CtDataManager();
    CtDataManager(const CtDataManager&) = delete;
    CtDataManager& operator=(const CtDataManager&) = delete;

    // Main thread. Later calls return at once.
    [[nodiscard]] int prepareSync();
    [[nodiscard]] bool isDBPrepared() const;
    // NULL until prepared.
    [[nodiscard]] CtMetaDataDBHelper* metaData() const { return mIsPrepared ? mpMetaData.get() : nullptr; }

    // --- address books
    // The id of the first match, 0 when there is none, -1 on failure.
    [[nodiscard]] int inspectVacancy(int accountId, const std::string& name);
    // Makes the account's address book and its row, or uses those that are there.
    [[nodiscard]] int addAccount(int accountId);
    [[nodiscard]] int deleteAccount(int accountId);
    [[nodiscard]] int getAddressBookId(int accountId, int* addressBookId);

    // --- groups
    [[nodiscard]] int insertGroup(int accountId, const std::string& name, const std::string& etag,
                                  const std::string& updated, const std::string& uri,
                                  const std::string& source, const std::string& systemId, bool isReadOnly);
    [[nodiscard]] int updateGroup(int accountId, const std::string& name, const std::string& etag,
                                  const std::string& updated, const std::string& uri);
    [[nodiscard]] int deleteGroup(int accountId, const std::string& uri);
    [[nodiscard]] int updateGroupEtag(int groupId, const std::string& etag);
    [[nodiscard]] int updateGroupUri(int groupId, const std::string& uri, const std::string& etag);
    // The group's Atom entry.
    [[nodiscard]] int getGroupData(int groupId, std::string* entry, std::string* etag, int* version);
    [[nodiscard]] int getGroupUri(int groupId, std::string* uri);
    [[nodiscard]] int getGroupId(const std::string& uri, int addressBookId, int* groupId);
    [[nodiscard]] int getGroupStarredInMerrow(int addressBookId, int* groupId);
    [[nodiscard]] int getAllDirtyGroupIds(int accountId, std::vector<int>* groupIds);
    [[nodiscard]] int getAllDeletedGroupIds(int accountId, std::vector<int>* groupIds);
    [[nodiscard]] int getAllGroupUri(int accountId, UriMap* uris);
    [[nodiscard]] int clearDirtyGroup(int groupId);
    [[nodiscard]] int clearDeletedGroup(int groupId);

    // --- contacts
    // Bulk forms. What was left out is taken out of the vector, the rows of the rest are as stored.
    [[nodiscard]] int insertContacts(int accountId, std::vector<BulkItem>* items);
    // Of known contacts, found by uri.
    [[nodiscard]] int updateContacts(int accountId, std::vector<BulkItem>* items);
    // Both and rows alone, one transaction in each store.
    [[nodiscard]] int writeContacts(int accountId, CtContactBatch* batch);
    [[nodiscard]] int insertContactJSON(int accountId, BulkItem item);
    [[nodiscard]] int updateContactJSON(int accountId, BulkItem item);
    [[nodiscard]] int deleteContact(int accountId, const std::string& uri);
    [[nodiscard]] int parseJson2Record(const std::string& entryText, int addressBookId, ContactsRecord* out);
    // `feedBase` is the account's contacts feed base.
    [[nodiscard]] int getContactData(int contactId, const std::string& feedBase, CtContactData* out);
    [[nodiscard]] int getContactData(const std::string& uri, const std::string& feedBase, CtContactData* out);
    [[nodiscard]] int updateContactEtag(const std::string& uri, const std::string& etag);
    [[nodiscard]] int updateContactUriEtag(int contactId, const std::string& uri, const std::string& etag,
                                           const std::string& updated, const std::string& photoEtag);
    [[nodiscard]] int getContactUri(int contactId, std::string* uri);
    [[nodiscard]] int getContactId(const std::string& uri, int* contactId);
    [[nodiscard]] int getAllDirtyContactIds(int accountId, std::vector<int>* contactIds);
    [[nodiscard]] int getAllDeletedContactIds(int accountId, std::vector<int>* contactIds);
    [[nodiscard]] int getAllContactUri(int accountId, UriMap* uris);
    [[nodiscard]] int clearDirtyContact(int contactId);
    // Leaves the image marked, as the deletion did.
    [[nodiscard]] int clearDeletedContact(int contactId);

    // --- local changes
    [[nodiscard]] int markContactChanged(int addressBookId);
    [[nodiscard]] int markGroupChanged(int addressBookId);
    // After a run, of contacts and groups: a user's change made meanwhile is left for the callback that tells of it.
    [[nodiscard]] int passOwnWrites(int addressBookId);
    // Whether there is a change that is not the sync's own.
    [[nodiscard]] bool setContactChanged(int addressBookId);
    [[nodiscard]] bool setGroupChanged(int addressBookId);
    // Marks the account's changes; from here on its change callback asks for an upload again.
    [[nodiscard]] int setAccountChanged(int accountId);
    // Marks that wait, or changes not examined yet.
    [[nodiscard]] bool hasSomethingToSend(int accountId);
    [[nodiscard]] int countPending(int accountId, int* dirty, int* deleted);
    // The request that a change callback made for the account will not be carried out.
    void forgetPending(int accountId);

    static void changedContactCallback(const char* view, void* userData);
    static void changedGroupCallback(const char* view, void* userData);

private:
    friend struct CtDataManagerProbe;  // lets a test see what is pending

    // Forwards to the store; a failure is logged as `failureText`.
    template <class... Params, class... Args>
    int forward(const char* failureText, int (CtMetaDataDBHelper::*call)(Params...), Args&&... args);
    // The same for a read by an id, which the log names.
    template <class Out>
    int forwardById(int (CtMetaDataDBHelper::*call)(int, Out*), int id, Out* out);
    [[nodiscard]] int prepareStore();
    [[nodiscard]] int createAddressBook(int accountId, const std::string& name, int* addressBookId);
    void requestUploads(bool (CtDataManager::*isChanged)(int), bool usesPending);

    std::mutex mPrepareMutex;
    std::atomic<bool> mIsPrepared = false;  // set once, after what it speaks of
    std::unique_ptr<CtMetaDataDBHelper> mpMetaData;
    std::mutex mPendingMutex;
    std::map<int, bool>
        mPending;  // by address book: an upload was begun or queued and has not looked yet; guarded by mPendingMutex
};

template <class... Params, class... Args>
int CtDataManager::forward(const char* failureText, int (CtMetaDataDBHelper::*call)(Params...),
                           Args&&... args) {
    if (!isDBPrepared()) return sync_result::kFailed;
    const int result = (*mpMetaData.*call)(std::forward<Args>(args)...);
    if (result != sync_result::kOk && failureText != nullptr) SYNC_ERR("%s", failureText);
    return result;
}

template <class Out>
int CtDataManager::forwardById(int (CtMetaDataDBHelper::*call)(int, Out*), int id, Out* out) {
    if (!isDBPrepared()) return sync_result::kFailed;
    const int result = (*mpMetaData.*call)(id, out);
    if (result != sync_result::kOk) SYNC_ERR("get fail %d", id);
    return result;
}
