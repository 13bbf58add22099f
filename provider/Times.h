// Times: the two kinds of event times on the wire, and the texts that name an instance of a series.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "Http.h"

namespace provider {

constexpr std::int64_t kSecondsPerDay = 86400;

// EventTime: {"date"} or {"dateTime"[,"timeZone"]}.
struct EventTime {
    bool allDay = false;
    std::int64_t local = 0;     // seconds since 1970 as written on the clock there
    std::optional<int> offset;  // seconds east; absent for a date and for a date-time without one
    std::string zone;           // "" when not given

    [[nodiscard]] std::int64_t utc() const { return local - offset.value_or(0); }
};

// Seconds since 1970 of "YYYY-MM-DD" at midnight; nothing for another text or a day that does not exist.
std::optional<std::int64_t> parseDate(std::string_view text);
// RFC 3339; the offset may be missing.
std::optional<EventTime> parseDateTime(std::string_view text);
// "YYYYMMDD" (all-day) or "YYYYMMDDTHHMMSSZ".
std::optional<EventTime> parseCompact(std::string_view text);

std::string formatDate(std::int64_t local);
// "Z" for offset 0.
std::string formatDateTime(std::int64_t utc, int offset);
// The text that follows "SERIESID_" in the id of an instance.
std::string compactText(const EventTime& time);

// Reads and checks a start, an end or an original start time. Throws ApiError naming member.
EventTime readTime(const Json& value, const std::string& member);
// The time as JSON, with the zone when there is one.
Json timeJson(const EventTime& time);
// Whether name is a time zone that this machine knows.
bool isTimeZone(const std::string& name);

}  // namespace provider
