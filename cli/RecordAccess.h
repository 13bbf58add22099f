// RecordAccess.h: short reads and writes of calendar records. A refused write is a Failure that names the field.
#pragma once

#include <string>

#include "Failure.h"
#include "platform/calendar.h"

namespace record_access {

inline int intOf(calendar_record_h record, unsigned property) {
    int value = 0;
    return calendar_record_get_int(record, property, &value) == PLATFORM_ERROR_NONE ? value : 0;
}

inline std::string textOf(calendar_record_h record, unsigned property) {
    const char* value = nullptr;
    if (calendar_record_get_str_p(record, property, &value) != PLATFORM_ERROR_NONE || value == nullptr)
        return {};
    return value;
}

inline calendar_time_s timeOf(calendar_record_h record, unsigned property) {
    calendar_time_s value;
    return calendar_record_get_caltime(record, property, &value) == PLATFORM_ERROR_NONE ? value
                                                                                        : calendar_time_s{};
}

inline void setInt(calendar_record_h record, unsigned property, int value, const std::string& field) {
    check(calendar_record_set_int(record, property, value), "\"" + field + "\"");
}

inline void setText(calendar_record_h record, unsigned property, const std::string& value,
                    const std::string& field) {
    check(calendar_record_set_str(record, property, value.c_str()), "\"" + field + "\"");
}

inline void setTime(calendar_record_h record, unsigned property, const calendar_time_s& value,
                    const std::string& field) {
    check(calendar_record_set_caltime(record, property, value), "\"" + field + "\"");
}

inline CalendarRecord create(const char* view) {
    calendar_record_h record = nullptr;
    check(calendar_record_create(view, &record), "making a record");
    return CalendarRecord(record);
}

// Calls `use` for each child, in order.
template <class Use>
void forEachChild(calendar_record_h record, unsigned property, Use use) {
    unsigned count = 0;
    if (calendar_record_get_child_record_count(record, property, &count) != PLATFORM_ERROR_NONE) return;
    for (unsigned index = 0; index < count; ++index) {
        calendar_record_h child = nullptr;
        if (calendar_record_get_child_record_at_p(record, property, index, &child) == PLATFORM_ERROR_NONE)
            use(child);
    }
}

// Calls `use` for each record of a list, in order.
template <class Use>
void forEach(const CalendarList& list, Use use) {
    for (int code = calendar_list_first(list.get()); code == PLATFORM_ERROR_NONE;
         code = calendar_list_next(list.get())) {
        calendar_record_h record = nullptr;
        if (calendar_list_get_current_record_p(list.get(), &record) == PLATFORM_ERROR_NONE) use(record);
    }
}

}  // namespace record_access
