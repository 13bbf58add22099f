// CalendarRecords.h: items of a calendar file as records of one calendar of the store.
#pragma once

#include "exchange/CalendarItem.h"
#include "exchange/KnownItems.h"
#include "platform/calendar.h"

namespace exchange {

class CalendarRecords {
public:
    // A Failure when the calendar is missing or cannot be written.
    explicit CalendarRecords(int calendarId);

    [[nodiscard]] bool holdsTodos() const { return mHoldsTodos; }
    [[nodiscard]] KnownItems known() const;

    // A new record with its changed instances. No server id is made of what the file calls it: the item is not on the
    // server, and with one the next download would take it for an item that is gone there.
    [[nodiscard]] CalendarRecord make(const CalendarItem& item) const;
    // The record of a changed instance. A Failure when the file's fields are none of an event.
    static CalendarRecord makeInstance(const Instance& instance);
    // All that the record says.
    [[nodiscard]] Json say(calendar_record_h record) const;
    [[nodiscard]] std::vector<std::string> keysOf(const Json& said) const;
    // The record then says what the item says. Changed and cancelled instances that the item does not name stay as
    // they are, and so does an organizer when the item has none.
    void replace(int id, const CalendarItem& item) const;

private:
    void replaceEvent(int id, const CalendarItem& item) const;
    void replaceTodo(int id, const CalendarItem& item) const;

    const int mCalendarId;
    bool mHoldsTodos = false;
};

}  // namespace exchange
