// CalendarStore.h: the device's calendar store as the commands need it. Works whether the daemon runs or not.
#pragma once

#include <optional>
#include <span>
#include <vector>

#include "StoreAccess.h"
#include "platform/calendar.h"

// One event or to-do of the store.
using FoundItem = store_access::Found<CalendarList>;

// Open while the object lives.
class CalendarStore {
public:
    CalendarStore();
    ~CalendarStore();
    CalendarStore(const CalendarStore&) = delete;
    CalendarStore& operator=(const CalendarStore&) = delete;

    static CalendarList find(const char* view, const std::vector<store_access::Filter>& filters,
                             unsigned sortBy, std::span<const unsigned> projection = {});
    static CalendarList calendars(std::optional<int> account);
    // A Failure when there is none.
    static CalendarRecord calendar(int id);
    static FoundItem event(int id, std::span<const unsigned> projection);
    static FoundItem todo(int id, std::span<const unsigned> projection);
    // A Failure when the calendar is missing, is none of this kind ("event" or "todo"), or is read-only.
    static void checkWritable(int calendarId, const char* kind);
};

// A transaction of the store: undone unless commit() was reached.
class CalendarTransaction {
public:
    CalendarTransaction();
    ~CalendarTransaction();
    CalendarTransaction(const CalendarTransaction&) = delete;
    CalendarTransaction& operator=(const CalendarTransaction&) = delete;
    void commit();

private:
    bool mIsOpen = true;
};
