// CalMetaDataDBHelper: the calendar sync bookkeeping: which server resource (uri, etag) a calendar or event of the device
// corresponds to, the change version last seen, and the dirty and deleted marks.
// Owner: CalDataManager, process-wide, made on first use, never destroyed.   Threads: any; the database's mutex
// guards every statement.   Units: version = change version of the calendar service.
// Errors: 0 or -1; outputs untouched on failure; a read that finds no row is -1 without a log. Lists are appended to.
//
// Look-ups by an event's uri prefer rows that are no instances: an instance found locally carries its series' uri until it
// has been sent. Operations that ask by a uri alone cross accounts; the sync uses those bound to a book or account.
#pragma once

#include <list>
#include <string>
#include <vector>

#include "calendar/CalItemStore.h"
#include "calendar/CalMetaData.h"
#include "common/SyncDatabase.h"

class CalMetaDataDBHelper : public CalItemStore {
public:
    CalMetaDataDBHelper();
    [[nodiscard]] int openDb() { return mDatabase.openDb(); }

    // --- events: reads
    [[nodiscard]] int hasExceptionEvent(int originalEventId);  // the number of rows, -1 on error
    [[nodiscard]] int getEventId(int calendarId, const std::string& uri, int* eventId);
    [[nodiscard]] int getEventUri(int eventId, std::string* uri);
    [[nodiscard]] int getEventEtag(int eventId, std::string* etag);
    [[nodiscard]] int getEventEtag(int calendarId, const std::string& uri, std::string* etag);
    [[nodiscard]] int getEventVersion(int eventId, int* version);
    [[nodiscard]] int getEvent(const CalInstanceKey& instance, CalEventMetaData* row);
    [[nodiscard]] int getEvent(int eventId, CalEventMetaData* row);
    [[nodiscard]] int getEvent(int calendarId, const std::string& uri, CalEventMetaData* row);
    [[nodiscard]] int getAllExceptionEvents(int originalEventId, std::list<std::string>* recurrenceIds);
    [[nodiscard]] int getAllDirtyEventIds(const std::string& bookUri, std::list<int>* eventIds);
    [[nodiscard]] int getAllDeletedEventIds(const std::string& bookUri, std::list<int>* eventIds);
    [[nodiscard]] int getAllEventUri(const std::string& bookUri, std::list<std::string>* uris);

    // --- events: writes, each in a transaction of its own or in the thread's open one
    [[nodiscard]] int insertEvent(const CalEventMetaData& row);
    [[nodiscard]] int updateEvent(const CalEventMetaData& row);
    [[nodiscard]] int updateExceptionEvent(const CalEventMetaData& row);
    [[nodiscard]] int updateEventDirty(int eventId, int dirty);
    [[nodiscard]] int updateEventDeleted(int eventId, int deleted);
    [[nodiscard]] int deleteEvent(int calendarId, const std::string& uri);

    // --- calendars
    [[nodiscard]] int getCalendarbookId(int accountId, const std::string& uri, int* calendarId) {
        return mBooks.getId(accountId, uri, calendarId);
    }
    [[nodiscard]] int getCalendarbookUri(int calendarId, std::string* uri) {
        return mBooks.getUri(calendarId, uri);
    }
    [[nodiscard]] int getCalendarbook(int calendarId, CalBookMetaData* row) {
        return mBooks.get(calendarId, row);
    }
    [[nodiscard]] int getCalendarbook(int accountId, const std::string& uri, CalBookMetaData* row) {
        return mBooks.get(accountId, uri, row);
    }
    [[nodiscard]] int getCalendarbookVersion(int calendarId, int* version) {
        return mBooks.getVersion(calendarId, version);
    }
    [[nodiscard]] int getCalendarbookEtag(const std::string& uri, std::string* etag);
    [[nodiscard]] int getCalendarbookIds(int accountId, std::list<int>* ids) {
        return mBooks.getIds(accountId, ids);
    }
    [[nodiscard]] int getAllCalendarbookIds(int accountId, std::list<int>* ids) {
        return mBooks.getIds(accountId, ids);
    }
    [[nodiscard]] int getAllDirtyCalendarbookIds(int accountId, std::list<int>* ids) {
        return mBooks.getDirtyIds(accountId, ids);
    }
    [[nodiscard]] int getAllDeletedCalendarbookIds(int accountId, std::list<int>* ids) {
        return mBooks.getDeletedIds(accountId, ids);
    }
    [[nodiscard]] int getAllCalendarbookUri(int accountId, std::list<std::string>* uris) {
        return mBooks.getUris(accountId, uris);
    }
    [[nodiscard]] int getAllAccountIds(std::list<int>* accountIds) {
        return mBooks.getAccountIds(accountIds);
    }
    [[nodiscard]] int insertCalendarbook(const CalBookMetaData& row) { return mBooks.insert(row); }
    [[nodiscard]] int updateCalendarbook(const CalBookMetaData& row) { return mBooks.update(row); }
    [[nodiscard]] int updateCalendarbookVersion(int calendarId, int version) {
        return mBooks.updateVersion(calendarId, version);
    }
    [[nodiscard]] int updateCalendarbookDirty(int calendarId, int dirty) {
        return mBooks.updateDirty(calendarId, dirty);
    }
    [[nodiscard]] int updateCalendarbookDeleted(int calendarId, int deleted) {
        return mBooks.updateDeleted(calendarId, deleted);
    }
    [[nodiscard]] int deleteCalendarbook(int accountId, const std::string& uri) {
        return mBooks.remove(accountId, uri);
    }
    [[nodiscard]] int deleteAccount(int accountId) { return mBooks.removeAccount(accountId); }

    // --- CalItemStore
    [[nodiscard]] int getAllItems(int calendarId, std::vector<CalEventMetaData>* rows) override;
    [[nodiscard]] int getItem(int itemId, CalEventMetaData* row) override { return getEvent(itemId, row); }
    [[nodiscard]] int insertItem(const CalEventMetaData& row) override { return insertEvent(row); }
    [[nodiscard]] int updateItem(const CalEventMetaData& row) override {
        return row.original_event_id != 0 ? updateExceptionEvent(row) : updateEvent(row);
    }
    [[nodiscard]] int deleteItem(int calendarId, const std::string& uri) override {
        return deleteEvent(calendarId, uri);
    }
    [[nodiscard]] int forgetItem(int itemId) override;
    [[nodiscard]] int markDirty(int itemId, int dirty) override { return updateEventDirty(itemId, dirty); }
    [[nodiscard]] int markDeleted(int itemId, int deleted) override {
        return updateEventDeleted(itemId, deleted);
    }
    [[nodiscard]] int countPending(int accountId, int* dirty, int* deleted) override {
        return mBooks.countPending("eventsync_table", accountId, dirty, deleted);
    }
    [[nodiscard]] CalBookRows& books() override { return mBooks; }
    SyncDatabase& database() override { return mDatabase; }

private:
    SyncDatabase mDatabase;
    CalBookRows mBooks;
};
