// CalRecurrence: a recurrence rule of the calendar service and the record's recurrence fields.
#pragma once

#include <json-glib/json-glib.h>

#include <string>
#include <string_view>

#include "platform/calendar.h"

namespace cal_recurrence {

// Reads the first element of a "recurrence" array into the record. An empty array, or an empty element, sets nothing. A part
// that cannot be stored is logged and left out.
[[nodiscard]] int parse(JsonArray* recurrence, calendar_record_h record);

// The record's rule as an "RRULE:" line; empty for a record without one.
[[nodiscard]] int build(calendar_record_h record, std::string* rule);

}  // namespace cal_recurrence
