// event: show, add, set and delete one event. What the tool writes is a user's edit: the daemon takes it to the server.
#include <set>

#include "CalendarStore.h"
#include "Command.h"
#include "EventFields.h"
#include "EventJson.h"
#include "Failure.h"
#include "InputFile.h"
#include "Output.h"
#include "RecordAccess.h"
#include "TimeText.h"

namespace {

using record_access::intOf;
using record_access::textOf;

constexpr size_t kMostFileBytes = size_t{16} * 1024 * 1024;
constexpr int kMostWriteTries = 5;

std::string named(int id) {
    return "the event " + std::to_string(id);
}

// --- add ------------------------------------------------------------------------------------------------------------

Json readJson(const std::string& path) {
    const std::string text = input_file::read(path, kMostFileBytes);
    try {
        return Json::parse(text);
    } catch (const Json::parse_error& error) {
        throw Failure((path == "-" ? "standard input" : path) + " is no JSON (byte " +
                      std::to_string(error.byte) + ")");
    }
}

// An exception stands in the calendar of its series, for an instance that is neither changed nor cancelled yet.
void placeInSeries(const event_json::NewEvent& event) {
    const int seriesId = *event.originalEvent;
    const FoundEvent series = CalendarStore::event(seriesId, event_json::projection());
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
    const CalendarList siblings =
        CalendarStore::find(_calendar_event, {{CALENDAR_EVENT_ORIGINAL_EVENT_ID, seriesId}},
                            CALENDAR_EVENT_ID, event_json::projection());
    record_access::forEach(siblings, [&](calendar_record_h sibling) {
        if (textOf(sibling, CALENDAR_EVENT_RECURRENCE_ID) != event.recurrenceId) return;
        throw Failure("the instance " + event.recurrenceId + " is changed already; change the event " +
                      std::to_string(intOf(sibling, CALENDAR_EVENT_ID)) + " instead");
    });
    const int calendarId = intOf(series.get(), CALENDAR_EVENT_BOOK_ID);
    CalendarStore::checkWritable(calendarId);
    record_access::setInt(event.record.get(), CALENDAR_EVENT_BOOK_ID, calendarId, "calendar");
    record_access::setInt(event.record.get(), CALENDAR_EVENT_ORIGINAL_EVENT_ID, seriesId, "originalEvent");
    record_access::setText(event.record.get(), CALENDAR_EVENT_RECURRENCE_ID, event.recurrenceId,
                           "recurrenceId");
}

void placeInCalendar(const event_json::NewEvent& event, int chosen) {
    const int calendarId = chosen > 0 ? chosen : event.calendar.value_or(0);
    if (calendarId == 0) throw Failure("the member \"calendar\" is missing; add it or give --calendar ID");
    CalendarStore::checkWritable(calendarId);
    record_access::setInt(event.record.get(), CALENDAR_EVENT_BOOK_ID, calendarId, "calendar");
}

int addEvent(const std::string& path, int chosenCalendar) {
    const event_json::NewEvent event = event_json::parse(readJson(path));
    event.originalEvent ? placeInSeries(event) : placeInCalendar(event, chosenCalendar);
    int id = 0;
    check(calendar_db_insert_record(event.record.get(), &id), "adding the event");
    return id;
}

// --- set ------------------------------------------------------------------------------------------------------------

struct Assignment {
    const event_json::ScalarField* field;
    std::string value;
};

std::vector<Assignment> readAssignments(const std::vector<std::string>& texts) {
    std::vector<Assignment> assignments;
    std::set<std::string> seen;
    for (const std::string& text : texts) {
        const size_t equals = text.find('=');
        const std::string name = text.substr(0, equals);
        const event_json::ScalarField* field = event_json::findScalar(name);
        if (equals == std::string::npos) throw Misuse("\"" + text + "\" is not FIELD=VALUE");
        if (field == nullptr) throw Misuse("\"" + name + "\" is no field that can be set (see --help)");
        if (!seen.insert(name).second) throw Misuse("\"" + name + "\" is set twice");
        assignments.push_back({field, text.substr(equals + 1)});
    }
    return assignments;
}

// The version that a write of the event is checked against: an exception is written as part of its series. It is
// read before what it guards, so that a change in between is noticed.
int guardingVersion(int id) {
    const FoundEvent event = CalendarStore::event(id, event_json::scalarProjection());
    const int series = intOf(event.get(), CALENDAR_EVENT_ORIGINAL_EVENT_ID);
    if (series == 0) return intOf(event.get(), CALENDAR_EVENT_VERSION);
    return intOf(CalendarStore::event(series, event_json::scalarProjection()).get(), CALENDAR_EVENT_VERSION);
}

int tryToSet(int id, const std::vector<Assignment>& assignments) {
    const int version = guardingVersion(id);
    const FoundEvent event = CalendarStore::event(id, event_json::scalarProjection());
    CalendarStore::checkWritable(intOf(event.get(), CALENDAR_EVENT_BOOK_ID));
    for (const Assignment& assignment : assignments) {
        event_json::setScalar(event.get(), *assignment.field, assignment.value);
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

void setEvent(int id, const std::vector<Assignment>& assignments) {
    int code = PLATFORM_ERROR_CONFLICT;
    for (int tries = 0; code == PLATFORM_ERROR_CONFLICT && tries < kMostWriteTries; ++tries) {
        code = tryToSet(id, assignments);
    }
    check(code, "changing " + named(id));
}

// --- delete ---------------------------------------------------------------------------------------------------------

constexpr unsigned kExdateProjection[] = {CALENDAR_EVENT_ID, CALENDAR_EVENT_BOOK_ID, CALENDAR_EVENT_EXDATE};

// The transaction keeps everybody else out, so that the child goes and its date comes together.
void deleteEvent(int id) {
    CalendarTransaction transaction;
    const FoundEvent event = CalendarStore::event(id, event_json::projection());
    CalendarStore::checkWritable(intOf(event.get(), CALENDAR_EVENT_BOOK_ID));
    check(calendar_db_delete_record(_calendar_event, id), "deleting " + named(id));
    const int seriesId = intOf(event.get(), CALENDAR_EVENT_ORIGINAL_EVENT_ID);
    if (seriesId != 0) {
        const FoundEvent series = CalendarStore::event(seriesId, kExdateProjection);
        const std::string dates = event_fields::withDate(textOf(series.get(), CALENDAR_EVENT_EXDATE),
                                                         textOf(event.get(), CALENDAR_EVENT_RECURRENCE_ID));
        record_access::setText(series.get(), CALENDAR_EVENT_EXDATE, dates, "exdates");
        check(calendar_db_update_record(series.get()), "cancelling the instance of " + named(seriesId));
    }
    transaction.commit();
}

struct Options {
    int id = 0;
    int calendar = 0;
    std::string file;
    std::vector<std::string> assignments;
    bool isJson = false;
};

void showEvent(int id, bool isJson) {
    const Json event = event_json::compose(CalendarStore::event(id, event_json::projection()).get());
    isJson ? output::json(event) : output::fields(event);
}

}  // namespace

Action buildEventShow(CLI::App& app) {
    auto options = std::make_shared<Options>();
    command::addId(app, "ID", options->id, "The event")->required();
    command::addJson(app, options->isJson);
    return [options] {
        const CalendarStore store;
        showEvent(options->id, options->isJson);
        return kExitDone;
    };
}

Action buildEventAdd(CLI::App& app) {
    auto options = std::make_shared<Options>();
    app.add_option("FILE", options->file, "JSON as 'event show --json' prints it; '-' reads standard input")
        ->required();
    command::addId(app, "--calendar", options->calendar, "The calendar, instead of the file's");
    command::addJson(app, options->isJson);
    return [options] {
        const CalendarStore store;
        const int id = addEvent(options->file, options->calendar);
        options->isJson ? showEvent(id, /*isJson=*/true) : output::line(std::to_string(id));
        return kExitDone;
    };
}

Action buildEventSet(CLI::App& app) {
    auto options = std::make_shared<Options>();
    command::addId(app, "ID", options->id, "The event")->required();
    app.add_option("FIELD=VALUE", options->assignments,
                   "summary, description, location, start, end, timeZone, status, visibility, busy or rrule")
        ->required();
    return [options] {
        const std::vector<Assignment> assignments = readAssignments(options->assignments);
        const CalendarStore store;
        setEvent(options->id, assignments);
        return kExitDone;
    };
}

Action buildEventDelete(CLI::App& app) {
    auto options = std::make_shared<Options>();
    command::addId(app, "ID", options->id, "The event")->required();
    return [options] {
        const CalendarStore store;
        deleteEvent(options->id);
        return kExitDone;
    };
}
