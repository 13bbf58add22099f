// events: lists of events, exceptions of series included. One query a list, and no look-up per event.
#include "CalendarStore.h"
#include "Command.h"
#include "EventJson.h"
#include "Failure.h"
#include "Output.h"
#include "RecordAccess.h"

namespace {

struct Options {
    int account = 0;
    int calendar = 0;
    bool isJson = false;
};

constexpr unsigned kTableProjection[] = {CALENDAR_EVENT_ID,
                                         CALENDAR_EVENT_BOOK_ID,
                                         CALENDAR_EVENT_START,
                                         CALENDAR_EVENT_END,
                                         CALENDAR_EVENT_SUMMARY,
                                         CALENDAR_EVENT_FREQ,
                                         CALENDAR_EVENT_ORIGINAL_EVENT_ID};

// One list a calendar when they are chosen by calendar or account, else one list of all.
std::vector<CalendarList> find(const Options& options, std::span<const unsigned> projection) {
    const auto query = [&](std::vector<CalendarStore::Filter> filters) {
        return CalendarStore::find(_calendar_event, filters, CALENDAR_EVENT_ID, projection);
    };
    std::vector<CalendarList> lists;
    if (options.calendar > 0) {
        const CalendarRecord book = CalendarStore::calendar(options.calendar);
        if (options.account == 0 ||
            record_access::intOf(book.get(), CALENDAR_BOOK_ACCOUNT_ID) == options.account) {
            lists.push_back(query({{CALENDAR_EVENT_BOOK_ID, options.calendar}}));
        }
    } else if (options.account > 0) {
        record_access::forEach(CalendarStore::calendars(options.account), [&](calendar_record_h book) {
            const int id = record_access::intOf(book, CALENDAR_BOOK_ID);
            lists.push_back(query({{CALENDAR_EVENT_BOOK_ID, id}}));
        });
    } else {
        lists.push_back(query({}));
    }
    return lists;
}

void listJson(const Options& options) {
    const std::vector<CalendarList> lists = find(options, event_json::projection());
    output::JsonArray array;
    for (const CalendarList& list : lists) {
        record_access::forEach(list,
                               [&array](calendar_record_h event) { array.add(event_json::compose(event)); });
    }
    array.end();
}

std::string repeats(const Json& event) {
    if (!event["originalEvent"].is_null()) return "instance of " + event["originalEvent"].dump();
    return event["rrule"] == "" ? "" : "series";
}

void listTable(const Options& options) {
    const std::vector<CalendarList> lists = find(options, kTableProjection);
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
    auto options = std::make_shared<Options>();
    command::addId(app, "--account", options->account, "Only those of this account");
    command::addId(app, "--calendar", options->calendar, "Only those of this calendar");
    command::addJson(app, options->isJson);
    return [options] {
        const CalendarStore store;
        options->isJson ? listJson(*options) : listTable(*options);
        return kExitDone;
    };
}
