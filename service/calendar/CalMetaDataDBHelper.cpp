#include "calendar/CalMetaDataDBHelper.h"

#include "common/RowRead.h"
#include "common/SyncLog.h"

using row_read::readList;
using row_read::readOne;
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
    // Ours: rows are written by id, and must not be scanned for. Those of a uri are known from a snapshot; an index by uri would
    // cost each upload two more pages.
    "CREATE INDEX es_idx3 ON eventsync_table(event_id);",
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

// Look-ups by uri prefer rows that are no instances.
#define PREFER_ORDINARY " ORDER BY original_event_id <> 0"

}  // namespace

static void take(const Row& row, CalEventMetaData* event) {
    event->id = row.integer(kEvId);
    event->event_id = row.integer(kEvEventId);
    event->calendar_id = row.integer(kEvCalendarId);
    event->version = row.integer(kEvVersion);
    event->dirty = row.integer(kEvDirty);
    event->deleted = row.integer(kEvDeleted);
    event->original_event_id = row.integer(kEvOriginal);
    event->exception_type = row.integer(kEvType);
    event->sequence = row.integer(kEvSequence);
    event->recurrence_id = row.text(kEvRecurrence);
    event->uri = row.text(kEvUri);
    event->etag = row.text(kEvEtag);
}

CalMetaDataDBHelper::CalMetaDataDBHelper()
    : mDatabase(kPath, kSchema), mBooks(&mDatabase, "calendarbooksync_table") {}

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

int CalMetaDataDBHelper::getAllItems(int calendarId, std::vector<CalEventMetaData>* rows) {
    return readList(mDatabase, "SELECT * FROM eventsync_table where calendar_id =?", {calendarId}, rows);
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
    const std::lock_guard lock(mDatabase.mutex());
    // Hardly a row changes its book or its series: the indexes of those columns are left in peace.
    if (const int result = mDatabase.write(
            "UPDATE eventsync_table SET version=?, dirty=?, deleted=?, exception_type=?, sequence=?, "
            "recurrence_id=?, uri=?, etag=? WHERE event_id=? AND calendar_id=? AND original_event_id=?",
            {row.version, row.dirty, row.deleted, row.exception_type, row.sequence, row.recurrence_id,
             row.uri, row.etag, row.event_id, row.calendar_id, row.original_event_id});
        result != kOk || mDatabase.changes() > 0) {
        return result;
    }
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

int CalMetaDataDBHelper::forgetItem(int itemId) {
    return mDatabase.write("DELETE FROM eventsync_table WHERE event_id=?", {itemId});
}

int CalMetaDataDBHelper::getCalendarbookEtag(const std::string& uri, std::string* etag) {
    return readOne(mDatabase, "SELECT etag FROM calendarbooksync_table where uri =?", {uri}, etag);
}
