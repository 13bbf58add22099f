// CalMappings: the calendar service's words and the record's numbers, one table each, read in both directions.
//
// What the mapping cannot carry stands in kLossyRows; the tests assert it exactly.
#pragma once

#include <iterator>
#include <optional>
#include <string_view>

#include "platform/calendar.h"

namespace cal_mapping {

struct NameOf {
    int value;
    std::string_view name;
};

// Unknown words: none (1). The service compares nine characters, and so do we.
inline constexpr int kStatusNone = 1;
inline constexpr size_t kStatusLength = 9;
inline constexpr NameOf kStatus[] = {{8, "cancelled"}, {4, "confirmed"}, {2, "tentative"}};

// Absent: confidential (2). Unknown words leave the record's default. Unknown values go out as "public".
inline constexpr int kVisibilityDefault = 2;
inline constexpr NameOf kVisibility[] = {{1, "private"}, {2, "default"}, {2, "confidential"}};
inline constexpr std::string_view kVisibilityOther = "public";

// Absent: busy. Any word but "opaque" is free; any value but 0 goes out as "opaque".
inline constexpr NameOf kTransparency[] = {{1, "opaque"}, {0, "transparent"}};

// Unknown words are left unset; unknown values go out as "needsAction".
inline constexpr NameOf kResponseStatus[] = {
    {0, "needsAction"}, {1, "accepted"}, {2, "declined"}, {3, "tentative"}};

// Unknown words: no recurrence (0).
inline constexpr NameOf kFrequency[] = {{4, "YEARLY"}, {3, "MONTHLY"}, {2, "WEEKLY"}, {1, "DAILY"}};

inline constexpr NameOf kWeekday[] = {{1, "SU"}, {2, "MO"}, {3, "TU"}, {4, "WE"},
                                      {5, "TH"}, {6, "FR"}, {7, "SA"}};

// Unknown values go out as "needsAction", unknown words come in as it.
inline constexpr int kTodoNeedsAction = 1;
inline constexpr int kTodoCompleted = 2;
inline constexpr NameOf kTodoStatus[] = {{kTodoNeedsAction, "needsAction"}, {kTodoCompleted, "completed"}};
inline constexpr std::string_view kTodoStatusOther = "needsAction";
inline constexpr std::string_view kServerHasDue = "due";  // CALENDAR_TODO_SYNC_DATA1

// Members that are copied as they are.
struct TextMember {
    const char* name;
    unsigned property;
    bool isSent;  // the others are the server's own
};
inline constexpr TextMember kEventTexts[] = {{"id", CALENDAR_EVENT_UID, false},
                                             {"summary", CALENDAR_EVENT_SUMMARY, true},
                                             {"description", CALENDAR_EVENT_DESCRIPTION, true},
                                             {"location", CALENDAR_EVENT_LOCATION, true},
                                             {"etag", CALENDAR_EVENT_SYNC_DATA2, false}};
inline constexpr TextMember kTodoTexts[] = {{"id", CALENDAR_TODO_UID, false},
                                            {"title", CALENDAR_TODO_SUMMARY, true},
                                            {"notes", CALENDAR_TODO_NOTE, true},
                                            {"etag", CALENDAR_TODO_SYNC_DATA2, false}};

inline constexpr int kAttendeeOrganizer = 3;
inline constexpr int kMeetingOwn = 1;
inline constexpr int kMeetingOther = 2;
inline constexpr int kRangeUntil = 0;
inline constexpr int kRangeCount = 1;
inline constexpr int kTickUnitMinutes = 60;

template <size_t N>
constexpr std::optional<int> valueOf(const NameOf (&table)[N], std::string_view name) {
    for (const NameOf& row : table) {
        if (row.name == name) return row.value;
    }
    return std::nullopt;
}

// The first row of a value is the word that goes out.
template <size_t N>
constexpr std::optional<std::string_view> nameOf(const NameOf (&table)[N], int value) {
    for (const NameOf& row : table) {
        if (row.value == value) return row.name;
    }
    return std::nullopt;
}

struct LossyRow {
    std::string_view member;
    std::string_view wire;    // what the server has
    std::string_view device;  // what it becomes
};
inline constexpr LossyRow kLossyRows[] = {
    {"visibility", "confidential", "default"},
    {"visibility", "public", "default"},
    {"start.dateTime", "2026-03-01T10:00:00+05:30", "2026-03-01T05:00:00Z"},  // minutes of an offset
    {"originalStartTime", "2026-03-01T10:00:00-05:00", "20260301T100000Z"},   // a negative offset
    {"start.timeZone", "the start's own zone, when the end has another", "the end's"},
    {"recurrence", "every element but the first", ""},
    {"reminders.useDefault", "true", ""},
    {"reminders.overrides.method", "email", ""},
    {"completed", "2026-03-01T10:00:30Z",
     "2026-03-01T10:00:00Z"},  // seconds of a time, once the device sends it
    {"recurrence", "of an event that is no longer a series on the device", "stays"},
};

}  // namespace cal_mapping
