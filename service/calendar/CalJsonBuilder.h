// CalJsonBuilder: the bodies of uploads from the device's records; the reverse of CalJsonParser's conversions, over the same tables.
// What does not come back as it went stands in kLossyRows.
// Owner: one call.   Threads: one.   Errors: 0 or -1, each failure logged.
#pragma once

#include <string>
#include <utility>

#include "calendar/CalJsonObject.h"
#include "platform/calendar.h"

class CalJsonBuilder {
public:
    // An event's body, for insert and update.
    [[nodiscard]] int addEvent(calendar_record_h record);
    // The same for one instance of a series: names the series and the instance as well.
    [[nodiscard]] int addException(calendar_record_h record, const std::string& seriesUri);
    // A task's body.
    [[nodiscard]] int addTodo(calendar_record_h record);

    [[nodiscard]] CalJsonObject takeObject() { return std::move(mObject); }

private:
    // An empty body for the record.
    [[nodiscard]] int begin(calendar_record_h record);
    [[nodiscard]] int setTime(calendar_record_h record, const char* name, unsigned property);
    [[nodiscard]] int setRecurrence(calendar_record_h record);
    [[nodiscard]] int setAttendees(calendar_record_h record);
    [[nodiscard]] int setReminders(calendar_record_h record);
    [[nodiscard]] int setDue(calendar_record_h record);

    CalJsonObject mObject;
};

namespace cal_json {

// Bodies; 0, or -1 when the record cannot be read.
[[nodiscard]] int composeEvent(calendar_record_h record, CalJsonObject* body);
[[nodiscard]] int composeTodo(calendar_record_h record, CalJsonObject* body);
// An event's body without the name of its time zone, which servers fill in on their own; the record loses it.
[[nodiscard]] int composeComparableEvent(calendar_record_h record, CalJsonObject* body);
// The body as text, empty when the record cannot be read.
[[nodiscard]] std::string convertException2Json(calendar_record_h record, const std::string& seriesUri);

}  // namespace cal_json
