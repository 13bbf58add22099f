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

CalendarList CalendarStore::find(const char* view, const std::vector<Filter>& filters, unsigned sortBy,
                                 std::span<const unsigned> projection) {
    calendar_query_h raw = nullptr;
    check(calendar_query_create(view, &raw), "the calendar store");
    const CalendarQuery query(raw);
    for (const Filter& filter : filters) {
        check(calendar_query_add_filter_int(query.get(), filter.property, filter.value),
              "the calendar store");
    }
    if (!projection.empty()) {
        check(calendar_query_set_projection(query.get(), projection.data(), projection.size()),
              "the calendar store");
    }
    check(calendar_query_set_sort(query.get(), sortBy, /*ascending=*/true), "the calendar store");
    calendar_list_h list = nullptr;
    check(calendar_db_get_records_with_query(query.get(), 0, 0, &list), "reading the calendar store");
    return CalendarList(list);
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

namespace {

FoundItem item(const char* view, unsigned idProperty, int id, std::span<const unsigned> projection,
               const char* name) {
    CalendarList list = CalendarStore::find(view, {{idProperty, id}}, idProperty, projection);
    calendar_record_h found = nullptr;
    if (calendar_list_first(list.get()) != PLATFORM_ERROR_NONE ||
        calendar_list_get_current_record_p(list.get(), &found) != PLATFORM_ERROR_NONE) {
        throw Failure(std::string("there is no ") + name + " " + std::to_string(id) +
                      "; see: vantor-pim-syncctl " + name + "s list");
    }
    return {std::move(list), found};
}

}  // namespace

FoundItem CalendarStore::event(int id, std::span<const unsigned> projection) {
    return item(_calendar_event, CALENDAR_EVENT_ID, id, projection, "event");
}

FoundItem CalendarStore::todo(int id, std::span<const unsigned> projection) {
    return item(_calendar_todo, CALENDAR_TODO_ID, id, projection, "todo");
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
