// RecordAccess.h: short reads and writes of records of both services. A refused write is a Failure that names the field.
#pragma once

#include <string>

#include "Failure.h"
#include "platform/calendar.h"
#include "platform/calendar_read.h"

namespace record_access {

using calendar_read::forEachChild;
using calendar_read::intOf;
using calendar_read::textOf;

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

// Calls `use` for each record of a list, in order.
template <class List, class Use>
void forEach(const List& list, Use use) {
    calendar_read::forEach(list.get(), use);
}

}  // namespace record_access
