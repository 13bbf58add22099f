// CalDataManager: the bridge between the sync and the device's calendar service: writes the server's calendars and events
// into it, keeps the sync metadata store in step with every write, and detects local changes by change version.
// Owner: process-wide, made on first use, never destroyed.   Threads: sync workers and the main loop (change callback);
// the stores' own locks serialise them. prepareSync() first runs on the main thread, at service construction.
// Errors: 0 or -1, each failure logged; outputs untouched on failure.
//
// Order of every write: the calendar service first, in one transaction, then the metadata rows, in one transaction. A crash
// in between leaves records without rows, which the next download recognises by server id and synced version.
#pragma once

#include <list>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "calendar/CalBookSnapshot.h"
#include "calendar/CalListInfo.h"
#include "calendar/CalManager.h"
#include "calendar/CalMetaDataDBHelper.h"
#include "platform/calendar.h"

class CalDataManager : public CalManager {
public:
    static CalDataManager& getInstance();

    CalDataManager() : CalManager(kEventKind) {}
    ~CalDataManager() override;

    // Connects to the calendar service, makes the metadata store, registers the change callback. Later calls return at once.
    [[nodiscard]] int prepareSync();

    // --- calendars
    [[nodiscard]] int insertCalendarbook(int accountId, const CalListInfo& entry) {
        return insertBook(accountId, entry);
    }
    [[nodiscard]] int updateCalendarbooks(int accountId, const CalList& entries) {
        return updateBooks(accountId, entries);
    }
    [[nodiscard]] int deleteCalendarbook(int accountId, const std::string& uri) {
        return deleteBook(accountId, uri);
    }
    [[nodiscard]] int updateCalendarbookUri(int calendarId, const std::string& uri, const std::string& etag);
    [[nodiscard]] int getCalendarbookUri(int calendarId, std::string* uri);
    [[nodiscard]] int getCalendarbookId(int accountId, const std::string& uri, int* calendarId);
    [[nodiscard]] int getCalendarbookEtag(int accountId, const std::string& uri, std::string* etag);
    [[nodiscard]] int getAllCalendarbookUri(int accountId, std::list<std::string>* uris);
    [[nodiscard]] int getAllCalendarbookIds(int accountId, std::list<int>* calendarIds);
    [[nodiscard]] int getAllDirtyCalendarbookIds(int accountId, std::list<int>* calendarIds);
    [[nodiscard]] int getAllDeletedCalendarbookIds(int accountId, std::list<int>* calendarIds);
    [[nodiscard]] int clearDirtyCalendarbook(int calendarId);
    [[nodiscard]] int clearDeletedCalendarbook(int calendarId);
    // By etag.
    [[nodiscard]] bool isBookChanged(int accountId, const CalListInfo& entry) override;

    // --- events. One item; the sync writes pages through CalItemWriter, which these use.
    [[nodiscard]] int insertEvent(int accountId, const std::string& bookUri, const CalListInfoPtr& event);
    [[nodiscard]] int updateEvent(int accountId, const std::string& bookUri, const CalListInfoPtr& event);
    [[nodiscard]] int deleteEvent(int calendarId, const std::string& uri);
    [[nodiscard]] int updateEventUri(int eventId, const std::string& uri, const std::string& etag);
    [[nodiscard]] int getEventUri(int eventId, std::string* uri);
    [[nodiscard]] int getEventId(int calendarId, const std::string& uri, int* eventId);
    [[nodiscard]] int getEventEtag(int eventId, std::string* etag);
    [[nodiscard]] int getEventEtag(int calendarId, const std::string& uri, std::string* etag);
    [[nodiscard]] int getEvent(int eventId, CalendarRecord* record);
    [[nodiscard]] int getAllDirtyEventIds(const std::string& bookUri, std::list<int>* eventIds);
    [[nodiscard]] int getAllDeletedEventIds(const std::string& bookUri, std::list<int>* eventIds);
    [[nodiscard]] int getAllEventUri(const std::string& bookUri, std::list<std::string>* uris);
    [[nodiscard]] int clearDirtyEvent(int eventId);
    [[nodiscard]] int clearDeletedEvent(int eventId);
    [[nodiscard]] int hasExceptionEvent(int originalEventId);
    [[nodiscard]] int getAllExceptionEvents(int originalEventId, std::list<std::string>* recurrenceIds);
    [[nodiscard]] int getExceptionEventUri(int originalEventId, const std::string& recurrenceId,
                                           std::string* uri);
    [[nodiscard]] int getExceptionEventEtag(int originalEventId, const std::string& recurrenceId,
                                            std::string* etag);
    [[nodiscard]] int updateExceptionEventUri(int originalEventId, const std::string& recurrenceId,
                                              const std::string& uri, const std::string& etag);

    // --- local changes
    [[nodiscard]] int setCalendarbookChanged(int calendarId) { return setBookChanged(calendarId); }
    static void changedDBCallback(const char* view, void* userData);

    // The store, prepared.
    [[nodiscard]] CalMetaDataDBHelper* metaData() { return mpMetaData.get(); }

protected:
    CalItemStore* prepareStore() override {
        return prepareSync() == sync_result::kOk ? mpMetaData.get() : nullptr;
    }
    int deleteBookRows(CalItemStore& store, int accountId, const std::vector<int>& calendarIds) override;

private:
    CalMetaDataDBHelper* preparedStore() { return prepared() != nullptr ? mpMetaData.get() : nullptr; }
    template <class... Params, class... Args>
    int forward(int (CalMetaDataDBHelper::*operation)(Params...), Args&&... args);
    template <class Read, class Write>
    int updateRow(Read read, Write write, const std::string& uri, const std::string& etag);

    std::mutex mPrepareMutex;
    bool mConnected = false;                          // guarded by mPrepareMutex
    std::unique_ptr<CalMetaDataDBHelper> mpMetaData;  // set once under mPrepareMutex, then constant
};

// Positions a list on the record whose id property is `id`; PLATFORM_ERROR_NOT_FOUND when there is none.
[[nodiscard]] int findList(calendar_list_h list, unsigned idProperty, int id);
