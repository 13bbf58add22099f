// events: lists of events, exceptions of series included. One query a list, and no look-up per event.
#include "CalendarStore.h"
#include "Command.h"
#include "EventJson.h"
#include "ItemList.h"
#include "Output.h"
#include "RecordAccess.h"

namespace {

constexpr item_list::View kView{_calendar_event, CALENDAR_EVENT_ID, CALENDAR_EVENT_BOOK_ID};
constexpr unsigned kTableProjection[] = {CALENDAR_EVENT_ID,
                                         CALENDAR_EVENT_BOOK_ID,
                                         CALENDAR_EVENT_START,
                                         CALENDAR_EVENT_END,
                                         CALENDAR_EVENT_SUMMARY,
                                         CALENDAR_EVENT_FREQ,
                                         CALENDAR_EVENT_ORIGINAL_EVENT_ID};

void listJson(const ListOptions& options) {
    const std::vector<CalendarList> lists = item_list::find(kView, options, event_json::projection());
    output::JsonArray array;
    for (const CalendarList& list : lists) {
        record_access::forEach(list,
                               [&array](calendar_record_h event) { array.add(event_json::compose(event)); });
    }
    array.end();
}

std::string repeats(const Json& event) {
    if (!event["originalEvent"].is_null()) return "instance of " + event["originalEvent"].dump();
    return event["rrule"].get_ref<const std::string&>().empty() ? "" : "series";
}

void listTable(const ListOptions& options) {
    const std::vector<CalendarList> lists = item_list::find(kView, options, kTableProjection);
    output::Table table({"ID", "CALENDAR", "START", "END", "REPEATS", "SUMMARY"});
    for (const CalendarList& list : lists) {
        record_access::forEach(list, [&table](calendar_record_h record) {
            const Json event = event_json::compose(record);
            table.add({event["id"].dump(), event["calendar"].dump(), event["start"], event["end"],
                       repeats(event), event["summary"]});
        });
    }
    table.print();
}

}  // namespace

Action buildEventsList(CLI::App& app) {
    return item_list::build(app, listJson, listTable);
}
