// ICalendarValues.h: values of calendar files that are more than a text: durations, rules, addresses, days. Pure
// functions.
#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>

#include "exchange/ContentLine.h"
#include "platform/record_types.h"

namespace exchange::ical_values {

// Days are those of the calendar, which may have 23 or 25 hours; the seconds are exact. Both have the same sign.
struct Duration {
    int64_t days = 0;
    int64_t seconds = 0;
};
// Nothing for a malformed one, or one of more than ten thousand years.
std::optional<Duration> durationOf(const std::string& text);
// "-PT15M".
std::string beforeStart(int64_t minutes);

// The rule as the store has it. A Failure when it is malformed or says more than the store holds. `toUtc` turns a
// wall time of the series into an instant.
std::string ruleOf(const std::string& value, const std::function<int64_t(int64_t wallSec)>& toUtc);

// Of an ATTENDEE or ORGANIZER; "" when it has none.
std::string emailOf(const ContentLine& line);
// As the value of such a line.
std::string addressOf(const std::string& email);

// Seconds since 1970 of the time as it is written, whatever its zone; a date is its midnight.
int64_t wallOf(const calendar_time_s& time);
calendar_time_s dateOf(int64_t wallSec);

}  // namespace exchange::ical_values
