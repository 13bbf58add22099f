#include "contacts/CtMetaDataDBHelper.h"

#include "common/RowRead.h"

using row_read::readList;
using row_read::readOne;
using sync_result::kOk;
using Row = SyncDatabase::Row;

namespace {

constexpr const char* kPath = "/opt/usr/dbspace/.vantor_pim_sync_contacts.db";

constexpr const char* kSchema[] = {
    "CREATE TABLE address_book(id INTEGER PRIMARY KEY AUTOINCREMENT, addressbook_id INTEGER UNIQUE, "
    "account_id "
    "INTEGER UNIQUE, contact_last_sync_version INTEGER, group_last_sync_version INTEGER );CREATE INDEX "
    "a_idx1 ON "
    "address_book(id);CREATE INDEX a_idx2 ON address_book(addressbook_id);CREATE INDEX a_idx3 ON "
    "address_book(account_id);",
    "CREATE TABLE contact_sync_table(id INTEGER PRIMARY KEY AUTOINCREMENT, contact_id INTEGER UNIQUE, "
    "addressbook_id INTEGER, version INTEGER, dirty INTEGER, image_dirty INTEGER, deleted INTEGER, uri TEXT, "
    "etag "
    "TEXT, source TEXT, updated INTEGER, photo_etag TEXT, UNIQUE(contact_id, addressbook_id), "
    "UNIQUE(contact_id, "
    "version), UNIQUE(contact_id, uri), UNIQUE(id, uri) );CREATE INDEX c_idx1 ON "
    "contact_sync_table(id);CREATE "
    "INDEX c_idx2 ON contact_sync_table(contact_id);CREATE INDEX c_idx3 ON "
    "contact_sync_table(addressbook_id);",
    "CREATE TABLE group_sync_table(id INTEGER PRIMARY KEY AUTOINCREMENT, group_id INTEGER UNIQUE, "
    "addressbook_id "
    "INTEGER, version INTEGER, dirty INTEGER, deleted INTEGER, uri TEXT, etag TEXT, source TEXT, updated "
    "INTEGER, "
    "starred INTEGER, UNIQUE(group_id, addressbook_id), UNIQUE(group_id, version), UNIQUE(group_id, uri), "
    "UNIQUE(id, uri) );CREATE INDEX g_idx1 ON group_sync_table(id);CREATE INDEX g_idx2 ON "
    "group_sync_table(group_id);CREATE INDEX g_idx3 ON group_sync_table(addressbook_id);",
    "CREATE TRIGGER trg_del AFTER DELETE ON address_book BEGIN   DELETE FROM contact_sync_table WHERE "
    "addressbook_id = old.addressbook_id;   DELETE FROM group_sync_table WHERE addressbook_id = "
    "old.addressbook_id; END;",
};

#define CT_STORED_TIME "strftime('%Y-%m-%dT%H:%M:%fZ', ?)"
#define CT_READ_TIME "strftime('%Y-%m-%dT%H:%M:%fZ', updated, 'unixepoch') "
constexpr const char* kGroupColumns =
    "SELECT group_id, addressbook_id, starred, version, dirty, deleted, uri, etag, " CT_READ_TIME
    " FROM group_sync_table where ";
constexpr const char* kContactColumns =
    "SELECT contact_id, addressbook_id, version, dirty, image_dirty, deleted, uri, etag, "
    "photo_etag, " CT_READ_TIME " FROM contact_sync_table where ";
// Rows as they are stored, the time text included, for whoever writes them back.
constexpr const char* kStoredGroups =
    "SELECT group_id, addressbook_id, starred, version, dirty, deleted, uri, etag, updated, source FROM "
    "group_sync_table where ";
constexpr const char* kStoredContacts =
    "SELECT contact_id, addressbook_id, version, dirty, image_dirty, deleted, uri, etag, photo_etag, updated "
    "FROM contact_sync_table where ";

// The ids of an account's rows.
std::string ofAccount(const std::string& column, const std::string& table, const std::string& condition) {
    return "SELECT A." + column + " FROM " + table +
           " as A INNER JOIN address_book B ON A.addressbook_id = B.addressbook_id where B.account_id =? " +
           condition;
}

}  // namespace

static void take(const Row& row, CtGroupSyncRow* group) {
    int column = 0;
    for (int CtGroupSyncRow::*field :
         {&CtGroupSyncRow::group_id, &CtGroupSyncRow::addressbook_id, &CtGroupSyncRow::starred,
          &CtGroupSyncRow::version, &CtGroupSyncRow::dirty, &CtGroupSyncRow::deleted}) {
        group->*field = row.integer(column++);
    }
    for (std::string CtGroupSyncRow::*field :
         {&CtGroupSyncRow::uri, &CtGroupSyncRow::etag, &CtGroupSyncRow::updated}) {
        group->*field = row.text(column++);
    }
}

