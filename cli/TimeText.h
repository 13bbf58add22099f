// TimeText.h: times as text. RFC 3339 in UTC ("2014-05-01T10:00:00Z") or a plain date for all-day times, and the
// compact form of recurrence ids and rules ("20140501T100000Z", "20140501"). Pure functions; readers give nothing
// for malformed text.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "platform/record_types.h"

namespace time_text {

std::string composeRfc3339(const calendar_time_s& time);
std::string composeRfc3339(int64_t utcSec);
// Any offset is accepted and turned into UTC; fractions of a second are dropped.
std::optional<calendar_time_s> parseRfc3339(std::string_view text);

std::string composeCompact(const calendar_time_s& time);
std::optional<calendar_time_s> parseCompact(std::string_view text);

// `start` plus the time from `from` to `to`; all three of one type.
calendar_time_s shifted(const calendar_time_s& start, const calendar_time_s& from, const calendar_time_s& to);

inline bool isDate(const calendar_time_s& time) {
    return time.type == CALENDAR_TIME_LOCALTIME;
}

}  // namespace time_text
