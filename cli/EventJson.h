// EventJson.h: an event record as the JSON that scripts rely on, and back. What compose() gives, parse() takes; a
// text of another shape is a Failure that names the member.
#pragma once

#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "Output.h"
#include "RecordJson.h"
#include "platform/calendar.h"

namespace event_json {

// The fields with one value.
std::span<const record_json::ScalarField> scalars();

// Every field of the documented table, always.
Json compose(calendar_record_h event);
// What compose() reads, for a query that reads no more.
std::span<const unsigned> projection();
// What `event set` reads and writes.
std::span<const unsigned> scalarProjection();

// An event of a file. The record has everything but its place (book, series); id and uid of the file are not used:
// the copy of an event is an event of its own.
struct NewEvent {
    CalendarRecord record;
    std::optional<int> calendar;
    std::optional<int> originalEvent;
    std::string recurrenceId;
};
// Onto a record that is there, when one is given: the members of the file take the place of its own, the rest stays.
NewEvent parse(const Json& object, CalendarRecord onto = nullptr);

// What holds between fields: all-day events have two dates, no event ends before its start.
void checkTimes(calendar_record_h event);

}  // namespace event_json
