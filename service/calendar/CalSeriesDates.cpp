#include "calendar/CalSeriesDates.h"

#include <iterator>
#include <span>

#include "calendar/CalExceptionDates.h"
#include "calendar/CalRecordAccess.h"
#include "platform/calendar.h"

namespace {

constexpr unsigned kDateProperties[] = {CALENDAR_EVENT_ID, CALENDAR_EVENT_EXDATE};

// The series with nothing but its exception dates, so that writing it touches nothing else.
int readDates(int seriesEventId, CalendarList* list, calendar_record_h* record) {
    calendar_query_h rawQuery = nullptr;
    if (const int code = calendar_query_create(_calendar_event, &rawQuery); code != PLATFORM_ERROR_NONE)
        return code;
    const CalendarQuery query(rawQuery);
    int code = calendar_query_add_filter_int(query.get(), CALENDAR_EVENT_ID, seriesEventId);
    if (code == PLATFORM_ERROR_NONE) {
        code = calendar_query_set_projection(query.get(), kDateProperties, std::size(kDateProperties));
    }
    calendar_list_h rawList = nullptr;
    if (code == PLATFORM_ERROR_NONE) code = calendar_db_get_records_with_query(query.get(), 0, 1, &rawList);
    if (code != PLATFORM_ERROR_NONE) return code;
    list->reset(rawList);
    if (calendar_list_first(rawList) != PLATFORM_ERROR_NONE) return PLATFORM_ERROR_NOT_FOUND;
    return calendar_list_get_current_record_p(rawList, record);
}

}  // namespace

int changeExceptionDates(int seriesEventId, const std::vector<std::pair<std::string, bool>>& changes,
                         int expectedVersion, int* version) {
    *version = 0;
    CalendarList list;
    calendar_record_h series = nullptr;
    if (const int code = readDates(seriesEventId, &list, &series); code != PLATFORM_ERROR_NONE) return code;

    const std::string before = cal_record::textOf(series, CALENDAR_EVENT_EXDATE);
    std::string dates = before;
    for (const auto& [recurrenceId, cancelled] : changes) {
        dates = cancelled ? exception_dates::with(dates, recurrenceId)
                          : exception_dates::without(dates, recurrenceId);
    }
    if (dates == before) return PLATFORM_ERROR_NONE;

    if (const int code = calendar_record_set_str(series, CALENDAR_EVENT_EXDATE, dates.c_str());
        code != PLATFORM_ERROR_NONE) {
        return code;
    }
    const record_write_options_s options{.by_sync = true,
                                         .expected_versions = std::span(&expectedVersion, 1)};
    if (const int code = calendar_db_update_record(series, options); code != PLATFORM_ERROR_NONE) return code;
    return calendar_db_get_last_change_version(version);
}