static void take(const Row& row, CtContactSyncRow* contact) {
    int column = 0;
    for (int CtContactSyncRow::*field :
         {&CtContactSyncRow::contact_id, &CtContactSyncRow::addressbook_id, &CtContactSyncRow::version,
          &CtContactSyncRow::dirty, &CtContactSyncRow::image_dirty, &CtContactSyncRow::deleted}) {
        contact->*field = row.integer(column++);
    }
    for (std::string CtContactSyncRow::*field : {&CtContactSyncRow::uri, &CtContactSyncRow::etag,
                                                 &CtContactSyncRow::photo_etag, &CtContactSyncRow::updated}) {
        contact->*field = row.text(column++);
    }
}

CtMetaDataDBHelper::CtMetaDataDBHelper() : mDatabase(kPath, kSchema, "Database is not opened", "contact") {}

// --- groups

int CtMetaDataDBHelper::getGroupStarredInMerrow(int addressBookId, int* groupId) {
    return readOne(mDatabase,
                   "SELECT group_id FROM group_sync_table where starred = 1 and addressbook_id = ?",
                   {addressBookId}, groupId);
}

int CtMetaDataDBHelper::getGroupId(const std::string& uri, int addressBookId, int* groupId) {
    return readOne(mDatabase, "SELECT group_id FROM group_sync_table where uri =? and addressbook_id = ?",
                   {uri, addressBookId}, groupId);
}

int CtMetaDataDBHelper::getGroupUri(int groupId, std::string* uri) {
    return readOne(mDatabase, "SELECT uri FROM group_sync_table where group_id =?", {groupId}, uri);
}

int CtMetaDataDBHelper::getGroupEtag(const std::string& uri, std::string* etag) {
    return readOne(mDatabase, "SELECT etag FROM group_sync_table where uri =?", {uri}, etag);
}

int CtMetaDataDBHelper::getGroupVersion(int groupId, int* version) {
    return readOne(mDatabase, "SELECT version FROM group_sync_table where group_id =?", {groupId}, version);
}

int CtMetaDataDBHelper::getGroup(int groupId, CtGroupSyncRow* row) {
    return readOne(mDatabase, std::string(kGroupColumns) + "group_id =?", {groupId}, row);
}

int CtMetaDataDBHelper::getGroup(const std::string& uri, CtGroupSyncRow* row) {
    return readOne(mDatabase, std::string(kGroupColumns) + "uri =?", {uri}, row);
}

int CtMetaDataDBHelper::getAllDirtyGroupIds(int accountId, std::vector<int>* groupIds) {
    return readList(mDatabase, ofAccount("group_id", "group_sync_table", "AND A.dirty=1"), {accountId},
                    groupIds);
}

int CtMetaDataDBHelper::getAllDeletedGroupIds(int accountId, std::vector<int>* groupIds) {
    return readList(mDatabase, ofAccount("group_id", "group_sync_table", "AND A.deleted=1"), {accountId},
                    groupIds);
}

int CtMetaDataDBHelper::getGroupIds(int accountId, std::vector<int>* groupIds) {
    return readList(mDatabase, ofAccount("group_id", "group_sync_table", ""), {accountId}, groupIds);
}

int CtMetaDataDBHelper::getAllGroupUri(int accountId, UriMap* uris) {
    return mDatabase.readAll(ofAccount("uri", "group_sync_table", ""), {accountId},
                             [uris](const Row& row) { uris->emplace(row.text(0), false); });
}

int CtMetaDataDBHelper::insertGroup(const CtGroupSyncRow& row) {
    return mDatabase.write(
        "INSERT INTO group_sync_table(group_id, addressbook_id, starred, version, dirty, deleted, uri, etag, "
        "updated, source) VALUES(?, ?, ?, ?, ?, ?, ?, ?, " CT_STORED_TIME ", ?)",
        {row.group_id, row.addressbook_id, row.starred, row.version, row.dirty, row.deleted, row.uri,
         row.etag, row.updated, row.source});
}

int CtMetaDataDBHelper::updateGroup(const CtGroupSyncRow& row) {
    return mDatabase.write(
        "UPDATE group_sync_table SET addressbook_id=?, version=?, dirty=?, deleted=?, uri=?, etag=?, "
        "updated=" CT_STORED_TIME " WHERE group_id =?",
        {row.addressbook_id, row.version, row.dirty, row.deleted, row.uri, row.etag, row.updated,
         row.group_id});
}

int CtMetaDataDBHelper::updateGroupDeleted(int groupId, int deleted) {
    return mDatabase.write("UPDATE group_sync_table SET deleted=? WHERE group_id=?", {deleted, groupId});
}

