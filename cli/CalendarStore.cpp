#include "CalendarStore.h"

#include "Failure.h"
#include "Names.h"
#include "RecordAccess.h"

CalendarStore::CalendarStore() {
    check(calendar_connect_with_flags(0), "the calendar store");
}

CalendarStore::~CalendarStore() {
    calendar_disconnect();
}

namespace {

using CalendarService =
    store_access::Service<calendar_query_create, calendar_db_get_records_with_query, CalendarList>;
using store_access::Filter;

}  // namespace

CalendarList CalendarStore::find(const char* view, const std::vector<Filter>& filters, unsigned sortBy,
                                 std::span<const unsigned> projection) {
    return store_access::find<CalendarService>("the calendar store", view, filters, sortBy, projection);
}

CalendarList CalendarStore::calendars(std::optional<int> account) {
    std::vector<Filter> filters;
    if (account) filters.push_back({CALENDAR_BOOK_ACCOUNT_ID, *account});
    return find(_calendar_book, filters, CALENDAR_BOOK_ID);
}

CalendarRecord CalendarStore::calendar(int id) {
    calendar_record_h record = nullptr;
    const int code = calendar_db_get_record(_calendar_book, id, &record);
    if (code == PLATFORM_ERROR_NOT_FOUND) {
        throw Failure("there is no calendar " + std::to_string(id) +
                      "; see: vantor-pim-syncctl calendars list");
    }
    check(code, "reading the calendar " + std::to_string(id));
    return CalendarRecord(record);
}

FoundItem CalendarStore::event(int id, std::span<const unsigned> projection) {
    return store_access::one(find(_calendar_event, {{CALENDAR_EVENT_ID, id}}, CALENDAR_EVENT_ID, projection),
                             "event", id);
}

FoundItem CalendarStore::todo(int id, std::span<const unsigned> projection) {
    return store_access::one(find(_calendar_todo, {{CALENDAR_TODO_ID, id}}, CALENDAR_TODO_ID, projection),
                             "todo", id);
}

void CalendarStore::checkWritable(int calendarId, const char* kind) {
    const CalendarRecord book = calendar(calendarId);
    const std::string_view held =
        nameOf(kStoreTypes, record_access::intOf(book.get(), CALENDAR_BOOK_STORE_TYPE));
    if (held != kind) {
        throw Failure("the calendar " + std::to_string(calendarId) + " holds " + std::string(held) +
                      "s, not " + kind + "s");
    }
    if (record_access::intOf(book.get(), CALENDAR_BOOK_MODE) == kModeReadOnly) {
        throw Failure("the calendar " + std::to_string(calendarId) + " is read-only; its " + kind +
                      "s can only be copied");
    }
}

CalendarTransaction::CalendarTransaction() {
    check(calendar_db_begin_transaction(), "writing the calendar store");
}

CalendarTransaction::~CalendarTransaction() {
    if (mIsOpen) static_cast<void>(calendar_db_end_transaction(/*commit=*/false));
}

void CalendarTransaction::commit() {
    mIsOpen = false;
    check(calendar_db_end_transaction(/*commit=*/true), "writing the calendar store");
}
