// Names.h: the words of the JSON that scripts rely on, beside the values that the records keep. One table a
// vocabulary, read in both directions.
#pragma once

#include <optional>
#include <span>
#include <string_view>

struct NameOf {
    int value;
    std::string_view name;
};

// The fallback for a value without a row is "".
constexpr std::string_view nameOf(std::span<const NameOf> names, int value) {
    for (const NameOf& row : names) {
        if (row.value == value) return row.name;
    }
    return {};
}

constexpr std::optional<int> valueOf(std::span<const NameOf> names, std::string_view name) {
    for (const NameOf& row : names) {
        if (row.name == name) return row.value;
    }
    return std::nullopt;
}

// Event records (the values stand in platform/calendar.h).
inline constexpr NameOf kEventStatus[] = {{1, ""}, {2, "tentative"}, {4, "confirmed"}, {8, "cancelled"}};
inline constexpr NameOf kVisibility[] = {{2, "default"}, {0, "public"}, {1, "private"}};
inline constexpr NameOf kAttendeeStatus[] = {
    {0, "needsAction"}, {1, "accepted"}, {2, "declined"}, {3, "tentative"}};
inline constexpr NameOf kTodoStatus[] = {{1, "needsAction"}, {2, "completed"}, {0, ""}};
inline constexpr NameOf kFrequencies[] = {{1, "DAILY"}, {2, "WEEKLY"}, {3, "MONTHLY"}, {4, "YEARLY"}};
inline constexpr NameOf kWeekdays[] = {{1, "SU"}, {2, "MO"}, {3, "TU"}, {4, "WE"},
                                       {5, "TH"}, {6, "FR"}, {7, "SA"}};
inline constexpr int kMonday = 2;
inline constexpr int kRangeUntil = 0;
inline constexpr int kRangeCount = 1;

// Books.
inline constexpr NameOf kStoreTypes[] = {{1, "event"}, {2, "todo"}};
inline constexpr int kModeReadOnly = 1;

// The states and kinds of the call interface.
inline constexpr NameOf kStates[] = {{0, "none"}, {1, "ready"}, {2, "in progress"}, {3, "unavailable"}};
inline constexpr NameOf kKinds[] = {{0, "calendar"}, {1, "contacts"}};
