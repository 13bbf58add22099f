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

#include "calendar/CalMetaData.h"
#include "common/SyncDatabase.h"

class CalMetaDataDBHelper {
public:
    CalMetaDataDBHelper();

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
    // All rows of one book, read once for a comparing sync or a change walk.
    [[nodiscard]] int getAllEvents(int calendarId, std::vector<CalEventMetaData>* rows);
    // Dirty and deleted rows of one account's books (those of read-only books are the caller's to judge).
    [[nodiscard]] int countPending(int accountId, int* dirty, int* deleted);

    // --- events: writes, each in a transaction of its own or in the thread's open one
    [[nodiscard]] int insertEvent(const CalEventMetaData& row);
    [[nodiscard]] int updateEvent(const CalEventMetaData& row);
    [[nodiscard]] int updateExceptionEvent(const CalEventMetaData& row);
    [[nodiscard]] int updateEventDirty(int eventId, int dirty);
    [[nodiscard]] int updateEventDeleted(int eventId, int deleted);
    [[nodiscard]] int deleteEvent(int calendarId, const std::string& uri);

    // --- calendars: reads
    [[nodiscard]] int getCalendarbookId(int accountId, const std::string& uri, int* calendarId);
    [[nodiscard]] int getCalendarbookUri(int calendarId, std::string* uri);
    [[nodiscard]] int getCalendarbook(int calendarId, CalBookMetaData* row);
    [[nodiscard]] int getCalendarbook(int accountId, const std::string& uri, CalBookMetaData* row);
    [[nodiscard]] int getCalendarbookVersion(int calendarId, int* version);
    [[nodiscard]] int getCalendarbookEtag(const std::string& uri, std::string* etag);
    [[nodiscard]] int getCalendarbookIds(int accountId, std::list<int>* calendarIds);
    [[nodiscard]] int getAllCalendarbookIds(int accountId, std::list<int>* calendarIds);
    [[nodiscard]] int getAllDirtyCalendarbookIds(int accountId, std::list<int>* calendarIds);
    [[nodiscard]] int getAllDeletedCalendarbookIds(int accountId, std::list<int>* calendarIds);
    [[nodiscard]] int getAllCalendarbookUri(int accountId, std::list<std::string>* uris);
    [[nodiscard]] int getAllAccountIds(std::list<int>* accountIds);

    // --- calendars: writes
    [[nodiscard]] int insertCalendarbook(const CalBookMetaData& row);
    [[nodiscard]] int updateCalendarbook(const CalBookMetaData& row);
    // "UPDATE calendarbooksync_table SET uri=?, etag=? WHERE calendar_id=?"
    [[nodiscard]] int updateCalendarbookUri(int calendarId, const std::string& uri, const std::string& etag);
    [[nodiscard]] int updateCalendarbookVersion(int calendarId, int version);
    [[nodiscard]] int updateCalendarbookDirty(int calendarId, int dirty);
    [[nodiscard]] int updateCalendarbookDeleted(int calendarId, int deleted);
    [[nodiscard]] int deleteCalendarbook(int accountId, const std::string& uri);
    [[nodiscard]] int deleteAccount(int accountId);

    // For SyncTransaction: one transaction over several writes.
    SyncDatabase& database() { return mDatabase; }

private:
    SyncDatabase mDatabase;
};
