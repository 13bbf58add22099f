#include "ItemList.h"

#include "RecordAccess.h"

namespace item_list {

std::vector<CalendarList> find(const View& view, const ListOptions& options,
                               std::span<const unsigned> projection) {
    const auto query = [&](const std::vector<store_access::Filter>& filters) {
        return CalendarStore::find(view.uri, filters, view.id, projection);
    };
    std::vector<CalendarList> lists;
    if (options.calendar > 0) {
        const CalendarRecord book = CalendarStore::calendar(options.calendar);
        if (options.account == 0 ||
            record_access::intOf(book.get(), CALENDAR_BOOK_ACCOUNT_ID) == options.account) {
            lists.push_back(query({{view.bookId, options.calendar}}));
        }
    } else if (options.account > 0) {
        record_access::forEach(CalendarStore::calendars(options.account), [&](calendar_record_h book) {
            lists.push_back(query({{view.bookId, record_access::intOf(book, CALENDAR_BOOK_ID)}}));
        });
    } else {
        lists.push_back(query({}));
    }
    return lists;
}

Action build(CLI::App& app, List asJson, List asTable) {
    auto options = std::make_shared<ListOptions>();
    command::addId(app, "--account", options->account, "Only those of this account");
    command::addId(app, "--calendar", options->calendar, "Only those of this calendar");
    command::addJson(app, options->isJson);
    return [options, asJson, asTable] {
        const CalendarStore store;
        options->isJson ? asJson(*options) : asTable(*options);
        return kExitDone;
    };
}

}  // namespace item_list
