// event: show, add, set and delete one event. What the tool writes is a user's edit: the daemon takes it to the server.
#include "CalendarStore.h"
#include "Command.h"
#include "EventFields.h"
#include "EventJson.h"
#include "Failure.h"
#include "ItemCommand.h"
#include "Output.h"
#include "RecordAccess.h"
#include "TimeText.h"

namespace {

using record_access::intOf;
using record_access::textOf;

std::string named(int id) {
    return "the event " + std::to_string(id);
}

// --- add ------------------------------------------------------------------------------------------------------------

// The exception that the instance has, 0 when it has none.
int exceptionOf(int seriesId, const std::string& instance) {
    int id = 0;
    const CalendarList siblings =
        CalendarStore::find(_calendar_event, {{CALENDAR_EVENT_ORIGINAL_EVENT_ID, seriesId}},
                            CALENDAR_EVENT_ID, event_json::projection());
    record_access::forEach(siblings, [&](calendar_record_h sibling) {
        if (textOf(sibling, CALENDAR_EVENT_RECURRENCE_ID) == instance) id = intOf(sibling, CALENDAR_EVENT_ID);
    });
    return id;
}

// An exception stands in the calendar of its series, for an instance that is neither changed nor cancelled yet.
void placeInSeries(const event_json::NewEvent& event) {
    const int seriesId = *event.originalEvent;
    const FoundItem series = CalendarStore::event(seriesId, event_json::projection());
    if (intOf(series.get(), CALENDAR_EVENT_FREQ) == 0) throw Failure(named(seriesId) + " is no series");
    const bool isAllDay = time_text::isDate(record_access::timeOf(series.get(), CALENDAR_EVENT_START));
    if (time_text::isDate(*time_text::parseCompact(event.recurrenceId)) != isAllDay) {
        throw Failure(
            "the member \"recurrenceId\" must be a date for an all-day series, and a time otherwise");
    }
    for (const std::string& date : event_fields::splitDates(textOf(series.get(), CALENDAR_EVENT_EXDATE))) {
        if (date == event.recurrenceId)
            throw Failure("the instance " + date + " of " + named(seriesId) + " is cancelled");
    }
    if (const int id = exceptionOf(seriesId, event.recurrenceId); id != 0) {
        throw Failure("the instance " + event.recurrenceId + " is changed already; change the event " +
                      std::to_string(id) + " instead");
    }
    const int calendarId = intOf(series.get(), CALENDAR_EVENT_BOOK_ID);
    CalendarStore::checkWritable(calendarId, "event");
    record_access::setInt(event.record.get(), CALENDAR_EVENT_BOOK_ID, calendarId, "calendar");
    record_access::setInt(event.record.get(), CALENDAR_EVENT_ORIGINAL_EVENT_ID, seriesId, "originalEvent");
    record_access::setText(event.record.get(), CALENDAR_EVENT_RECURRENCE_ID, event.recurrenceId,
                           "recurrenceId");
}

void placeInCalendar(const event_json::NewEvent& event, int chosen) {
    const int calendarId = chosen > 0 ? chosen : event.calendar.value_or(0);
    if (calendarId == 0) throw Failure("the member \"calendar\" is missing; add it or give --calendar ID");
    CalendarStore::checkWritable(calendarId, "event");
    record_access::setInt(event.record.get(), CALENDAR_EVENT_BOOK_ID, calendarId, "calendar");
}

int addEvent(const std::string& path, int chosenCalendar) {
    const event_json::NewEvent event = event_json::parse(record_json::readFile(path));
    event.originalEvent ? placeInSeries(event) : placeInCalendar(event, chosenCalendar);
    int id = 0;
    check(calendar_db_insert_record(event.record.get(), &id), "adding the event");
    return id;
}

// --- set ------------------------------------------------------------------------------------------------------------

// The version that a write of the event is checked against: an exception is written as part of its series. It is
// read before what it guards, so that a change in between is noticed.
int guardingVersion(int id) {
    const FoundItem event = CalendarStore::event(id, event_json::scalarProjection());
    const int series = intOf(event.get(), CALENDAR_EVENT_ORIGINAL_EVENT_ID);
    if (series == 0) return intOf(event.get(), CALENDAR_EVENT_VERSION);
    return intOf(CalendarStore::event(series, event_json::scalarProjection()).get(), CALENDAR_EVENT_VERSION);
}

int tryToSet(int id, const std::vector<record_json::Assignment>& assignments) {
    const int version = guardingVersion(id);
    const FoundItem event = CalendarStore::event(id, event_json::scalarProjection());
    CalendarStore::checkWritable(intOf(event.get(), CALENDAR_EVENT_BOOK_ID), "event");
    for (const record_json::Assignment& assignment : assignments) {
        record_json::setFromText(event.get(), *assignment.field, assignment.value);
    }
    event_json::checkTimes(event.get());
    if (intOf(event.get(), CALENDAR_EVENT_ORIGINAL_EVENT_ID) != 0 &&
        intOf(event.get(), CALENDAR_EVENT_FREQ) != 0) {
        throw Failure(named(id) + " is one instance of a series and has no rule of its own");
    }
    record_write_options_s options;
    options.expected_versions = {&version, 1};
    return calendar_db_update_record(event.get(), options);
}

// --- delete ---------------------------------------------------------------------------------------------------------

constexpr unsigned kExdateProjection[] = {CALENDAR_EVENT_ID, CALENDAR_EVENT_BOOK_ID, CALENDAR_EVENT_EXDATE};

void addExdate(int seriesId, const std::string& date) {
    const FoundItem series = CalendarStore::event(seriesId, kExdateProjection);
    const std::string dates = event_fields::withDate(textOf(series.get(), CALENDAR_EVENT_EXDATE), date);
    record_access::setText(series.get(), CALENDAR_EVENT_EXDATE, dates, "exdates");
    check(calendar_db_update_record(series.get()), "cancelling the instance of " + named(seriesId));
}

// The transaction keeps everybody else out, so that the child goes and its date comes together.
void deleteEvent(int id) {
    CalendarTransaction transaction;
    const FoundItem event = CalendarStore::event(id, event_json::projection());
    CalendarStore::checkWritable(intOf(event.get(), CALENDAR_EVENT_BOOK_ID), "event");
    check(calendar_db_delete_record(_calendar_event, id), "deleting " + named(id));
    const int seriesId = intOf(event.get(), CALENDAR_EVENT_ORIGINAL_EVENT_ID);
    if (seriesId != 0) addExdate(seriesId, textOf(event.get(), CALENDAR_EVENT_RECURRENCE_ID));
    transaction.commit();
}

// --- instances ------------------------------------------------------------------------------------------------------

constexpr const char* kInstanceHelp =
    "One instance of the series ID, by its original start (20140503T100000Z, 2014-05-03T10:00:00Z, 20140503)";

std::string recurrenceIdOf(const std::string& instance) {
    if (instance.empty() || time_text::parseCompact(instance)) return instance;
    if (const auto time = time_text::parseRfc3339(instance)) return time_text::composeCompact(*time);
    throw Misuse("\"" + instance + "\" is no recurrence id as 20140503T100000Z or 20140503");
}

// An instance as its series has it, as an event of its own: the series' fields at the instance's time.
event_json::NewEvent instanceOfSeries(calendar_record_h series, const std::string& instance) {
    Json event = event_json::compose(series);
    const calendar_time_s start = *time_text::parseCompact(instance);
    event["start"] = time_text::composeRfc3339(start);
    event["end"] = time_text::composeRfc3339(
        time_text::shifted(start, record_access::timeOf(series, CALENDAR_EVENT_START),
                           record_access::timeOf(series, CALENDAR_EVENT_END)));
    event["originalEvent"] = event["id"];
    event["recurrenceId"] = instance;
    for (const char* ofSeries : {"rrule", "exdates", "calendar"}) event.erase(ofSeries);
    return event_json::parse(event);
}

void setInstance(int seriesId, const std::string& instance,
                 const std::vector<record_json::Assignment>& assignments) {
    CalendarTransaction transaction;
    int id = exceptionOf(seriesId, instance);
    if (id == 0) {
        const FoundItem series = CalendarStore::event(seriesId, event_json::projection());
        const event_json::NewEvent event = instanceOfSeries(series.get(), instance);
        placeInSeries(event);
        check(calendar_db_insert_record(event.record.get(), &id),
              "changing the instance of " + named(seriesId));
    }
    check(tryToSet(id, assignments), "changing the instance of " + named(seriesId));
    transaction.commit();
}

void cancelInstance(int seriesId, const std::string& instance) {
    CalendarTransaction transaction;
    const FoundItem series = CalendarStore::event(seriesId, event_json::projection());
    if (intOf(series.get(), CALENDAR_EVENT_FREQ) == 0) throw Failure(named(seriesId) + " is no series");
    CalendarStore::checkWritable(intOf(series.get(), CALENDAR_EVENT_BOOK_ID), "event");
    if (const int id = exceptionOf(seriesId, instance); id != 0)
        check(calendar_db_delete_record(_calendar_event, id), "deleting " + named(id));
    addExdate(seriesId, instance);
    transaction.commit();
}

void showEvent(int id, bool isJson) {
    const Json event = event_json::compose(CalendarStore::event(id, event_json::projection()).get());
    isJson ? output::json(event) : output::fields(event);
}

}  // namespace

