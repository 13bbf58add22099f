#include "exchange/CalendarRecords.h"

#include <algorithm>
#include <map>

#include "CalendarStore.h"
#include "EventFields.h"
#include "EventJson.h"
#include "Failure.h"
#include "Names.h"
#include "RecordAccess.h"
#include "TimeText.h"
#include "TodoJson.h"
#include "exchange/Identity.h"

namespace exchange {

namespace {

using record_access::intOf;
using record_access::textOf;

void addInstance(calendar_record_h series, CalendarRecord instance) {
    check(calendar_record_add_child_record(series, CALENDAR_EVENT_EXCEPTIONS, instance.get()),
          "making a record");
    static_cast<void>(instance.release());  // the series has taken it over
}

Json withoutPlace(Json item) {
    for (const char* place : {"id", "calendar", "uid", "originalEvent", "recurrenceId"}) item.erase(place);
    return item;
}

Json sayWith(Json event, std::vector<Json> instances) {
    std::sort(instances.begin(), instances.end(),
              [](const Json& a, const Json& b) { return a["recurrenceId"] < b["recurrenceId"]; });
    for (Json& instance : instances) {
        const Json recurrence = instance["recurrenceId"];
        instance = withoutPlace(std::move(instance));
        instance["recurrenceId"] = recurrence;
    }
    event["instances"] = std::move(instances);
    return event;
}

CalendarRecord stored(const char* view, int id) {
    calendar_record_h raw = nullptr;
    check(calendar_db_get_record(view, id, &raw), "reading the item " + std::to_string(id));
    return CalendarRecord(raw);
}

void update(const CalendarRecord& record, int version) {
    record_write_options_s options;
    options.expected_versions = {&version, 1};
    check(calendar_db_update_record(record.get(), options), "replacing an item");
}

}  // namespace

CalendarRecords::CalendarRecords(int calendarId) : mCalendarId(calendarId) {
    const CalendarRecord book = CalendarStore::calendar(calendarId);
    mHoldsTodos = nameOf(kStoreTypes, intOf(book.get(), CALENDAR_BOOK_STORE_TYPE)) == "todo";
    CalendarStore::checkWritable(calendarId, mHoldsTodos ? "todo" : "event");
}

KnownItems CalendarRecords::known() const {
    const char* view = mHoldsTodos ? _calendar_todo : _calendar_event;
    const unsigned book = mHoldsTodos ? CALENDAR_TODO_BOOK_ID : CALENDAR_EVENT_BOOK_ID;
    const CalendarList list =
        CalendarStore::find(view, {{book, mCalendarId}}, mHoldsTodos ? CALENDAR_TODO_ID : CALENDAR_EVENT_ID,
                            mHoldsTodos ? todo_json::projection() : event_json::projection());
    // Instances may stand before their series.
    std::map<int, std::vector<Json>> instances;
    if (!mHoldsTodos) {
        record_access::forEach(list, [&](calendar_record_h record) {
            const int series = intOf(record, CALENDAR_EVENT_ORIGINAL_EVENT_ID);
            if (series != 0) instances[series].push_back(event_json::compose(record));
        });
    }
    KnownItems known;
    const char* kind = mHoldsTodos ? "todo" : "event";
    record_access::forEach(list, [&](calendar_record_h record) {
        if (!mHoldsTodos && intOf(record, CALENDAR_EVENT_ORIGINAL_EVENT_ID) != 0) return;
        Json item = mHoldsTodos ? todo_json::compose(record) : event_json::compose(record);
        const int id = item["id"];
        const std::vector<std::string> uids = {item["uid"], identity::uidOf(kind, id)};
        if (!mHoldsTodos) item = sayWith(std::move(item), std::move(instances[id]));
        known.add(id, uids, identity::digestOf(item), keysOf(item));
    });
    return known;
}

CalendarRecord CalendarRecords::makeInstance(const Instance& instance) {
    CalendarRecord record = event_json::parse(instance.fields).record;
    record_access::setText(record.get(), CALENDAR_EVENT_RECURRENCE_ID,
                           time_text::composeCompact(instance.recurrence), "recurrenceId");
    return record;
}

CalendarRecord CalendarRecords::make(const CalendarItem& item) const {
    CalendarRecord record =
        mHoldsTodos ? todo_json::parse(item.fields).record : event_json::parse(item.fields).record;
    record_access::setInt(record.get(), mHoldsTodos ? CALENDAR_TODO_BOOK_ID : CALENDAR_EVENT_BOOK_ID,
                          mCalendarId, "calendar");
    for (const Instance& instance : item.instances) addInstance(record.get(), makeInstance(instance));
    return record;
}

Json CalendarRecords::say(calendar_record_h record) const {
    if (mHoldsTodos) return todo_json::compose(record);
    std::vector<Json> instances;
    record_access::forEachChild(record, CALENDAR_EVENT_EXCEPTIONS, [&](calendar_record_h child) {
        instances.push_back(event_json::compose(child));
    });
    return sayWith(event_json::compose(record), std::move(instances));
}

std::vector<std::string> CalendarRecords::keysOf(const Json& said) const {
    return mHoldsTodos ? identity::todoKeys(said) : identity::eventKeys(said);
}

void CalendarRecords::replace(int id, const CalendarItem& item) const {
    mHoldsTodos ? replaceTodo(id, item) : replaceEvent(id, item);
}

void CalendarRecords::replaceTodo(int id, const CalendarItem& item) const {
    CalendarRecord record = stored(_calendar_todo, id);
    const int version = intOf(record.get(), CALENDAR_TODO_VERSION);
    // All members, so that what the item does not say is taken away.
    const Json said = withoutPlace(todo_json::compose(make(item).get()));
    update(todo_json::parse(said, std::move(record)).record, version);
}

void CalendarRecords::replaceEvent(int id, const CalendarItem& item) const {
    CalendarRecord record = stored(_calendar_event, id);
    const int version = intOf(record.get(), CALENDAR_EVENT_VERSION);
    const CalendarRecord wanted = make(item);
    const auto onto = [](calendar_record_h source, CalendarRecord target) {
        Json said = withoutPlace(event_json::compose(source));
        const auto isBlank = [&said](const char* member) {
            return said["organizer"][member].get_ref<const std::string&>().empty();
        };
        if (isBlank("email") && isBlank("name")) said.erase("organizer");
        return event_json::parse(said, std::move(target)).record;
    };
    std::string cancelled = textOf(record.get(), CALENDAR_EVENT_EXDATE);
    record = onto(wanted.get(), std::move(record));
    for (const std::string& date : event_fields::splitDates(textOf(record.get(), CALENDAR_EVENT_EXDATE)))
        cancelled = event_fields::withDate(cancelled, date);
    record_access::setText(record.get(), CALENDAR_EVENT_EXDATE, cancelled, "exdates");
    for (const Instance& instance : item.instances) {
        CalendarRecord fresh = makeInstance(instance);
        const std::string name = textOf(fresh.get(), CALENDAR_EVENT_RECURRENCE_ID);
        calendar_record_h former = nullptr;
        record_access::forEachChild(record.get(), CALENDAR_EVENT_EXCEPTIONS, [&](calendar_record_h child) {
            if (textOf(child, CALENDAR_EVENT_RECURRENCE_ID) == name) former = child;
        });
        if (former != nullptr) {
            check(calendar_record_remove_child_record(record.get(), CALENDAR_EVENT_EXCEPTIONS, former),
                  "changing a record");
            fresh = onto(fresh.get(), CalendarRecord(former));
        }
        addInstance(record.get(), std::move(fresh));
    }
    update(record, version);
}

}  // namespace exchange
