// RruleText.h: the rule of a series as the text of an RRULE, and the fields of an event record that hold it.
#pragma once

#include <string>
#include <string_view>

#include "platform/record_types.h"

// The fields as the record keeps them; a default value is "no recurrence".
struct RruleFields {
    int frequency = 0;  // CALENDAR_EVENT_FREQ
    int rangeType = 2;  // CALENDAR_EVENT_RANGE_TYPE
    int count = 0;
    calendar_time_s until;
    int interval = 1;
    int weekStart = 2;  // CALENDAR_EVENT_WKST
    std::string byDay, byMonthDay, byYearDay, byWeekNo, byMonth, bySetPos;
    bool operator==(const RruleFields&) const = default;
};

namespace rrule_text {

// Without the "RRULE:" prefix, parts in a fixed order, defaults left out; "" when there is no recurrence.
std::string compose(const RruleFields& fields);

// With or without prefix; "" is no recurrence. False with `reason` set when it is malformed or says something that
// the record cannot keep; `out` is then untouched.
[[nodiscard]] bool parse(std::string_view text, RruleFields* out, std::string* reason);

}  // namespace rrule_text
