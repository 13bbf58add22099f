// calendars: the books of the device's calendar store.
#include "CalendarStore.h"
#include "Command.h"
#include "ItemCommand.h"
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

void listJson(std::optional<int> account) {
    output::JsonArray array;
    record_access::forEach(CalendarStore::calendars(account),
                           [&array](calendar_record_h book) { array.add(calendarJson(book)); });
    array.end();
}

void listTable(std::optional<int> account) {
    output::Table table({"ID", "ACCOUNT", "KIND", "MODE", "NAME"});
    record_access::forEach(CalendarStore::calendars(account), [&table](calendar_record_h record) {
        const Json book = calendarJson(record);
        table.add({book["id"].dump(), book["account"].dump(), book["kind"],
                   book["readOnly"] ? "read-only" : "", book["name"]});
    });
    table.print();
}

}  // namespace

Action buildCalendarsList(CLI::App& app) {
    return item_command::buildAccountList<CalendarStore>(app, listJson, listTable);
}
