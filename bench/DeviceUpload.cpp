#include <stdexcept>

#include "DeviceSync.h"
#include "platform/calendar.h"

namespace bench {

namespace {

constexpr int64_t kFirstStart = 1780308000;  // 2026-06-01T10:00:00Z
constexpr int64_t kStep = 3600;
constexpr int kEventStore = 1;

void require(int code, const char* what) {
    if (code != PLATFORM_ERROR_NONE)
        throw std::runtime_error(std::string(what) + ": " + std::to_string(code));
}

int bookOf(int account) {
    calendar_query_h raw = nullptr;
    require(calendar_query_create(_calendar_book, &raw), "calendar_query_create");
    const CalendarQuery query(raw);
    require(calendar_query_add_filter_int(raw, CALENDAR_BOOK_ACCOUNT_ID, account), "filter");
    require(calendar_query_add_filter_int(raw, CALENDAR_BOOK_STORE_TYPE, kEventStore), "filter");
    calendar_list_h found = nullptr;
    require(calendar_db_get_records_with_query(raw, 0, 1, &found), "reading the calendars");
    const CalendarList list(found);
    calendar_record_h book = nullptr;
    int id = 0;
    require(calendar_list_first(found), "the account has no calendar");
    require(calendar_list_get_current_record_p(found, &book), "reading the calendars");
    require(calendar_record_get_int(book, CALENDAR_BOOK_ID, &id), "reading the calendars");
    return id;
}

CalendarRecord makeEvent(int book, int number) {
    calendar_record_h raw = nullptr;
    require(calendar_record_create(_calendar_event, &raw), "calendar_record_create");
    CalendarRecord event(raw);
    calendar_time_s start;
    start.utime = kFirstStart + number * kStep;
    calendar_time_s end = start;
    end.utime += kStep;
    require(calendar_record_set_int(raw, CALENDAR_EVENT_BOOK_ID, book), "book");
    require(
        calendar_record_set_str(raw, CALENDAR_EVENT_SUMMARY, ("Uploaded " + std::to_string(number)).c_str()),
        "summary");
    require(calendar_record_set_str(raw, CALENDAR_EVENT_DESCRIPTION, "Made on the device"), "description");
    require(calendar_record_set_str(raw, CALENDAR_EVENT_LOCATION, "Room 2"), "location");
    require(calendar_record_set_caltime(raw, CALENDAR_EVENT_START, start), "start");
    require(calendar_record_set_caltime(raw, CALENDAR_EVENT_END, end), "end");
    return event;
}

void insertEvents(int account, int count) {
    require(calendar_connect_with_flags(0), "the calendar store");
    const int book = bookOf(account);
    calendar_list_h raw = nullptr;
    require(calendar_list_create(&raw), "calendar_list_create");
    const CalendarList list(raw);
    for (int i = 0; i < count; ++i)
        require(calendar_list_add(raw, makeEvent(book, i).release()), "calendar_list_add");
    require(calendar_db_insert_records(raw), "adding the events");
}

}  // namespace

Cost uploadEvents(int account, int count) {
    KeyWatch dirty(stateKey(account, "calendar", "dirty"));
    if (settingOf(stateKey(account, "calendar", "dirty")) != 0)
        throw std::runtime_error("something waits to go up already");
    const pid_t daemon = daemonPid();
    const double cpu = cpuMsOf(daemon);
    insertEvents(account, count);
    const Stopwatch wall;
    dirty.wait([](int left) { return left == 0; });
    const double ms = wall.ms();
    if (settingOf(stateKey(account, "calendar", "up_result")) != 0)
        throw std::runtime_error("the upload failed");
    return {ms, cpuMsOf(daemon) - cpu};
}

}  // namespace bench