int CtMetaDataDBHelper::updateGroupDirty(int groupId, int dirty) {
    return mDatabase.write("UPDATE group_sync_table SET dirty=? WHERE group_id=?", {dirty, groupId});
}

int CtMetaDataDBHelper::deleteGroup(const std::string& uri) {
    return mDatabase.write("DELETE FROM group_sync_table WHERE uri=?", {uri});
}

// --- contacts

int CtMetaDataDBHelper::getContactId(const std::string& uri, int* contactId) {
    return readOne(mDatabase, "SELECT contact_id FROM contact_sync_table where uri =?", {uri}, contactId);
}

int CtMetaDataDBHelper::getContactUri(int contactId, std::string* uri) {
    return readOne(mDatabase, "SELECT uri FROM contact_sync_table where contact_id =?", {contactId}, uri);
}

int CtMetaDataDBHelper::getContactEtag(const std::string& uri, std::string* etag) {
    return readOne(mDatabase, "SELECT etag FROM contact_sync_table where uri =?", {uri}, etag);
}

int CtMetaDataDBHelper::getContactVersion(int contactId, int* version) {
    return readOne(mDatabase, "SELECT version FROM contact_sync_table where contact_id =?", {contactId},
                   version);
}

int CtMetaDataDBHelper::getContactPhotoEtag(const std::string& uri, std::string* etag) {
    return readOne(mDatabase, "SELECT photo_etag FROM contact_sync_table where uri =?", {uri}, etag);
}

int CtMetaDataDBHelper::getContactPhotoDirty(int contactId, int* imageDirty) {
    return readOne(mDatabase, "SELECT image_dirty FROM contact_sync_table where contact_id =?", {contactId},
                   imageDirty);
}

int CtMetaDataDBHelper::getContact(int contactId, CtContactSyncRow* row) {
    return readOne(mDatabase, std::string(kContactColumns) + "contact_id =?", {contactId}, row);
}

int CtMetaDataDBHelper::getContact(const std::string& uri, CtContactSyncRow* row) {
    CtContactSyncRow found;
    const int result = readOne(mDatabase, std::string(kContactColumns) + "uri =?", {uri}, &found);
    if (result != kOk) return result;
    *row = found;
    row->photo_etag.clear();
    return result;
}

int CtMetaDataDBHelper::getAllDirtyContactIds(int accountId, std::vector<int>* contactIds) {
    return readList(mDatabase, ofAccount("contact_id", "contact_sync_table", "AND A.dirty=1"), {accountId},
                    contactIds);
}

int CtMetaDataDBHelper::getAllDeletedContactIds(int accountId, std::vector<int>* contactIds) {
    return readList(mDatabase, ofAccount("contact_id", "contact_sync_table", "AND A.deleted=1"), {accountId},
                    contactIds);
}

int CtMetaDataDBHelper::getAllContactUri(int accountId, UriMap* uris) {
    return mDatabase.readAll(ofAccount("uri", "contact_sync_table", ""), {accountId},
                             [uris](const Row& row) { uris->emplace(row.text(0), false); });
}

int CtMetaDataDBHelper::insertContact(const CtContactSyncRow& row) {
    return mDatabase.write(
        "INSERT INTO contact_sync_table(contact_id, addressbook_id, version, dirty, image_dirty, deleted, "
        "uri, etag, "
        "photo_etag, updated) VALUES(?, ?, ?, ?, ?, ?, ?, ?, ?, " CT_STORED_TIME ")",
        {row.contact_id, row.addressbook_id, row.version, row.dirty, row.image_dirty, row.deleted, row.uri,
         row.etag, row.photo_etag, row.updated});
}

int CtMetaDataDBHelper::updateContact(const CtContactSyncRow& row) {
    return mDatabase.write(
        "UPDATE contact_sync_table SET addressbook_id=?, version=?, dirty=?, image_dirty=?, deleted=?, "
        "uri=?, "
        "etag=?, photo_etag=?, updated=" CT_STORED_TIME " WHERE contact_id=?",
        {row.addressbook_id, row.version, row.dirty, row.image_dirty, row.deleted, row.uri, row.etag,
         row.photo_etag, row.updated, row.contact_id});
}

int CtMetaDataDBHelper::updateContactDeleted(int contactId, int deleted) {
    return mDatabase.write("UPDATE contact_sync_table SET deleted=?, image_dirty=1 WHERE contact_id=?",
                           {deleted, contactId});
}

int CtMetaDataDBHelper::updateContactDirty(int contactId, int dirty, int imageDirty) {
    return mDatabase.write("UPDATE contact_sync_table SET dirty=?, image_dirty=? WHERE contact_id=?",
                           {dirty, imageDirty, contactId});
}

int CtMetaDataDBHelper::removeContactPhotoEtag(int contactId) {
    return forgetContact(contactId);
}

