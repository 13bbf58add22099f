// CalTime: conversions between the calendar service's times and the record's. Seconds are seconds since 1970 UTC.
// Threads: any; the ICU calendars are kept per thread.
#pragma once

#include <json-glib/json-glib.h>

#include <cstdint>
#include <optional>
#include <string>

#include "platform/record_types.h"

namespace cal_time {

struct WallTime {
    int year = 0;
    int month = 0;  // 1..12
    int day = 0;
    int hour = 0;
    int minute = 0;
    int second = 0;
};

// The instant of a wall time in a zone, nothing outside the years 1 to 9999. NULL: "tzid is NULL so set gmt" is logged. An unknown
// zone counts as GMT.
// `firstDayOfWeek` 1..7 is set on the calendar, other values are not.
[[nodiscard]] std::optional<int64_t> toSeconds(const WallTime& time, const char* zone,
                                               int firstDayOfWeek = 0);

// "20140501T100000Z".
[[nodiscard]] std::optional<std::string> recurrenceIdText(int64_t seconds);

// Whether the fields name a day and a time of day.
[[nodiscard]] bool isPlausible(const WallTime& time);

// A "start" or "end" object: {"date"} or {"dateTime"}, either with a "timeZone". Nothing when it cannot be read.
[[nodiscard]] std::optional<calendar_time_s> parse(JsonObject* time);

// A date and time as the service writes it. Nothing when it cannot be read.
[[nodiscard]] std::optional<calendar_time_s> parseDateTime(const std::string& text,
                                                           const std::string& timeZone);

// The instant of a record's time; a wall time counts as GMT.
[[nodiscard]] std::optional<int64_t> toUtc(const calendar_time_s& time);

// "2014-05-01".
[[nodiscard]] std::string dateText(const calendar_time_s& time);
// "2014-05-01T10:00:00Z", the seconds always 00.
[[nodiscard]] std::optional<std::string> minuteText(int64_t seconds);

// A recurrence id as the member of an "originalStartTime": "date" or "dateTime" and its text. Nothing when it is no recurrence id.
struct OriginalStart {
    const char* member;
    std::string text;
};
[[nodiscard]] std::optional<OriginalStart> originalStart(const std::string& recurrenceId);

// "originalStartTime" as a recurrence id, appended to `target` with a comma when it holds one already.
[[nodiscard]] int appendRecurrenceId(JsonObject* time, std::string* target);

}  // namespace cal_time
