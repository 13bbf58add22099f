#include "calendar/CalBookRows.h"

#include "common/RowRead.h"

using row_read::readList;
using row_read::readOne;

namespace {

enum BookColumn { kId, kCalendarId, kAccountId, kVersion, kDirty, kDeleted, kUri, kEtag };

}  // namespace

static void take(const SyncDatabase::Row& row, CalBookMetaData* book) {
    book->id = row.integer(kId);
    book->calendar_id = row.integer(kCalendarId);
    book->account_id = row.integer(kAccountId);
    book->sync_version = row.integer(kVersion);
    book->dirty = row.integer(kDirty);
    book->deleted = row.integer(kDeleted);
    book->uri = row.text(kUri);
    book->etag = row.text(kEtag);
}

CalBookRows::CalBookRows(SyncDatabase* database, std::string table)
    : mpDatabase(database), mTable(std::move(table)) {}

std::string CalBookRows::select(const char* what, const char* condition) const {
    return std::string("SELECT ") + what + " FROM " + mTable + " where " + condition;
}

int CalBookRows::get(int calendarId, CalBookMetaData* row) {
    return readOne(*mpDatabase, select("*", "calendar_id =?"), {calendarId}, row);
}

int CalBookRows::get(int accountId, const std::string& uri, CalBookMetaData* row) {
    return readOne(*mpDatabase, select("*", "uri =? and account_id=?"), {uri, accountId}, row);
}

int CalBookRows::getByUri(const std::string& uri, CalBookMetaData* row) {
    return readOne(*mpDatabase, select("*", "uri =?"), {uri}, row);
}

int CalBookRows::getId(int accountId, const std::string& uri, int* calendarId) {
    return readOne(*mpDatabase, select("calendar_id", "uri =? and account_id=?"), {uri, accountId},
                   calendarId);
}

int CalBookRows::getUri(int calendarId, std::string* uri) {
    return readOne(*mpDatabase, select("uri", "calendar_id =?"), {calendarId}, uri);
}

int CalBookRows::getVersion(int calendarId, int* version) {
    return readOne(*mpDatabase, select("sync_version", "calendar_id =?"), {calendarId}, version);
}

int CalBookRows::getIds(int accountId, std::list<int>* calendarIds) {
    return readList(*mpDatabase, select("calendar_id", "account_id =?"), {accountId}, calendarIds);
}

int CalBookRows::getDirtyIds(int accountId, std::list<int>* calendarIds) {
    return readList(*mpDatabase, select("calendar_id", "account_id =? AND dirty=1 "), {accountId},
                    calendarIds);
}

int CalBookRows::getDeletedIds(int accountId, std::list<int>* calendarIds) {
    return readList(*mpDatabase, select("calendar_id", "account_id =? AND deleted=1 "), {accountId},
                    calendarIds);
}

int CalBookRows::getUris(int accountId, std::list<std::string>* uris) {
    return readList(*mpDatabase, select("uri", "account_id =?"), {accountId}, uris);
}

int CalBookRows::getAccountIds(std::list<int>* accountIds) {
    return readList(*mpDatabase, "SELECT DISTINCT account_id FROM " + mTable + " ", {}, accountIds);
}

int CalBookRows::countPending(const std::string& itemTable, int accountId, int* dirty, int* deleted) {
    return mpDatabase->readRow(
        "SELECT count(CASE WHEN A.dirty=1 AND A.deleted<>1 THEN 1 END), count(CASE WHEN A.deleted=1 THEN 1 "
        "END) FROM " +
            itemTable + " as A INNER JOIN " + mTable +
            " B ON A.calendar_id = B.calendar_id where B.account_id =?",
        {accountId}, [dirty, deleted](const SyncDatabase::Row& row) {
            *dirty = row.integer(0);
            *deleted = row.integer(1);
        });
}

int CalBookRows::insert(const CalBookMetaData& row) {
    return mpDatabase->write(
        "INSERT INTO " + mTable +
            "(calendar_id, account_id, sync_version, dirty, deleted, uri, etag) VALUES(?, ?, ?, ?, ?, ?, ?)",
        {row.calendar_id, row.account_id, row.sync_version, row.dirty, row.deleted, row.uri, row.etag});
}

int CalBookRows::update(const CalBookMetaData& row) {
    return mpDatabase->write(
        "UPDATE " + mTable +
            " SET calendar_id=?, account_id=?, sync_version=?, dirty=?, deleted=?, uri=?, "
            "etag=? WHERE uri=? and account_id=?",
        {row.calendar_id, row.account_id, row.sync_version, row.dirty, row.deleted, row.uri, row.etag,
         row.uri, row.account_id});
}

int CalBookRows::updateUri(int calendarId, const std::string& uri, const std::string& etag) {
    return mpDatabase->write("UPDATE " + mTable + " SET uri=?, etag=? WHERE calendar_id=?",
                             {uri, etag, calendarId});
}

int CalBookRows::set(const char* column, int value, int calendarId) {
    return mpDatabase->write("UPDATE " + mTable + " SET " + column + "=? WHERE calendar_id=?",
                             {value, calendarId});
}

int CalBookRows::updateVersion(int calendarId, int version) {
    return set("sync_version", version, calendarId);
}

int CalBookRows::updateDirty(int calendarId, int dirty) {
    return set("dirty", dirty, calendarId);
}

int CalBookRows::updateDeleted(int calendarId, int deleted) {
    return set("deleted", deleted, calendarId);
}

int CalBookRows::remove(int calendarId) {
    return mpDatabase->write("DELETE FROM " + mTable + " WHERE calendar_id=?", {calendarId});
}

int CalBookRows::remove(int accountId, const std::string& uri) {
    return mpDatabase->write("DELETE FROM " + mTable + " WHERE uri=? and account_id=?", {uri, accountId});
}

int CalBookRows::removeByUri(const std::string& uri) {
    return mpDatabase->write("DELETE FROM " + mTable + " WHERE uri=?", {uri});
}

int CalBookRows::removeAccount(int accountId) {
    return mpDatabase->write("DELETE FROM " + mTable + " WHERE account_id=?", {accountId});
}
