#include "calendar/CalMetaDataDBHelper.h"

#include "common/SyncLog.h"

using sync_result::kFailed;
using sync_result::kOk;
using Row = SyncDatabase::Row;

namespace {

constexpr const char* kPath = "/opt/usr/dbspace/.vantor_pim_sync_calendar.db";

constexpr const char* kSchema[] = {
    "CREATE TABLE calendarbooksync_table(id INTEGER PRIMARY KEY AUTOINCREMENT, calendar_id INTEGER UNIQUE, "
    "account_id "
    "INTEGER, sync_version INTEGER, dirty INTEGER, deleted INTEGER, uri TEXT, etag TEXT );",
    "CREATE TABLE eventsync_table(id INTEGER PRIMARY KEY AUTOINCREMENT, event_id INTEGER, calendar_id "
    "INTEGER, version "
    "INTEGER, dirty INTEGER, deleted INTEGER, original_event_id INTEGER, exception_type INTEGER, sequence "
    "INTEGER, "
    "recurrence_id TEXT, uri TEXT, etag TEXT );",
    "CREATE TRIGGER trg_cal_del AFTER DELETE ON calendarbooksync_table BEGIN   DELETE FROM eventsync_table "
    "WHERE "
    "calendar_id = old.calendar_id; END;",
    "CREATE TRIGGER trg_event_del AFTER DELETE ON eventsync_table BEGIN   DELETE FROM eventsync_table WHERE "
    "original_event_id = old.event_id; END;",
    "CREATE INDEX es_idx1 ON eventsync_table(calendar_id);CREATE INDEX es_idx2 ON "
    "eventsync_table(original_event_id);",
    // Ours: a page looks rows up by id and by uri, and must not scan the table for each.
    "CREATE INDEX es_idx3 ON eventsync_table(event_id);CREATE INDEX es_idx4 ON eventsync_table(uri, "
    "calendar_id);",
};

// Columns of the whole-row reads, in table order.
enum EventColumn {
    kEvId,
    kEvEventId,
    kEvCalendarId,
    kEvVersion,
    kEvDirty,
    kEvDeleted,
    kEvOriginal,
    kEvType,
    kEvSequence,
    kEvRecurrence,
    kEvUri,
    kEvEtag
};
enum BookColumn { kBkId, kBkCalendarId, kBkAccountId, kBkVersion, kBkDirty, kBkDeleted, kBkUri, kBkEtag };

// Look-ups by uri prefer rows that are no instances.
#define PREFER_ORDINARY " ORDER BY original_event_id <> 0"

CalEventMetaData eventOf(const Row& row) {
    CalEventMetaData event;
    event.id = row.integer(kEvId);
    event.event_id = row.integer(kEvEventId);
    event.calendar_id = row.integer(kEvCalendarId);
    event.version = row.integer(kEvVersion);
    event.dirty = row.integer(kEvDirty);
    event.deleted = row.integer(kEvDeleted);
    event.original_event_id = row.integer(kEvOriginal);
    event.exception_type = row.integer(kEvType);
    event.sequence = row.integer(kEvSequence);
    event.recurrence_id = row.text(kEvRecurrence);
    event.uri = row.text(kEvUri);
    event.etag = row.text(kEvEtag);
    return event;
}

CalBookMetaData bookOf(const Row& row) {
    CalBookMetaData book;
    book.id = row.integer(kBkId);
    book.calendar_id = row.integer(kBkCalendarId);
    book.account_id = row.integer(kBkAccountId);
    book.sync_version = row.integer(kBkVersion);
    book.dirty = row.integer(kBkDirty);
    book.deleted = row.integer(kBkDeleted);
    book.uri = row.text(kBkUri);
    book.etag = row.text(kBkEtag);
    return book;
}

// Single values and lists of the first column.
void take(const Row& row, int* value) {
    *value = row.integer(0);
}
void take(const Row& row, std::string* value) {
    *value = row.text(0);
}
void take(const Row& row, CalEventMetaData* value) {
    *value = eventOf(row);
}
void take(const Row& row, CalBookMetaData* value) {
    *value = bookOf(row);
}

template <class Value>
int readOne(SyncDatabase& database, const char* sql, SyncDatabase::Params params, Value* out) {
    return database.readRow(sql, params, [out](const Row& row) { take(row, out); });
}

template <class List>
int readList(SyncDatabase& database, const char* sql, SyncDatabase::Params params, List* out) {
    List found;
    const int result = database.readAll(sql, params, [&found](const Row& row) {
        found.emplace_back();
        take(row, &found.back());
    });
    if (result != kOk) return result;
    out->insert(out->end(), found.begin(), found.end());
    return kOk;
}

}  // namespace

