// An event as JSON: what is shown can be put back, and what is malformed is refused with its member's name.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "EventJson.h"
#include "Failure.h"

namespace {

constexpr const char* kFull = R"({"id": 12, "calendar": 3, "uid": "from-the-server",
    "summary": "Größe \"L\"", "description": "two\nlines", "location": "Room 1",
    "start": "2014-05-01T10:00:00Z", "end": "2014-05-01T11:30:30Z", "timeZone": "Europe/Berlin",
    "status": "tentative", "visibility": "private", "busy": false,
    "rrule": "FREQ=WEEKLY;INTERVAL=2;BYDAY=MO,WE;UNTIL=20141231",
    "exdates": ["2014-05-15T10:00:00Z", "2014-05-29"],
    "organizer": {"name": "Ann", "email": "ann@example.com"},
    "attendees": [{"name": "Bob", "email": "bob@example.com", "status": "accepted"},
                  {"name": "", "email": "eve@example.com", "status": "needsAction"}],
    "reminders": [0, 10, 1440], "originalEvent": null, "recurrenceId": ""})";

TEST(EventJson, WhatIsShownCanBePutBack) {
    Json full = Json::parse(kFull);
    const event_json::NewEvent event = event_json::parse(full);
    EXPECT_EQ(event.calendar, 3);
    // A copy is an event of its own: it has neither the id nor the server's id of the one that was shown.
    full.update({{"id", 0}, {"calendar", 0}, {"uid", ""}});
    EXPECT_EQ(event_json::compose(event.record.get()).dump(), full.dump());
}

TEST(EventJson, AbsentMembersAreEmptyNeverMissing) {
    const Json shown = event_json::compose(
        event_json::parse(Json::parse(R"({"start": "2014-05-01", "end": "2014-05-02", "status": null})"))
            .record.get());
    EXPECT_EQ(shown.dump(), R"({"id":0,"calendar":0,"uid":"","summary":"","description":"","location":"",)"
                            R"("start":"2014-05-01","end":"2014-05-02","timeZone":"","status":"",)"
                            R"("visibility":"default","busy":true,"rrule":"","exdates":[],)"
                            R"("organizer":{"name":"","email":""},"attendees":[],"reminders":[],)"
                            R"("originalEvent":null,"recurrenceId":""})");
}

struct BadRow {
    const char* member;  // named in the message
    const char* change;  // merged into a good event
};

TEST(EventJson, AMalformedMemberIsRefusedByName) {
    const BadRow rows[] = {
        {"sumary", R"({"sumary": "x"})"},
        {"summary", R"({"summary": 5})"},
        {"summary", R"({"summary": "a\u0000b"})"},
        {"start", R"({"start": "tomorrow"})"},
        {"start", R"({"start": null})"},
        {"end", R"({"end": "2014-05-02"})"},
        {"end", R"({"end": "2014-05-01T09:59:59Z"})"},
        {"timeZone", R"({"timeZone": "Mars/Olympus"})"},
        {"status", R"({"status": "perhaps"})"},
        {"visibility", R"({"visibility": "confidential"})"},
        {"busy", R"({"busy": "true"})"},
        {"rrule", R"({"rrule": "FREQ=SOMETIMES"})"},
        {"rrule", R"({"rrule": ["FREQ=DAILY"]})"},
        {"exdates", R"({"exdates": "2014-05-01"})"},
        {"exdates", R"({"exdates": ["20140501"]})"},
        {"organizer", R"({"organizer": "Ann"})"},
        {"organizer.mail", R"({"organizer": {"mail": "a@b"}})"},
        {"attendees", R"({"attendees": ["bob@example.com"]})"},
        {"attendees.email", R"({"attendees": [{"name": "Bob"}]})"},
        {"attendees.status", R"({"attendees": [{"email": "b@c", "status": "maybe"}]})"},
        {"reminders", R"({"reminders": [-1]})"},
        {"reminders", R"({"reminders": [1.5]})"},
        {"reminders", R"({"reminders": [18446744073709551615]})"},
        {"calendar", R"({"calendar": "3"})"},
        {"calendar", R"({"calendar": 0})"},
        {"originalEvent", R"({"recurrenceId": "20140501T100000Z"})"},
        {"recurrenceId", R"({"originalEvent": 3})"},
        {"recurrenceId", R"({"originalEvent": 3, "recurrenceId": "2014-05-01"})"},
        {"rrule", R"({"originalEvent": 3, "recurrenceId": "20140501", "rrule": "FREQ=DAILY"})"},
    };
    for (const BadRow& row : rows) {
        SCOPED_TRACE(row.change);
        Json object = Json::parse(R"({"start": "2014-05-01T10:00:00Z", "end": "2014-05-01T11:00:00Z"})");
        object.update(Json::parse(row.change));
        try {
            event_json::parse(object);
            ADD_FAILURE() << "was taken";
        } catch (const Failure& failure) {
            EXPECT_THAT(failure.what(), testing::HasSubstr("\"" + std::string(row.member) + "\""));
        }
    }
    EXPECT_THROW(event_json::parse(Json::parse("[]")), Failure);
}

TEST(EventJson, RemindersAreMinutesWhateverTheirUnit) {
    const CalendarRecord record =
        event_json::parse(Json::parse(R"({"start": "2014-05-01", "end": "2014-05-02"})")).record;
    calendar_record_h alarm = nullptr;
    ASSERT_EQ(calendar_record_create(_calendar_alarm, &alarm), 0);
    ASSERT_EQ(calendar_record_set_int(alarm, CALENDAR_ALARM_TICK, 2), 0);
    ASSERT_EQ(calendar_record_set_int(alarm, CALENDAR_ALARM_TICK_UNIT, 86400), 0);
    ASSERT_EQ(calendar_record_add_child_record(record.get(), CALENDAR_EVENT_ALARMS, alarm), 0);
    EXPECT_EQ(event_json::compose(record.get())["reminders"].dump(), "[2880]");
}

}  // namespace
