// export: events and to-dos as a calendar file, contacts as cards.
#include <map>

#include "CalendarStore.h"
#include "Command.h"
#include "ContactJson.h"
#include "ContactsStore.h"
#include "EventJson.h"
#include "Failure.h"
#include "ItemList.h"
#include "Names.h"
#include "Output.h"
#include "PhotoFile.h"
#include "RecordAccess.h"
#include "TodoJson.h"
#include "exchange/GroupNames.h"
#include "exchange/ICalendarWriter.h"
#include "exchange/Identity.h"
#include "exchange/OutputFile.h"
#include "exchange/VCardWriter.h"

namespace {

using namespace exchange;  // NOLINT(google-build-using-namespace): the command of that folder
using record_access::intOf;

constexpr item_list::View kEvents{_calendar_event, CALENDAR_EVENT_ID, CALENDAR_EVENT_BOOK_ID};
constexpr item_list::View kTodos{_calendar_todo, CALENDAR_TODO_ID, CALENDAR_TODO_BOOK_ID};
constexpr ContactsStore::View kContacts{_contacts_contact, CONTACTS_CONTACT_ID,
                                        CONTACTS_CONTACT_ADDRESS_BOOK_ID};

struct Options {
    ListOptions list;
    std::string file = "-";
};

// A mistyped place must not pass for an empty backup.
void checkPlace(const ListOptions& options, const std::string& kind) {
    if (options.calendar > 0) {
        const CalendarRecord book = CalendarStore::calendar(options.calendar);
        const std::string held(nameOf(kStoreTypes, intOf(book.get(), CALENDAR_BOOK_STORE_TYPE)));
        if (held != kind)
            throw Failure("the calendar " + std::to_string(options.calendar) + " holds " + held + "s, not " +
                          kind + "s");
        if (options.account > 0 && intOf(book.get(), CALENDAR_BOOK_ACCOUNT_ID) != options.account)
            throw Failure("the calendar " + std::to_string(options.calendar) + " is another account's");
        return;
    }
    if (options.account == 0) return;
    bool isThere = false;
    record_access::forEach(CalendarStore::calendars(options.account),
                           [&](calendar_record_h) { isThere = true; });
    if (!isThere) {
        throw Failure("the account " + std::to_string(options.account) +
                      " has no calendars on this device; see: vantor-pim-syncctl calendars list");
    }
}

// What was left out is told; it does not make the rest useless.
int finish(OutputFile& file, const NotHeld& losses, int count, const char* what) {
    file.finish();
    losses.print("not written, a file has no place for it:");
    output::progress(std::to_string(count) + " " + what + " exported");
    return kExitDone;
}

std::string uidOf(const char* kind, const Json& item) {
    const std::string& uid = item["uid"].get_ref<const std::string&>();
    return uid.empty() ? identity::uidOf(kind, item["id"]) : uid;
}

// --- events -----------------------------------------------------------------------------------------------------

using Series = std::map<int, SeriesPlace>;

// The zones come first in the file, and an instance is named after its series: both are known before the first event
// is written.
Series lookAhead(const std::vector<CalendarList>& lists, ICalendarWriter& writer) {
    Series series;
    for (const CalendarList& list : lists) {
        record_access::forEach(list, [&](calendar_record_h record) {
            const Json event = event_json::compose(record);
            writer.noteZone(event);
            if (!event["rrule"].get_ref<const std::string&>().empty())
                series[event["id"]] = {uidOf("event", event), event["timeZone"]};
        });
    }
    return series;
}

int exportEvents(const Options& options) {
    const CalendarStore store;
    checkPlace(options.list, "event");
    const std::vector<CalendarList> lists = item_list::find(kEvents, options.list, event_json::projection());
    NotHeld losses;
    TimeZones zones;
    ICalendarWriter writer(zones, losses);
    const Series series = lookAhead(lists, writer);
    OutputFile file(options.file);
    file.write(ICalendarWriter::header() + writer.zones());
    int count = 0;
    for (const CalendarList& list : lists) {
        record_access::forEach(list, [&](calendar_record_h record) {
            const Json event = event_json::compose(record);
            const auto ofSeries =
                event["originalEvent"].is_null() ? series.end() : series.find(event["originalEvent"]);
            const std::string text = writer.event(event, uidOf("event", event),
                                                  ofSeries != series.end() ? &ofSeries->second : nullptr);
            if (text.empty()) losses.add("events with a time that has no spelling");
            file.write(text);
            count += text.empty() ? 0 : 1;
        });
    }
    file.write(ICalendarWriter::footer());
    return finish(file, losses, count, "events");
}

int exportTodos(const Options& options) {
    const CalendarStore store;
    checkPlace(options.list, "todo");
    NotHeld losses;
    TimeZones zones;
    ICalendarWriter writer(zones, losses);
    OutputFile file(options.file);
    file.write(ICalendarWriter::header());
    int count = 0;
    for (const CalendarList& list : item_list::find(kTodos, options.list, todo_json::projection())) {
        record_access::forEach(list, [&](calendar_record_h record) {
            const Json todo = todo_json::compose(record);
            const std::string text = writer.todo(todo, uidOf("todo", todo));
            if (text.empty()) losses.add("to-dos with a time that has no spelling");
            file.write(text);
            count += text.empty() ? 0 : 1;
        });
    }
    file.write(ICalendarWriter::footer());
    return finish(file, losses, count, "to-dos");
}

// --- contacts ---------------------------------------------------------------------------------------------------

int exportContacts(const Options& options) {
    const ContactsStore store;
    const std::optional<int> account =
        options.list.account > 0 ? std::optional(options.list.account) : std::nullopt;
    const BookAccounts accounts = ContactsStore::accounts(account);
    if (account && accounts.empty()) static_cast<void>(ContactsStore::bookOf(*account));
    const std::map<int, std::string> groups = groupNames(account);
    NotHeld losses;
    VCardWriter writer(losses);
    OutputFile file(options.file);
    int count = 0;
    for (const ContactsList& list :
         ContactsStore::ofAccount(kContacts, account, contact_json::projection())) {
        record_access::forEach(list, [&](contacts_record_h record) {
            const Json contact = contact_json::compose(record, /*account=*/0);
            CardExtras extras{identity::uidOf("contact", contact["id"]), {}, ""};
            for (const Json& id : contact["groups"]) {
                const auto group = groups.find(id);
                if (group != groups.end()) extras.groups.push_back(group->second);
            }
            const std::string photo = contact_json::photoOf(record);
            try {
                if (!photo.empty()) extras.photo = photo_file::read(photo);
            } catch (const Failure&) {
                losses.add("photos that cannot be read");
            }
            file.write(writer.card(contact, extras));
            ++count;
        });
    }
    return finish(file, losses, count, "contacts");
}

Action build(CLI::App& app, int (*run)(const Options& options), bool hasCalendars) {
    auto options = std::make_shared<Options>();
    command::addId(app, "--account", options->list.account, "Only those of this account");
    if (hasCalendars)
        command::addId(app, "--calendar", options->list.calendar, "Only those of this calendar");
    app.add_option("FILE", options->file,
                   "Where they go, replaced only whole; '-' (the default) is standard output");
    return [options, run] { return run(*options); };
}

}  // namespace

Action buildExportEvents(CLI::App& app) {
    return build(app, exportEvents, /*hasCalendars=*/true);
}

Action buildExportTodos(CLI::App& app) {
    return build(app, exportTodos, /*hasCalendars=*/true);
}

Action buildExportContacts(CLI::App& app) {
    return build(app, exportContacts, /*hasCalendars=*/false);
}