CalMetaDataDBHelper::CalMetaDataDBHelper() : mDatabase(kPath, kSchema) {}

// --- events: reads

int CalMetaDataDBHelper::hasExceptionEvent(int originalEventId) {
    int count = 0;
    const int result = mDatabase.readAll("SELECT id FROM eventsync_table where original_event_id = ? ",
                                         {originalEventId}, [&count](const Row&) { ++count; });
    return result == kOk ? count : kFailed;
}

int CalMetaDataDBHelper::getEventId(int calendarId, const std::string& uri, int* eventId) {
    return readOne(mDatabase,
                   "SELECT event_id FROM eventsync_table where uri =? and calendar_id=?" PREFER_ORDINARY,
                   {uri, calendarId}, eventId);
}

int CalMetaDataDBHelper::getEventUri(int eventId, std::string* uri) {
    return readOne(mDatabase, "SELECT uri FROM eventsync_table where event_id =?", {eventId}, uri);
}

int CalMetaDataDBHelper::getEventEtag(int eventId, std::string* etag) {
    return readOne(mDatabase, "SELECT etag FROM eventsync_table where event_id=?", {eventId}, etag);
}

int CalMetaDataDBHelper::getEventEtag(int calendarId, const std::string& uri, std::string* etag) {
    return readOne(mDatabase,
                   "SELECT etag FROM eventsync_table where uri =? and calendar_id=?" PREFER_ORDINARY,
                   {uri, calendarId}, etag);
}

int CalMetaDataDBHelper::getEventVersion(int eventId, int* version) {
    return readOne(mDatabase, "SELECT version FROM eventsync_table where event_id =?", {eventId}, version);
}

int CalMetaDataDBHelper::getEvent(const CalInstanceKey& instance, CalEventMetaData* row) {
    return readOne(mDatabase,
                   "SELECT * FROM eventsync_table where original_event_id =? AND recurrence_id = ?",
                   {instance.original_event_id, instance.recurrence_id}, row);
}

int CalMetaDataDBHelper::getEvent(int eventId, CalEventMetaData* row) {
    return readOne(mDatabase, "SELECT * FROM eventsync_table where event_id =?", {eventId}, row);
}

int CalMetaDataDBHelper::getEvent(int calendarId, const std::string& uri, CalEventMetaData* row) {
    return readOne(mDatabase, "SELECT * FROM eventsync_table where uri =? and calendar_id=?" PREFER_ORDINARY,
                   {uri, calendarId}, row);
}

int CalMetaDataDBHelper::getAllExceptionEvents(int originalEventId, std::list<std::string>* recurrenceIds) {
    return readList(mDatabase, "SELECT recurrence_id FROM eventsync_table where original_event_id =? ",
                    {originalEventId}, recurrenceIds);
}

int CalMetaDataDBHelper::getAllDirtyEventIds(const std::string& bookUri, std::list<int>* eventIds) {
    return readList(
        mDatabase,
        "SELECT A.event_id FROM eventsync_table as A INNER JOIN calendarbooksync_table B ON A.calendar_id = "
        "B.calendar_id where B.uri =? AND A.dirty=1",
        {bookUri}, eventIds);
}

int CalMetaDataDBHelper::getAllDeletedEventIds(const std::string& bookUri, std::list<int>* eventIds) {
    return readList(
        mDatabase,
        "SELECT A.event_id FROM eventsync_table as A INNER JOIN calendarbooksync_table B ON A.calendar_id = "
        "B.calendar_id where B.uri =? AND A.deleted=1",
        {bookUri}, eventIds);
}

int CalMetaDataDBHelper::getAllEventUri(const std::string& bookUri, std::list<std::string>* uris) {
    return readList(
        mDatabase,
        "SELECT A.uri FROM eventsync_table as A INNER JOIN calendarbooksync_table B ON A.calendar_id = "
        "B.calendar_id where B.uri =? ",
        {bookUri}, uris);
}

int CalMetaDataDBHelper::getAllEvents(int calendarId, std::vector<CalEventMetaData>* rows) {
    return readList(mDatabase, "SELECT * FROM eventsync_table where calendar_id =?", {calendarId}, rows);
}

