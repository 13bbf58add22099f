// calendars: the books of the device's calendar store.
#include <cstdio>

#include "CalendarStore.h"
#include "Command.h"
#include "Failure.h"
#include "Names.h"
#include "Output.h"
#include "RecordAccess.h"
#include "TextFields.h"

namespace {

using record_access::intOf;
using record_access::textOf;

Json calendarJson(calendar_record_h book) {
    return {{"id", intOf(book, CALENDAR_BOOK_ID)},
            {"account", intOf(book, CALENDAR_BOOK_ACCOUNT_ID)},
            {"kind", std::string(nameOf(kStoreTypes, intOf(book, CALENDAR_BOOK_STORE_TYPE)))},
            {"name", textOf(book, CALENDAR_BOOK_NAME)},
            {"color", text_fields::webColor(textOf(book, CALENDAR_BOOK_COLOR))},
            {"readOnly", intOf(book, CALENDAR_BOOK_MODE) == kModeReadOnly}};
}

struct Options {
    int account = 0;
    bool isJson = false;
};

void listJson(const CalendarList& books) {
    output::JsonArray array;
    record_access::forEach(books, [&array](calendar_record_h book) { array.add(calendarJson(book)); });
    array.end();
}

void listTable(const CalendarList& books) {
    output::Table table({"ID", "ACCOUNT", "KIND", "MODE", "NAME"});
    record_access::forEach(books, [&table](calendar_record_h record) {
        const Json book = calendarJson(record);
        table.add({book["id"].dump(), book["account"].dump(), book["kind"],
                   book["readOnly"] ? "read-only" : "", book["name"]});
    });
    table.print();
}

}  // namespace

Action buildCalendarsList(CLI::App& app) {
    auto options = std::make_shared<Options>();
    command::addId(app, "--account", options->account, "Only those of this account");
    command::addJson(app, options->isJson);
    return [options] {
        const CalendarStore store;
        const CalendarList books =
            CalendarStore::calendars(options->account > 0 ? std::optional(options->account) : std::nullopt);
        options->isJson ? listJson(books) : listTable(books);
        return kExitDone;
    };
}
