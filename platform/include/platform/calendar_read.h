// Short reads of calendar records for code that knows its properties: a read that the store refuses (a property of another
// view) is a fault of the caller and yields the type's empty value.
#pragma once

#include <string>
#include <utility>
#include <vector>

#include "platform/calendar.h"

namespace calendar_read {

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
void forEach(calendar_list_h list, Use use) {
    for (int code = calendar_list_first(list); code == PLATFORM_ERROR_NONE; code = calendar_list_next(list)) {
        calendar_record_h record = nullptr;
        if (calendar_list_get_current_record_p(list, &record) == PLATFORM_ERROR_NONE) use(record);
    }
}

// Calls `use` for each record with `value` in `filtered`, of which only `properties` are read. Of the service whose functions are given.
template <auto CreateQuery, auto ForEach, class Use>
int forEachPartFrom(const char* view, unsigned filtered, int value, const std::vector<unsigned>& properties,
                    Use use) {
    calendar_query_h rawQuery = nullptr;
    if (const int code = CreateQuery(view, &rawQuery); code != PLATFORM_ERROR_NONE) return code;
    const CalendarQuery query(rawQuery);
    int code = calendar_query_add_filter_int(rawQuery, filtered, value);
    if (code == PLATFORM_ERROR_NONE)
        code = calendar_query_set_projection(rawQuery, properties.data(), properties.size());
    if (code != PLATFORM_ERROR_NONE) return code;
    return ForEach(
        rawQuery, [](calendar_record_h record, void* any) { (*static_cast<Use*>(any))(record); }, &use);
}

template <class Use>
int forEachPart(const char* view, unsigned filtered, int value, const std::vector<unsigned>& properties,
                Use use) {
    return forEachPartFrom<calendar_query_create, calendar_db_for_each_record>(view, filtered, value,
                                                                               properties, std::move(use));
}

// Calls `use` for each entry of the change feed.
template <class Use>
int forEachChange(const char* view, int bookId, int since, int* current, Use use) {
    return calendar_db_for_each_change(
        view, bookId, since, [](calendar_record_h record, void* any) { (*static_cast<Use*>(any))(record); },
        &use, current);
}

// The record with this id and nothing but `properties` of it, so that writing it touches nothing else. It belongs to `list`.
// Of the service whose functions are given.
template <auto CreateQuery, auto GetRecords, class List>
int readPartFrom(const char* view, unsigned idProperty, int id, const std::vector<unsigned>& properties,
                 List* list, calendar_record_h* record) {
    calendar_query_h rawQuery = nullptr;
    if (const int code = CreateQuery(view, &rawQuery); code != PLATFORM_ERROR_NONE) return code;
    const CalendarQuery query(rawQuery);
    int code = calendar_query_add_filter_int(rawQuery, idProperty, id);
    if (code == PLATFORM_ERROR_NONE)
        code = calendar_query_set_projection(rawQuery, properties.data(), properties.size());
    calendar_list_h rawList = nullptr;
    if (code == PLATFORM_ERROR_NONE) code = GetRecords(rawQuery, 0, 1, &rawList);
    if (code != PLATFORM_ERROR_NONE) return code;
    list->reset(rawList);
    if (calendar_list_first(rawList) != PLATFORM_ERROR_NONE) return PLATFORM_ERROR_NOT_FOUND;
    return calendar_list_get_current_record_p(rawList, record);
}

inline int readPart(const char* view, unsigned idProperty, int id, const std::vector<unsigned>& properties,
                    CalendarList* list, calendar_record_h* record) {
    return readPartFrom<calendar_query_create, calendar_db_get_records_with_query>(view, idProperty, id,
                                                                                   properties, list, record);
}

}  // namespace calendar_read
