#include "CalendarViews.h"

#include "platform/calendar.h"

namespace platform::records {

namespace {

constexpr Property readOnly(unsigned id, const char* column) {
    return {id, Type::kInt, column, 0, true};
}
constexpr Property children(unsigned id, const char* view) {
    return {id, Type::kChildren, nullptr, 0, false, view};
}

constexpr Property kBookProperties[] = {
    readOnly(CALENDAR_BOOK_ID, "id"),
    {CALENDAR_BOOK_ACCOUNT_ID, Type::kInt, "account_id"},
    {CALENDAR_BOOK_STORE_TYPE, Type::kInt, "store_type", 1},
    {CALENDAR_BOOK_NAME, Type::kText, "name"},
    {CALENDAR_BOOK_COLOR, Type::kText, "color"},
    {CALENDAR_BOOK_MODE, Type::kInt, "mode"},
    {CALENDAR_BOOK_SYNC_DATA1, Type::kText, "sync_data1"},
    readOnly(CALENDAR_BOOK_VERSION, "version"),
    readOnly(CALENDAR_BOOK_SYNCED_VERSION, "synced_version"),
};

constexpr Property kEventProperties[] = {
    readOnly(CALENDAR_EVENT_ID, "id"),
    {CALENDAR_EVENT_BOOK_ID, Type::kInt, "book_id"},
    {CALENDAR_EVENT_UID, Type::kText, "uid"},
    {CALENDAR_EVENT_SUMMARY, Type::kText, "summary"},
    {CALENDAR_EVENT_DESCRIPTION, Type::kText, "description"},
    {CALENDAR_EVENT_LOCATION, Type::kText, "location"},
    {CALENDAR_EVENT_STATUS, Type::kInt, "status", 1},
    {CALENDAR_EVENT_START, Type::kTime, "start_time"},
    {CALENDAR_EVENT_END, Type::kTime, "end_time"},
    {CALENDAR_EVENT_START_TZID, Type::kText, "start_tzid"},
    {CALENDAR_EVENT_END_TZID, Type::kText, "end_tzid"},
    {CALENDAR_EVENT_SENSITIVITY, Type::kInt, "sensitivity", 2},
    {CALENDAR_EVENT_BUSY_STATUS, Type::kInt, "busy_status", 1},
    {CALENDAR_EVENT_ORGANIZER_NAME, Type::kText, "organizer_name"},
    {CALENDAR_EVENT_ORGANIZER_EMAIL, Type::kText, "organizer_email"},
    {CALENDAR_EVENT_MEETING_STATUS, Type::kInt, "meeting_status"},
    {CALENDAR_EVENT_FREQ, Type::kInt, "freq"},
    {CALENDAR_EVENT_RANGE_TYPE, Type::kInt, "range_type", 2},
    {CALENDAR_EVENT_COUNT, Type::kInt, "range_count"},
    {CALENDAR_EVENT_UNTIL, Type::kTime, "range_until"},
    {CALENDAR_EVENT_INTERVAL, Type::kInt, "freq_interval", 1},
    {CALENDAR_EVENT_BYDAY, Type::kText, "byday"},
    {CALENDAR_EVENT_BYMONTHDAY, Type::kText, "bymonthday"},
    {CALENDAR_EVENT_BYYEARDAY, Type::kText, "byyearday"},
    {CALENDAR_EVENT_BYWEEKNO, Type::kText, "byweekno"},
    {CALENDAR_EVENT_BYMONTH, Type::kText, "bymonth"},
    {CALENDAR_EVENT_BYSETPOS, Type::kText, "bysetpos"},
    {CALENDAR_EVENT_WKST, Type::kInt, "wkst", 2},
    {CALENDAR_EVENT_EXDATE, Type::kText, "exdate"},
    {CALENDAR_EVENT_RECURRENCE_ID, Type::kText, "recurrence_id"},
    {CALENDAR_EVENT_ORIGINAL_EVENT_ID, Type::kInt, "original_event_id"},
    {CALENDAR_EVENT_SYNC_DATA1, Type::kText, "sync_data1"},
    {CALENDAR_EVENT_SYNC_DATA2, Type::kText, "sync_data2"},
    readOnly(CALENDAR_EVENT_VERSION, "version"),
    readOnly(CALENDAR_EVENT_SYNCED_VERSION, "synced_version"),
    readOnly(CALENDAR_EVENT_OWN_VERSION, "own_version"),
    children(CALENDAR_EVENT_ATTENDEES, _calendar_attendee),
    children(CALENDAR_EVENT_ALARMS, _calendar_alarm),
    children(CALENDAR_EVENT_EXCEPTIONS, _calendar_event),
};

constexpr Property kTodoProperties[] = {
    readOnly(CALENDAR_TODO_ID, "id"),
    {CALENDAR_TODO_BOOK_ID, Type::kInt, "book_id"},
    {CALENDAR_TODO_UID, Type::kText, "uid"},
    {CALENDAR_TODO_SUMMARY, Type::kText, "summary"},
    {CALENDAR_TODO_NOTE, Type::kText, "note"},
    {CALENDAR_TODO_HAS_DUE, Type::kInt, "has_due"},
    {CALENDAR_TODO_DUE, Type::kTime, "due"},
    {CALENDAR_TODO_STATUS, Type::kInt, "status", 1},
    {CALENDAR_TODO_COMPLETED_TIME, Type::kLong, "completed_time"},
    {CALENDAR_TODO_SYNC_DATA1, Type::kText, "sync_data1"},
    {CALENDAR_TODO_SYNC_DATA2, Type::kText, "sync_data2"},
    readOnly(CALENDAR_TODO_VERSION, "version"),
    readOnly(CALENDAR_TODO_SYNCED_VERSION, "synced_version"),
};

constexpr Property kAttendeeProperties[] = {
    {CALENDAR_ATTENDEE_NAME, Type::kText, "name"},
    {CALENDAR_ATTENDEE_EMAIL, Type::kText, "email"},
    {CALENDAR_ATTENDEE_ROLE, Type::kInt, "role"},
    {CALENDAR_ATTENDEE_STATUS, Type::kInt, "status"},
};

constexpr Property kAlarmProperties[] = {
    {CALENDAR_ALARM_TICK, Type::kInt, "tick"},
    {CALENDAR_ALARM_TICK_UNIT, Type::kInt, "tick_unit", 60},
};

constexpr Property kInfoProperties[] = {
    {CALENDAR_UPDATED_INFO_ID, Type::kInt, nullptr},
    {CALENDAR_UPDATED_INFO_BOOK_ID, Type::kInt, nullptr},
    {CALENDAR_UPDATED_INFO_MODIFIED_STATUS, Type::kInt, nullptr},
    {CALENDAR_UPDATED_INFO_VERSION, Type::kInt, nullptr},
    {CALENDAR_UPDATED_INFO_SYNCED_VERSION, Type::kInt, nullptr},
};

constexpr View kInfo{.uri = _calendar_updated_info, .role = Role::kInfo, .properties = kInfoProperties};

constexpr FeedShape kFeed{.view = &kInfo,
                          .id = CALENDAR_UPDATED_INFO_ID,
                          .book = CALENDAR_UPDATED_INFO_BOOK_ID,
                          .change = CALENDAR_UPDATED_INFO_MODIFIED_STATUS,
                          .version = CALENDAR_UPDATED_INFO_VERSION,
                          .syncedVersion = CALENDAR_UPDATED_INFO_SYNCED_VERSION};

constexpr View kBook{.uri = _calendar_book,
                     .role = Role::kBook,
                     .table = "books",
                     .properties = kBookProperties,
                     .idProperty = CALENDAR_BOOK_ID};

constexpr View kEvent{.uri = _calendar_event,
                      .role = Role::kItem,
                      .table = "events",
                      .properties = kEventProperties,
                      .idProperty = CALENDAR_EVENT_ID,
                      .bookProperty = CALENDAR_EVENT_BOOK_ID,
                      .bookView = _calendar_book,
                      .bookTypeProperty = CALENDAR_BOOK_STORE_TYPE,
                      .bookType = 1,
                      .feed = &kFeed,
                      .seriesProperty = CALENDAR_EVENT_ORIGINAL_EVENT_ID,
                      .instanceProperty = CALENDAR_EVENT_RECURRENCE_ID,
                      .exceptionsProperty = CALENDAR_EVENT_EXCEPTIONS,
                      .keptOnReplace = CALENDAR_EVENT_EXDATE};

constexpr View kTodo{.uri = _calendar_todo,
                     .role = Role::kItem,
                     .table = "todos",
                     .properties = kTodoProperties,
                     .idProperty = CALENDAR_TODO_ID,
                     .bookProperty = CALENDAR_TODO_BOOK_ID,
                     .bookView = _calendar_book,
                     .bookTypeProperty = CALENDAR_BOOK_STORE_TYPE,
                     .bookType = 2,
                     .feed = &kFeed};

constexpr View kAttendee{
    .uri = _calendar_attendee, .role = Role::kChild, .table = "attendees", .properties = kAttendeeProperties};
constexpr View kAlarm{
    .uri = _calendar_alarm, .role = Role::kChild, .table = "alarms", .properties = kAlarmProperties};

// The position of a view is its bit in the notes of who wrote what: add at the end only.
constexpr const View* kViews[] = {&kBook, &kEvent, &kTodo, &kAttendee, &kAlarm, &kInfo};

}  // namespace

Store& calendarStore() {
    static Store* const store = new Store("/opt/usr/data/records/calendar.db", kViews);
    return *store;
}

}  // namespace platform::records