int CalMetaDataDBHelper::countPending(int accountId, int* dirty, int* deleted) {
    return mDatabase.readRow(
        "SELECT count(CASE WHEN A.dirty=1 AND A.deleted<>1 THEN 1 END), count(CASE WHEN A.deleted=1 THEN 1 "
        "END) FROM "
        "eventsync_table as A INNER JOIN calendarbooksync_table B ON A.calendar_id = B.calendar_id where "
        "B.account_id =?",
        {accountId}, [dirty, deleted](const Row& row) {
            *dirty = row.integer(0);
            *deleted = row.integer(1);
        });
}

// --- events: writes

int CalMetaDataDBHelper::insertEvent(const CalEventMetaData& row) {
    return mDatabase.write(
        "INSERT INTO eventsync_table(event_id, calendar_id, version, dirty, deleted, original_event_id, "
        "exception_type, "
        "sequence, recurrence_id, uri, etag) VALUES(?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?)",
        {row.event_id, row.calendar_id, row.version, row.dirty, row.deleted, row.original_event_id,
         row.exception_type, row.sequence, row.recurrence_id, row.uri, row.etag});
}

int CalMetaDataDBHelper::updateEvent(const CalEventMetaData& row) {
    return mDatabase.write(
        "UPDATE eventsync_table SET event_id=?, calendar_id=?, version=?, dirty=?, deleted=?, "
        "original_event_id=?, "
        "exception_type=?, sequence=?, recurrence_id=?, uri=?, etag=? WHERE event_id=? ",
        {row.event_id, row.calendar_id, row.version, row.dirty, row.deleted, row.original_event_id,
         row.exception_type, row.sequence, row.recurrence_id, row.uri, row.etag, row.event_id});
}

int CalMetaDataDBHelper::updateExceptionEvent(const CalEventMetaData& row) {
    return mDatabase.write(
        "UPDATE eventsync_table SET event_id=?, calendar_id=?, version=?, dirty=?, deleted=?, "
        "original_event_id=?, "
        "exception_type=?, sequence=?, recurrence_id=?, uri=?, etag=? WHERE recurrence_id=? AND "
        "original_event_id = ? ",
        {row.event_id, row.calendar_id, row.version, row.dirty, row.deleted, row.original_event_id,
         row.exception_type, row.sequence, row.recurrence_id, row.uri, row.etag, row.recurrence_id,
         row.original_event_id});
}

int CalMetaDataDBHelper::updateEventDirty(int eventId, int dirty) {
    SyncTransaction transaction(mDatabase);
    if (!transaction.begun()) {
        SYNC_ERR("begin trans fail");
        return kFailed;
    }
    int sequence = 0;
    if (readOne(mDatabase, "SELECT sequence FROM eventsync_table where event_id =?", {eventId}, &sequence) !=
        kOk) {
        return kFailed;
    }
    if (mDatabase.write("UPDATE eventsync_table SET dirty=? ,sequence=? WHERE event_id=?",
                        {dirty, sequence, eventId}) != kOk) {
        return kFailed;
    }
    return transaction.commit();
}

int CalMetaDataDBHelper::updateEventDeleted(int eventId, int deleted) {
    return mDatabase.write("UPDATE eventsync_table SET deleted=? WHERE event_id=?", {deleted, eventId});
}

int CalMetaDataDBHelper::deleteEvent(int calendarId, const std::string& uri) {
    return mDatabase.write("DELETE FROM eventsync_table WHERE uri=? and calendar_id=?", {uri, calendarId});
}

// --- calendars: reads

int CalMetaDataDBHelper::getCalendarbookId(int accountId, const std::string& uri, int* calendarId) {
    return readOne(mDatabase, "SELECT calendar_id FROM calendarbooksync_table where uri =? and account_id=?",
                   {uri, accountId}, calendarId);
}

int CalMetaDataDBHelper::getCalendarbookUri(int calendarId, std::string* uri) {
    return readOne(mDatabase, "SELECT uri FROM calendarbooksync_table where calendar_id =?", {calendarId},
                   uri);
}

int CalMetaDataDBHelper::getCalendarbook(int calendarId, CalBookMetaData* row) {
    return readOne(mDatabase, "SELECT * FROM calendarbooksync_table where calendar_id =?", {calendarId}, row);
}

int CalMetaDataDBHelper::getCalendarbook(int accountId, const std::string& uri, CalBookMetaData* row) {
    return readOne(mDatabase, "SELECT * FROM calendarbooksync_table where uri =? and account_id=?",
                   {uri, accountId}, row);
}

