// ICalendarReader.h: the components of a calendar file as the JSON that scripts rely on.
#pragma once

#include <string>
#include <vector>

#include "exchange/CalendarItem.h"
#include "exchange/ContentLine.h"
#include "exchange/ItemReader.h"
#include "exchange/NotHeld.h"
#include "exchange/TimeZones.h"

namespace exchange {

class ICalendarReader {
public:
    explicit ICalendarReader(TimeZones& zones) : mZones(zones) {}

    void defineZone(const RawItem& timezone);
    // A VEVENT or VTODO. A Failure with the reason when it cannot be taken; `losses` gets what is left out of it.
    CalendarItem read(const RawItem& raw, NotHeld& losses);
    // Whether the last item named a zone that no line before it defined.
    [[nodiscard]] bool missedZone() const { return mMissedZone; }

private:
    struct Parts {
        std::vector<ContentLine> properties;
        std::vector<std::vector<ContentLine>> alarms;
    };
    // A time of the file: an instant or a date, and the wall time it was written as.
    struct When {
        calendar_time_s time;
        int64_t wallSec = 0;
        const TimeZone* zone = nullptr;  // NULL for UTC and dates
    };
    struct Frame;

    Parts partsOf(const RawItem& raw);
    When readTime(const ContentLine& line, std::string_view value);
    bool readShared(const ContentLine& line, CalendarItem& item);
    void readEvent(const Parts& parts, CalendarItem& item);
    void readTodo(const Parts& parts, CalendarItem& item);
    // False when the line is none of an event's own.
    bool readEventLine(const ContentLine& line, Frame& frame, CalendarItem& item);
    void setTimes(Frame& frame, CalendarItem& item);
    static calendar_time_s endOf(const Frame& frame);
    // A day begins with its midnight in the zone of times that name none.
    [[nodiscard]] int64_t instantOf(const calendar_time_s& time) const;
    void readRule(const ContentLine& line, const Frame& frame, CalendarItem& item);
    void readExdates(const Frame& frame, CalendarItem& item);
    void readAttendee(const ContentLine& line, CalendarItem& item);
    void readAlarm(const std::vector<ContentLine>& alarm, const Frame& frame, Json& reminders);
    void noteOther(const ContentLine& line);

    TimeZones& mZones;
    NotHeld* mpLosses = nullptr;  // of the item that is being read
    bool mMissedZone = false;
};

// The recurrence id of an instance as its series names them: a date for one of whole days, else an instant.
calendar_time_s instanceOf(const CalendarItem& series, const calendar_time_s& named);

}  // namespace exchange
