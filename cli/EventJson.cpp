#include "EventJson.h"

#include "EventFields.h"
#include "RecordAccess.h"
#include "TimeText.h"

namespace event_json {

namespace {

using record_access::intOf;
using namespace record_json;  // NOLINT(google-build-using-namespace): this file is one half of it
using record_access::textOf;
using record_access::timeOf;

// In the order of the documentation.
constexpr ScalarField kScalars[] = {
    {"summary", FieldKind::kText, CALENDAR_EVENT_SUMMARY, {}},
    {"description", FieldKind::kText, CALENDAR_EVENT_DESCRIPTION, {}},
    {"location", FieldKind::kText, CALENDAR_EVENT_LOCATION, {}},
    {"start", FieldKind::kTime, CALENDAR_EVENT_START, {}},
    {"end", FieldKind::kTime, CALENDAR_EVENT_END, {}},
    {"timeZone", FieldKind::kZone, CALENDAR_EVENT_START_TZID, {}},
    {"status", FieldKind::kWord, CALENDAR_EVENT_STATUS, kEventStatus},
    {"visibility", FieldKind::kWord, CALENDAR_EVENT_SENSITIVITY, kVisibility},
    {"busy", FieldKind::kFlag, CALENDAR_EVENT_BUSY_STATUS, {}},
    {"rrule", FieldKind::kRule, CALENDAR_EVENT_FREQ, {}},
};

// The scalar fields' properties and what goes with every look at an event come first.
constexpr unsigned kProjection[] = {
    CALENDAR_EVENT_ID,
    CALENDAR_EVENT_BOOK_ID,
    CALENDAR_EVENT_ORIGINAL_EVENT_ID,
    CALENDAR_EVENT_VERSION,
    CALENDAR_EVENT_SUMMARY,
    CALENDAR_EVENT_DESCRIPTION,
    CALENDAR_EVENT_LOCATION,
    CALENDAR_EVENT_START,
    CALENDAR_EVENT_END,
    CALENDAR_EVENT_START_TZID,
    CALENDAR_EVENT_STATUS,
    CALENDAR_EVENT_SENSITIVITY,
    CALENDAR_EVENT_BUSY_STATUS,
    CALENDAR_EVENT_FREQ,
    CALENDAR_EVENT_RANGE_TYPE,
    CALENDAR_EVENT_COUNT,
    CALENDAR_EVENT_UNTIL,
    CALENDAR_EVENT_INTERVAL,
    CALENDAR_EVENT_BYDAY,
    CALENDAR_EVENT_BYMONTHDAY,
    CALENDAR_EVENT_BYYEARDAY,
    CALENDAR_EVENT_BYWEEKNO,
    CALENDAR_EVENT_BYMONTH,
    CALENDAR_EVENT_BYSETPOS,
    CALENDAR_EVENT_WKST,
    CALENDAR_EVENT_UID,
    CALENDAR_EVENT_EXDATE,
    CALENDAR_EVENT_RECURRENCE_ID,
    CALENDAR_EVENT_ORGANIZER_NAME,
    CALENDAR_EVENT_ORGANIZER_EMAIL,
    CALENDAR_EVENT_ATTENDEES,
    CALENDAR_EVENT_ALARMS,
};
constexpr size_t kScalarPropertyCount = 25;
static_assert(kProjection[kScalarPropertyCount - 1] == CALENDAR_EVENT_WKST);

constexpr int kSecondsPerMinute = 60;
constexpr int kMostReminderMinutes = 366 * 24 * 60;

// --- record to JSON ---------------------------------------------------------------------------------------------

// A date that cannot be read is shown as it is stored: hiding it would say that the instance takes place.
Json exdatesOf(calendar_record_h event) {
    Json dates = Json::array();
    for (const std::string& stored : event_fields::splitDates(textOf(event, CALENDAR_EVENT_EXDATE))) {
        const auto time = time_text::parseCompact(stored);
        dates.push_back(time ? time_text::composeRfc3339(*time) : stored);
    }
    return dates;
}

Json attendeesOf(calendar_record_h event) {
    Json attendees = Json::array();
    record_access::forEachChild(event, CALENDAR_EVENT_ATTENDEES, [&attendees](calendar_record_h attendee) {
        attendees.push_back(
            {{"name", textOf(attendee, CALENDAR_ATTENDEE_NAME)},
             {"email", textOf(attendee, CALENDAR_ATTENDEE_EMAIL)},
             {"status", std::string(nameOf(kAttendeeStatus, intOf(attendee, CALENDAR_ATTENDEE_STATUS)))}});
    });
    return attendees;
}

Json remindersOf(calendar_record_h event) {
    Json reminders = Json::array();
    record_access::forEachChild(event, CALENDAR_EVENT_ALARMS, [&reminders](calendar_record_h alarm) {
        reminders.push_back(int64_t{intOf(alarm, CALENDAR_ALARM_TICK)} *
                            intOf(alarm, CALENDAR_ALARM_TICK_UNIT) / kSecondsPerMinute);
    });
    return reminders;
}

// --- JSON to record ---------------------------------------------------------------------------------------------

void setExdates(NewEvent& event, const Json& value) {
    std::string dates;
    for (const Json& date : listFrom(value, "exdates")) {
        const calendar_time_s time = timeFrom(textFrom(date, "exdates"), "exdates");
        dates = event_fields::withDate(dates, time_text::composeCompact(time));
    }
    record_access::setText(event.record.get(), CALENDAR_EVENT_EXDATE, dates, "exdates");
}

void setOrganizer(NewEvent& event, const Json& value) {
    if (value.is_null()) return;
    refuseUnknown(value, {"name", "email"}, "organizer");
    const Json none;
    record_access::setText(event.record.get(), CALENDAR_EVENT_ORGANIZER_NAME,
                           textFrom(value.value("name", none), "organizer.name"), "organizer.name");
    record_access::setText(event.record.get(), CALENDAR_EVENT_ORGANIZER_EMAIL,
                           textFrom(value.value("email", none), "organizer.email"), "organizer.email");
}

void removeChildren(NewEvent& event, unsigned property) {
    std::vector<calendar_record_h> children;
    record_access::forEachChild(event.record.get(), property,
                                [&children](calendar_record_h child) { children.push_back(child); });
    for (const calendar_record_h child : children) {
        check(calendar_record_remove_child_record(event.record.get(), property, child), "changing a record");
        const CalendarRecord removed(child);
    }
}

void addChild(NewEvent& event, unsigned property, CalendarRecord child, const std::string& member) {
    check(calendar_record_add_child_record(event.record.get(), property, child.get()), "\"" + member + "\"");
    static_cast<void>(child.release());  // the event has taken it over
}

void setAttendees(NewEvent& event, const Json& value) {
    const Json none;
    removeChildren(event, CALENDAR_EVENT_ATTENDEES);
    for (const Json& person : listFrom(value, "attendees")) {
        refuseUnknown(person, {"name", "email", "status"}, "attendees");
        CalendarRecord attendee = record_access::create(_calendar_attendee);
        const std::string email = textFrom(person.value("email", none), "attendees.email");
        if (email.empty()) refuse("attendees.email", "is missing");
        const std::string status = textFrom(person.value("status", none), "attendees.status");
        record_access::setText(attendee.get(), CALENDAR_ATTENDEE_EMAIL, email, "attendees.email");
        record_access::setText(attendee.get(), CALENDAR_ATTENDEE_NAME,
                               textFrom(person.value("name", none), "attendees.name"), "attendees.name");
        if (!status.empty()) {
            record_access::setInt(attendee.get(), CALENDAR_ATTENDEE_STATUS,
                                  wordFrom(kAttendeeStatus, status, "attendees.status"), "attendees.status");
        }
        addChild(event, CALENDAR_EVENT_ATTENDEES, std::move(attendee), "attendees");
    }
}

void setReminders(NewEvent& event, const Json& value) {
    removeChildren(event, CALENDAR_EVENT_ALARMS);
    for (const Json& minutes : listFrom(value, "reminders")) {
        CalendarRecord alarm = record_access::create(_calendar_alarm);
        record_access::setInt(alarm.get(), CALENDAR_ALARM_TICK,
                              numberFrom(minutes, "reminders", 0, kMostReminderMinutes), "reminders");
        record_access::setInt(alarm.get(), CALENDAR_ALARM_TICK_UNIT, kSecondsPerMinute, "reminders");
        addChild(event, CALENDAR_EVENT_ALARMS, std::move(alarm), "reminders");
    }
}

// The members that are no scalar fields.
struct OtherMember {
    std::string_view name;
    void (*apply)(NewEvent& event, const Json& value);
};
constexpr OtherMember kOthers[] = {
    {"id", [](NewEvent&, const Json& value) { static_cast<void>(idFrom(value, "id")); }},
    {"calendar", [](NewEvent& event, const Json& value) { event.calendar = idFrom(value, "calendar"); }},
    {"uid", [](NewEvent&, const Json& value) { static_cast<void>(textFrom(value, "uid")); }},
    {"exdates", setExdates},
    {"organizer", setOrganizer},
    {"attendees", setAttendees},
    {"reminders", setReminders},
    {"originalEvent",
     [](NewEvent& event, const Json& value) { event.originalEvent = idFrom(value, "originalEvent"); }},
    {"recurrenceId",
     [](NewEvent& event, const Json& value) { event.recurrenceId = textFrom(value, "recurrenceId"); }},
};

void applyMember(NewEvent& event, const std::string& name, const Json& value) {
    if (const ScalarField* field = findScalar(kScalars, name)) {
        setFromJson(event.record.get(), *field, value);
        return;
    }
    for (const OtherMember& member : kOthers) {
        if (member.name != name) continue;
        member.apply(event, value);
        return;
    }
    refuse(name, "is not known");
}

void checkException(const NewEvent& event) {
    if (!event.originalEvent && event.recurrenceId.empty()) return;
    if (!event.originalEvent) refuse("originalEvent", "is missing beside \"recurrenceId\"");
    if (!time_text::parseCompact(event.recurrenceId)) {
        refuse("recurrenceId", "must be as 20140501T100000Z or 20140501");
    }
    if (intOf(event.record.get(), CALENDAR_EVENT_FREQ) != 0) {
        refuse("rrule", "cannot stand in an exception of a series");
    }
    if (!textOf(event.record.get(), CALENDAR_EVENT_EXDATE).empty()) {
        refuse("exdates", "cannot stand in an exception of a series");
    }
}

}  // namespace

Json compose(calendar_record_h event) {
    Json object = Json::object();
    object.get_ref<Json::object_t&>().reserve(std::size(kScalars) + std::size(kOthers));
    object["id"] = intOf(event, CALENDAR_EVENT_ID);
    object["calendar"] = intOf(event, CALENDAR_EVENT_BOOK_ID);
    object["uid"] = textOf(event, CALENDAR_EVENT_UID);
    for (const ScalarField& field : kScalars) object[std::string(field.name)] = scalarOf(event, field);
    object["exdates"] = exdatesOf(event);
    object["organizer"] = {{"name", textOf(event, CALENDAR_EVENT_ORGANIZER_NAME)},
                           {"email", textOf(event, CALENDAR_EVENT_ORGANIZER_EMAIL)}};
    object["attendees"] = attendeesOf(event);
    object["reminders"] = remindersOf(event);
    const int series = intOf(event, CALENDAR_EVENT_ORIGINAL_EVENT_ID);
    object["originalEvent"] = series != 0 ? Json(series) : Json();
    object["recurrenceId"] = textOf(event, CALENDAR_EVENT_RECURRENCE_ID);
    return object;
}

std::span<const ScalarField> scalars() {
    return kScalars;
}
std::span<const unsigned> projection() {
    return kProjection;
}
std::span<const unsigned> scalarProjection() {
    return std::span(kProjection).first(kScalarPropertyCount);
}

NewEvent parse(const Json& object, CalendarRecord onto) {
    if (!object.is_object()) throw Failure("the file must hold one event as a JSON object");
    NewEvent event;
    event.record = onto != nullptr ? std::move(onto) : record_access::create(_calendar_event);
    for (const char* required : {"start", "end"}) {
        if (!object.contains(required) || object[required].is_null()) refuse(required, "is missing");
    }
    for (const auto& member : object.items()) applyMember(event, member.key(), member.value());
    checkException(event);
    checkTimes(event.record.get());
    return event;
}

void checkTimes(calendar_record_h event) {
    const calendar_time_s start = timeOf(event, CALENDAR_EVENT_START);
    const calendar_time_s end = timeOf(event, CALENDAR_EVENT_END);
    if (time_text::isDate(start) != time_text::isDate(end)) {
        refuse("end", "must be a date when \"start\" is one, and a time otherwise");
    }
    // Text of one shape sorts as its times do.
    if (time_text::composeRfc3339(end) < time_text::composeRfc3339(start))
        refuse("end", "lies before \"start\"");
}

}  // namespace event_json