int CalMetaDataDBHelper::getCalendarbookVersion(int calendarId, int* version) {
    return readOne(mDatabase, "SELECT sync_version FROM calendarbooksync_table where calendar_id =?",
                   {calendarId}, version);
}

int CalMetaDataDBHelper::getCalendarbookEtag(const std::string& uri, std::string* etag) {
    return readOne(mDatabase, "SELECT etag FROM calendarbooksync_table where uri =?", {uri}, etag);
}

namespace {

constexpr const char* kBookIds = "SELECT calendar_id FROM calendarbooksync_table where account_id =?";

}  // namespace

int CalMetaDataDBHelper::getCalendarbookIds(int accountId, std::list<int>* calendarIds) {
    return readList(mDatabase, kBookIds, {accountId}, calendarIds);
}

int CalMetaDataDBHelper::getAllCalendarbookIds(int accountId, std::list<int>* calendarIds) {
    return readList(mDatabase, kBookIds, {accountId}, calendarIds);
}

int CalMetaDataDBHelper::getAllDirtyCalendarbookIds(int accountId, std::list<int>* calendarIds) {
    return readList(mDatabase,
                    "SELECT calendar_id FROM calendarbooksync_table where account_id =? AND dirty=1 ",
                    {accountId}, calendarIds);
}

int CalMetaDataDBHelper::getAllDeletedCalendarbookIds(int accountId, std::list<int>* calendarIds) {
    return readList(mDatabase,
                    "SELECT calendar_id FROM calendarbooksync_table where account_id =? AND deleted=1 ",
                    {accountId}, calendarIds);
}

int CalMetaDataDBHelper::getAllCalendarbookUri(int accountId, std::list<std::string>* uris) {
    return readList(mDatabase, "SELECT uri FROM calendarbooksync_table where account_id =?", {accountId},
                    uris);
}

int CalMetaDataDBHelper::getAllAccountIds(std::list<int>* accountIds) {
    return readList(mDatabase, "SELECT DISTINCT account_id FROM calendarbooksync_table ", {}, accountIds);
}

// --- calendars: writes

int CalMetaDataDBHelper::insertCalendarbook(const CalBookMetaData& row) {
    return mDatabase.write(
        "INSERT INTO calendarbooksync_table(calendar_id, account_id, sync_version, dirty, deleted, uri, "
        "etag) VALUES(?, ?, "
        "?, ?, ?, ?, ?)",
        {row.calendar_id, row.account_id, row.sync_version, row.dirty, row.deleted, row.uri, row.etag});
}

int CalMetaDataDBHelper::updateCalendarbook(const CalBookMetaData& row) {
    return mDatabase.write(
        "UPDATE calendarbooksync_table SET calendar_id=?, account_id=?, sync_version=?, dirty=?, deleted=?, "
        "uri=?, etag=? "
        "WHERE uri=? and account_id=?",
        {row.calendar_id, row.account_id, row.sync_version, row.dirty, row.deleted, row.uri, row.etag,
         row.uri, row.account_id});
}

int CalMetaDataDBHelper::updateCalendarbookUri(int calendarId, const std::string& uri,
                                               const std::string& etag) {
    return mDatabase.write("UPDATE calendarbooksync_table SET uri=?, etag=? WHERE calendar_id=?",
                           {uri, etag, calendarId});
}

int CalMetaDataDBHelper::updateCalendarbookVersion(int calendarId, int version) {
    return mDatabase.write("UPDATE calendarbooksync_table SET sync_version=? WHERE calendar_id=?",
                           {version, calendarId});
}

int CalMetaDataDBHelper::updateCalendarbookDirty(int calendarId, int dirty) {
    return mDatabase.write("UPDATE calendarbooksync_table SET dirty=? WHERE calendar_id=?",
                           {dirty, calendarId});
}

int CalMetaDataDBHelper::updateCalendarbookDeleted(int calendarId, int deleted) {
    return mDatabase.write("UPDATE calendarbooksync_table SET deleted=? WHERE calendar_id=?",
                           {deleted, calendarId});
}

int CalMetaDataDBHelper::deleteCalendarbook(int accountId, const std::string& uri) {
    return mDatabase.write("DELETE FROM calendarbooksync_table WHERE uri=? and account_id=?",
                           {uri, accountId});
}

int CalMetaDataDBHelper::deleteAccount(int accountId) {
    return mDatabase.write("DELETE FROM calendarbooksync_table WHERE account_id=?", {accountId});
}
