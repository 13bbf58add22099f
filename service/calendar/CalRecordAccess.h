// Short reads of calendar records for code that knows its properties: a read that the store refuses (a property of another
// view) is a fault of this program and yields the type's empty value.
#pragma once

#include <string>

#include "platform/calendar.h"

namespace cal_record {

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

// Calls `use` for each record of a list.
template <class Use>
void forEach(calendar_list_h list, Use use) {
    for (int code = calendar_list_first(list); code == PLATFORM_ERROR_NONE; code = calendar_list_next(list)) {
        calendar_record_h record = nullptr;
        if (calendar_list_get_current_record_p(list, &record) == PLATFORM_ERROR_NONE) use(record);
    }
}

}  // namespace cal_record