int CtMetaDataDBHelper::deleteContact(const std::string& uri) {
    return mDatabase.write("DELETE FROM contact_sync_table WHERE uri=?", {uri});
}

// --- address books

int CtMetaDataDBHelper::getAllAccountIds(std::vector<int>* accountIds) {
    return readList(mDatabase, "SELECT DISTINCT account_id FROM address_book ", {}, accountIds);
}

int CtMetaDataDBHelper::getAddressBookId(int accountId, int* addressBookId) {
    return readOne(mDatabase, "SELECT addressbook_id FROM address_book where account_id =?", {accountId},
                   addressBookId);
}

int CtMetaDataDBHelper::getLatestContactVersion(int addressBookId, int* version) {
    return readOne(mDatabase, "SELECT contact_last_sync_version FROM address_book where addressbook_id =?",
                   {addressBookId}, version);
}

int CtMetaDataDBHelper::getLatestGroupVersion(int addressBookId, int* version) {
    return readOne(mDatabase, "SELECT group_last_sync_version FROM address_book where addressbook_id =?",
                   {addressBookId}, version);
}

int CtMetaDataDBHelper::updateLatestContactVersion(int addressBookId, int version) {
    return mDatabase.write("UPDATE address_book SET contact_last_sync_version=? WHERE addressbook_id=?",
                           {version, addressBookId});
}

int CtMetaDataDBHelper::updateLatestGroupVersion(int addressBookId, int version) {
    return mDatabase.write("UPDATE address_book SET group_last_sync_version=? WHERE addressbook_id=?",
                           {version, addressBookId});
}

int CtMetaDataDBHelper::insertAddressBook(int accountId, int addressBookId) {
    return mDatabase.write(
        "INSERT INTO address_book(addressbook_id, account_id, contact_last_sync_version, "
        "group_last_sync_version) VALUES(?, ?, ?, ?)",
        {addressBookId, accountId, 0, 0});
}

int CtMetaDataDBHelper::deleteAddressBook(int addressBookId) {
    return mDatabase.write("DELETE FROM address_book WHERE addressbook_id=?", {addressBookId});
}

// --- bound to an address book

int CtMetaDataDBHelper::getAllContacts(int addressBookId, std::vector<CtContactSyncRow>* rows) {
    return readList(mDatabase, std::string(kStoredContacts) + "addressbook_id =?", {addressBookId}, rows);
}

int CtMetaDataDBHelper::getAllGroups(int addressBookId, std::vector<CtGroupSyncRow>* rows) {
    std::vector<CtGroupSyncRow> found;
    const int result = mDatabase.readAll(std::string(kStoredGroups) + "addressbook_id =?", {addressBookId},
                                         [&found](const Row& row) {
                                             constexpr int kSource = 9;
                                             take(row, &found.emplace_back());
                                             found.back().source = row.text(kSource);
                                         });
    if (result == kOk) rows->insert(rows->end(), found.begin(), found.end());
    return result;
}

int CtMetaDataDBHelper::getStoredContact(int contactId, CtContactSyncRow* row) {
    return readOne(mDatabase, std::string(kStoredContacts) + "contact_id =?", {contactId}, row);
}

int CtMetaDataDBHelper::getStoredGroup(int groupId, CtGroupSyncRow* row) {
    return readOne(mDatabase, std::string(kStoredGroups) + "group_id =?", {groupId}, row);
}

int CtMetaDataDBHelper::forgetContact(int contactId) {
    return mDatabase.write("DELETE FROM contact_sync_table where contact_id =?", {contactId});
}

int CtMetaDataDBHelper::forgetGroup(int groupId) {
    return mDatabase.write("DELETE FROM group_sync_table WHERE group_id=?", {groupId});
}

int CtMetaDataDBHelper::countPending(int accountId, int* dirty, int* deleted) {
    struct Source {
        const char* table;
        const char* isDirty;
    };
    constexpr Source kSources[] = {{"contact_sync_table", "(A.dirty=1 OR A.image_dirty=1)"},
                                   {"group_sync_table", "A.dirty=1"}};
    int sums[2] = {};
    for (const Source& source : kSources) {
        const int result = mDatabase.readRow(
            std::string("SELECT count(CASE WHEN ") + source.isDirty +
                " AND A.deleted<>1 THEN 1 END), count(CASE WHEN A.deleted=1 THEN 1 END) FROM " +
                source.table +
                " as A INNER JOIN address_book B ON A.addressbook_id = B.addressbook_id where B.account_id "
                "=?",
            {accountId}, [&sums](const Row& row) {
                sums[0] += row.integer(0);
                sums[1] += row.integer(1);
            });
        if (result != kOk) return result;
    }
    *dirty = sums[0];
    *deleted = sums[1];
    return kOk;
}
