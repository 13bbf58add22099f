// record_types.h: what the calendar and the contacts service share: times, handles, write options.
#pragma once

#include <cstdint>
#include <memory>
#include <span>
#include <vector>

namespace platform::records {
class Record;
class RecordList;
class Query;
}  // namespace platform::records

// A point in time: an instant, or a date and wall time without a zone (all-day events, dates).
enum calendar_time_type_e { CALENDAR_TIME_UTIME = 0, CALENDAR_TIME_LOCALTIME = 1 };
struct calendar_time_s {
    calendar_time_type_e type = CALENDAR_TIME_UTIME;
    int64_t utime = 0;  // seconds since 1970 UTC (UTIME)
    int year = 0;       // LOCALTIME: year, month 1..12, day 1..31, and a time of day
    int month = 0;
    int mday = 0;
    int hour = 0;
    int minute = 0;
    int second = 0;
    bool operator==(const calendar_time_s&) const = default;
};

// The change types of a change feed.
enum record_change_e { RECORD_INSERTED = 0, RECORD_UPDATED = 1, RECORD_DELETED = 2 };

// Who writes, and under which condition. A default-constructed value is a user's plain write.
inline constexpr int kAnyVersion = -1;
struct record_write_options_s {
    // The write is the sync engine's own: each written record's synced version becomes the version of this
    // write (also that of a series whose child was written). So a reader can tell the engine's last write
    // from a user's later one even when the engine's bookkeeping was cut off.
    bool by_sync = false;
    // One entry per record of the call, in order; empty: no condition. The record is written only when its
    // stored version equals the entry (kAnyVersion: always), checked in the same transaction. For an exception
    // of a series the version meant is its series'. A version that this very call (or an earlier call of the same
    // open transaction) gave to the record also passes.
    std::span<const int> expected_versions = {};
    // When not NULL, receives the positions (in call order) of the records that were not written because
    // they have moved on or are gone. The others are written. Without it the call still skips them silently.
    std::vector<size_t>* skipped = nullptr;
};
