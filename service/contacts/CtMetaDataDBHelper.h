// CtMetaDataDBHelper: the bookkeeping that links the device's contacts to the provider's feed: per account its address book and
// the versions up to which changes were examined, per contact and group the server's id, etags, version and marks.
// Owner: CtDataManager.   Threads: any; the database's mutex guards every statement.
// Errors: 0 or -1; outputs untouched on failure; a read that finds no row is -1 without a log. Lists are appended to.
//
// Operations that ask by a uri alone cross accounts; the sync uses those bound to an address book.
#pragma once

#include <string>
#include <unordered_map>
#include <vector>

#include "common/SyncDatabase.h"
#include "contacts/CtMetaData.h"

class CtMetaDataDBHelper {
public:
    using UriMap = std::unordered_map<std::string, bool>;  // uri to "seen", false at first

    CtMetaDataDBHelper();

    [[nodiscard]] int openDb() { return mDatabase.openDb(); }

    // --- groups
    [[nodiscard]] int getGroupStarredInMerrow(int addressBookId, int* groupId);
    [[nodiscard]] int getGroupId(const std::string& uri, int addressBookId, int* groupId);
    [[nodiscard]] int getGroupUri(int groupId, std::string* uri);
    [[nodiscard]] int getGroupEtag(const std::string& uri, std::string* etag);
    [[nodiscard]] int getGroupVersion(int groupId, int* version);
    // Without the source and, as of a contact, without the time: these forms read it as seconds, which is not how it is stored.
    [[nodiscard]] int getGroup(int groupId, CtGroupSyncRow* row);
    [[nodiscard]] int getGroup(const std::string& uri, CtGroupSyncRow* row);
    [[nodiscard]] int getAllDirtyGroupIds(int accountId, std::vector<int>* groupIds);
    [[nodiscard]] int getAllDeletedGroupIds(int accountId, std::vector<int>* groupIds);
    [[nodiscard]] int getGroupIds(int accountId, std::vector<int>* groupIds);
    [[nodiscard]] int getAllGroupUri(int accountId, UriMap* uris);
    [[nodiscard]] int insertGroup(const CtGroupSyncRow& row);
    // Neither the starred flag nor the source.
    [[nodiscard]] int updateGroup(const CtGroupSyncRow& row);
    [[nodiscard]] int updateGroupDeleted(int groupId, int deleted);
    [[nodiscard]] int updateGroupDirty(int groupId, int dirty);
    [[nodiscard]] int deleteGroup(const std::string& uri);

    // --- contacts
    [[nodiscard]] int getContactId(const std::string& uri, int* contactId);
    [[nodiscard]] int getContactUri(int contactId, std::string* uri);
    [[nodiscard]] int getContactEtag(const std::string& uri, std::string* etag);
    [[nodiscard]] int getContactVersion(int contactId, int* version);
    [[nodiscard]] int getContactPhotoEtag(const std::string& uri, std::string* etag);
    [[nodiscard]] int getContactPhotoDirty(int contactId, int* imageDirty);
    [[nodiscard]] int getContact(int contactId, CtContactSyncRow* row);
    // Without the photo's etag.
    [[nodiscard]] int getContact(const std::string& uri, CtContactSyncRow* row);
    [[nodiscard]] int getAllDirtyContactIds(int accountId, std::vector<int>* contactIds);
    [[nodiscard]] int getAllDeletedContactIds(int accountId, std::vector<int>* contactIds);
    [[nodiscard]] int getAllContactUri(int accountId, UriMap* uris);
    [[nodiscard]] int insertContact(const CtContactSyncRow& row);
    [[nodiscard]] int updateContact(const CtContactSyncRow& row);
    // Marks the image as dirty too.
    [[nodiscard]] int updateContactDeleted(int contactId, int deleted);
    [[nodiscard]] int updateContactDirty(int contactId, int dirty, int imageDirty);
    // Removes the contact's row.
    [[nodiscard]] int removeContactPhotoEtag(int contactId);
    [[nodiscard]] int deleteContact(const std::string& uri);

    // --- address books
    [[nodiscard]] int getAllAccountIds(std::vector<int>* accountIds);
    [[nodiscard]] int getAddressBookId(int accountId, int* addressBookId);
    [[nodiscard]] int getLatestContactVersion(int addressBookId, int* version);
    [[nodiscard]] int getLatestGroupVersion(int addressBookId, int* version);
    [[nodiscard]] int updateLatestContactVersion(int addressBookId, int version);
    [[nodiscard]] int updateLatestGroupVersion(int addressBookId, int version);
    [[nodiscard]] int insertAddressBook(int accountId, int addressBookId);
    // The rows of its contacts and groups follow by trigger.
    [[nodiscard]] int deleteAddressBook(int addressBookId);

    // --- bound to an address book
    // All rows, read once for a comparison, a change walk or an upload; the time text as it is stored.
    [[nodiscard]] int getAllContacts(int addressBookId, std::vector<CtContactSyncRow>* rows);
    [[nodiscard]] int getAllGroups(int addressBookId, std::vector<CtGroupSyncRow>* rows);
    // One row with its time text as it is stored, to be written back; the group without its source.
    [[nodiscard]] int getStoredContact(int contactId, CtContactSyncRow* row);
    [[nodiscard]] int getStoredGroup(int groupId, CtGroupSyncRow* row);
    // A row by the id of its record.
    [[nodiscard]] int forgetContact(int contactId);
    [[nodiscard]] int forgetGroup(int groupId);
    // Dirty and deleted rows of contacts and groups together.
    [[nodiscard]] int countPending(int accountId, int* dirty, int* deleted);

    // For SyncTransaction: one transaction over several writes.
    SyncDatabase& database() { return mDatabase; }

private:
    SyncDatabase mDatabase;
};