Action buildEventShow(CLI::App& app) {
    return item_command::buildShow<CalendarStore>(app, "The event", showEvent);
}

Action buildEventAdd(CLI::App& app) {
    return item_command::buildAdd<CalendarStore>(
        app,
        {"JSON as 'event show --json' prints it; '-' reads standard input", "--calendar",
         "The calendar, instead of the file's"},
        addEvent, showEvent);
}

Action buildEventSet(CLI::App& app) {
    auto options = std::make_shared<ItemOptions>();
    item_command::addSetOptions(
        app, *options, "The event",
        "summary, description, location, start, end, timeZone, status, visibility, busy or rrule");
    app.add_option("--instance", options->instance, kInstanceHelp);
    return [options] {
        const auto assignments = record_json::readAssignments(event_json::scalars(), options->assignments);
        const std::string instance = recurrenceIdOf(options->instance);
        const CalendarStore store;
        if (!instance.empty()) {
            setInstance(options->id, instance, assignments);
        } else {
            item_command::write("changing " + named(options->id),
                                [&] { return tryToSet(options->id, assignments); });
        }
        return kExitDone;
    };
}

Action buildEventDelete(CLI::App& app) {
    auto options = std::make_shared<ItemOptions>();
    command::addId(app, "ID", options->id, "The event")->required();
    app.add_option("--instance", options->instance, kInstanceHelp);
    return [options] {
        const std::string instance = recurrenceIdOf(options->instance);
        const CalendarStore store;
        instance.empty() ? deleteEvent(options->id) : cancelInstance(options->id, instance);
        return kExitDone;
    };
}
