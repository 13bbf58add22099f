#include "calendar/CalSeriesDates.h"

#include <span>

#include "calendar/CalExceptionDates.h"
#include "platform/calendar.h"
#include "platform/calendar_read.h"

int changeExceptionDates(int seriesEventId, const std::vector<std::pair<std::string, bool>>& changes,
                         int expectedVersion, int* version) {
    *version = 0;
    CalendarList list;
    calendar_record_h series = nullptr;
    if (const int code = calendar_read::readPart(_calendar_event, CALENDAR_EVENT_ID, seriesEventId,
                                                 {CALENDAR_EVENT_ID, CALENDAR_EVENT_EXDATE}, &list, &series);
        code != PLATFORM_ERROR_NONE)
        return code;

    const std::string before = calendar_read::textOf(series, CALENDAR_EVENT_EXDATE);
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
