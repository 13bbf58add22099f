// CalendarItem.h: an event, a series with its changed instances, or a to-do, between a file and the store.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "Output.h"
#include "platform/record_types.h"

namespace exchange {

class TimeZone;

// A changed instance as the file names it.
struct Instance {
    Json fields;
    calendar_time_s recurrence;
    size_t line = 0;
};

struct CalendarItem {
    bool isTodo = false;
    std::string uid;
    size_t line = 0;
    // Members of the JSON of the record, as far as the file has them.
    Json fields = Json::object();
    // Set for a changed instance, until it has found its series.
    std::optional<calendar_time_s> recurrence;
    // Of a series: how far its start's wall time is into its day, and in which zone; instances may be named by their
    // date alone.
    int64_t wallTimeOfDay = 0;
    const TimeZone* zone = nullptr;
    std::vector<Instance> instances;
};

}  // namespace exchange
