// The bodies of uploads, and what comes back of them.
#include <gtest/gtest.h>

#include <functional>
#include <nlohmann/json.hpp>

#include "calendar/CalItemKind.h"
#include "calendar/CalJsonBuilder.h"
#include "calendar/CalJsonParser.h"

using Json = nlohmann::json;

namespace {

CalendarRecord make(const char* view) {
    calendar_record_h raw = nullptr;
    EXPECT_EQ(calendar_record_create(view, &raw), 0);
    return CalendarRecord(raw);
}

calendar_time_s date(int year, int month, int day) {
    calendar_time_s time;
    time.type = CALENDAR_TIME_LOCALTIME;
    time.year = year;
    time.month = month;
    time.mday = day;
    return time;
}

calendar_time_s instant(int64_t seconds) {
    calendar_time_s time;
    time.utime = seconds;
    return time;
}

// A timed event of one hour.
CalendarRecord timed() {
    CalendarRecord record = make(_calendar_event);
    EXPECT_EQ(calendar_record_set_caltime(record.get(), CALENDAR_EVENT_START, instant(1772359259)), 0);
    EXPECT_EQ(calendar_record_set_caltime(record.get(), CALENDAR_EVENT_END, instant(1772362859)), 0);
    return record;
}

Json bodyOf(const CalendarRecord& record) {
    return Json::parse(kEventKind.build(record.get()));
}

void set(const CalendarRecord& record, unsigned property, int value) {
    EXPECT_EQ(calendar_record_set_int(record.get(), property, value), 0);
}

void set(const CalendarRecord& record, unsigned property, const char* text) {
    EXPECT_EQ(calendar_record_set_str(record.get(), property, text), 0);
}

Json throughRecord(const CalItemKind& kind, const Json& item) {
    CalJsonParser parser;
    CalendarRecord record;
    EXPECT_EQ(parser.setString(item.dump()), 0);
    EXPECT_EQ(kind.convert(parser.root(), &record), 0);
    return Json::parse(kind.build(record.get()));
}

}  // namespace

TEST(CalJsonBuilder, ANewEventSaysNoMoreThanTheUser) {
    EXPECT_EQ(bodyOf(timed()), Json::parse(R"({
        "summary": "", "description": "", "location": "",
        "start": {"dateTime": "2026-03-01T10:00:00Z"}, "end": {"dateTime": "2026-03-01T11:00:00Z"},
        "transparency": "opaque", "visibility": "default", "attendees": [],
        "reminders": {"useDefault": false, "overrides": []}})"));
}

TEST(CalJsonBuilder, MembersFollowTheRecord) {
    const CalendarRecord allDay = make(_calendar_event);
    EXPECT_EQ(calendar_record_set_caltime(allDay.get(), CALENDAR_EVENT_START, date(2026, 3, 1)), 0);
    EXPECT_EQ(calendar_record_set_caltime(allDay.get(), CALENDAR_EVENT_END, date(2026, 3, 2)), 0);
    set(allDay, CALENDAR_EVENT_START_TZID, "Europe/Berlin");
    EXPECT_EQ(bodyOf(allDay)["start"], Json({{"date", "2026-03-01"}})) << "a date has no zone";

    const CalendarRecord event = timed();
    set(event, CALENDAR_EVENT_SUMMARY, "it's \"so\"\n\xF0\x9F\x98\x80");
    set(event, CALENDAR_EVENT_START_TZID, "Europe/Berlin");
    set(event, CALENDAR_EVENT_BUSY_STATUS, 0);
    EXPECT_EQ(bodyOf(event)["summary"], "it's \"so\"\n\xF0\x9F\x98\x80");
    EXPECT_EQ(bodyOf(event)["end"]["timeZone"], "Europe/Berlin");
    EXPECT_EQ(bodyOf(event)["transparency"], "transparent");
    for (const auto& [sensitivity, word] :
         {std::pair(0, "public"), {1, "private"}, {2, "default"}, {7, "public"}}) {
        set(event, CALENDAR_EVENT_SENSITIVITY, sensitivity);
        EXPECT_EQ(bodyOf(event)["visibility"], word) << sensitivity;
    }
    for (const auto& [tick, unit, minutes] : {std::tuple(10, 60, 10), {2, 3600, 120}, {1, 86400, 1440}}) {
        CalendarRecord alarm = make(_calendar_alarm);
        set(alarm, CALENDAR_ALARM_TICK, tick);
        set(alarm, CALENDAR_ALARM_TICK_UNIT, unit);
        EXPECT_EQ(calendar_record_add_child_record(event.get(), CALENDAR_EVENT_ALARMS, alarm.release()), 0);
        EXPECT_EQ(bodyOf(event)["reminders"]["overrides"].back(),
                  Json({{"method", "popup"}, {"minutes", minutes}}));
    }
    for (const char* email : {"", "guest@x"}) {
        CalendarRecord attendee = make(_calendar_attendee);
        set(attendee, CALENDAR_ATTENDEE_EMAIL, email);
        set(attendee, CALENDAR_ATTENDEE_STATUS, 2);
        EXPECT_EQ(calendar_record_add_child_record(event.get(), CALENDAR_EVENT_ATTENDEES, attendee.release()),
                  0);
    }
    EXPECT_EQ(bodyOf(event)["attendees"],
              Json::parse(
                  R"([{"responseStatus": "declined"}, {"email": "guest@x", "responseStatus": "declined"}])"));
}

TEST(CalJsonBuilder, RulesInTheirOrder) {
    const auto rule = [](const std::function<void(const CalendarRecord&)>& fill) {
        const CalendarRecord event = timed();
        fill(event);
        const Json body = bodyOf(event);
        return body.contains("recurrence") ? body["recurrence"].dump() : "none";
    };
    EXPECT_EQ(rule([](const CalendarRecord&) {}), "none");
    EXPECT_EQ(rule([](const CalendarRecord& event) { set(event, CALENDAR_EVENT_FREQ, 1); }),
              R"(["RRULE:FREQ=DAILY;INTERVAL=1;WKST=MO"])");
    EXPECT_EQ(rule([](const CalendarRecord& event) {
                  set(event, CALENDAR_EVENT_FREQ, 2);
                  set(event, CALENDAR_EVENT_INTERVAL, 2);
                  set(event, CALENDAR_EVENT_BYDAY, "MO,WE");
                  set(event, CALENDAR_EVENT_WKST, 1);
                  set(event, CALENDAR_EVENT_RANGE_TYPE, 1);
                  set(event, CALENDAR_EVENT_COUNT, 10);
              }),
              R"(["RRULE:FREQ=WEEKLY;INTERVAL=2;BYDAY=MO,WE;WKST=SU;COUNT=10"])");
    EXPECT_EQ(
        rule([](const CalendarRecord& event) {
            set(event, CALENDAR_EVENT_FREQ, 4);
            set(event, CALENDAR_EVENT_BYMONTH, "3");
            set(event, CALENDAR_EVENT_BYMONTHDAY, "1");
            set(event, CALENDAR_EVENT_BYSETPOS, "-1");
            set(event, CALENDAR_EVENT_RANGE_TYPE, 0);
            EXPECT_EQ(calendar_record_set_caltime(event.get(), CALENDAR_EVENT_UNTIL, date(2027, 1, 2)), 0);
        }),
        R"(["RRULE:FREQ=YEARLY;INTERVAL=1;BYMONTHDAY=1;BYMONTH=3;BYSETPOS=-1;WKST=MO;UNTIL=20270102T000000Z"])");
    EXPECT_EQ(rule([](const CalendarRecord& event) {
                  set(event, CALENDAR_EVENT_FREQ, 3);
                  set(event, CALENDAR_EVENT_RANGE_TYPE, 0);
                  EXPECT_EQ(
                      calendar_record_set_caltime(event.get(), CALENDAR_EVENT_UNTIL, instant(1772359259)), 0);
              }),
              R"(["RRULE:FREQ=MONTHLY;INTERVAL=1;WKST=MO;UNTIL=20260301T100059Z"])");
}

TEST(CalJsonBuilder, AnInstanceNamesItsSeriesAndItsPlace) {
    const CalendarRecord event = timed();
    for (const auto& [id, start] : {std::pair("20260301T080000Z", R"({"dateTime":"2026-03-01T08:00:00Z"})"),
                                    {"20260301", R"({"date":"2026-03-01"})"}}) {
        set(event, CALENDAR_EVENT_RECURRENCE_ID, id);
        const Json body = Json::parse(cal_json::convertException2Json(event.get(), "series-1"));
        EXPECT_EQ(body["recurringEventId"], "series-1");
        EXPECT_EQ(body["originalStartTime"].dump(), start);
    }
    for (const char* wrong : {"", "soon", "20261301", "20260301T08"}) {
        set(event, CALENDAR_EVENT_RECURRENCE_ID, wrong);
        EXPECT_EQ(cal_json::convertException2Json(event.get(), "series-1"), "") << wrong;
    }
}

TEST(CalJsonBuilder, TasksComeBackAsTheyWent) {
    for (const char* task :
         {R"({"title": "", "notes": "", "status": "needsAction"})",
          R"({"title": "a", "notes": "b\nc", "status": "needsAction", "due": "2026-03-01T00:00:00Z"})",
          R"({"title": "a", "notes": "", "status": "completed", "completed": "2026-03-01T08:15:00Z"})"}) {
        EXPECT_EQ(throughRecord(kTodoKind, Json::parse(task)), Json::parse(task));
    }
    EXPECT_EQ(
        throughRecord(kTodoKind, {{"title", "a"}, {"status", "what"}, {"due", "2026-03-01T00:00:30.000Z"}}),
        Json::parse(
            R"({"title": "a", "notes": "", "status": "needsAction", "due": "2026-03-01T00:00:00Z"})"));
    CalJsonParser parser;
    CalendarRecord record;
    ASSERT_EQ(parser.setString(R"({"title": "a", "due": "soon"})"), 0);
    EXPECT_NE(kTodoKind.convert(parser.root(), &record), 0);

    // Only a due time that the server has is taken away there.
    const CalendarRecord todo = make(_calendar_todo);
    EXPECT_FALSE(Json::parse(kTodoKind.build(todo.get())).contains("due"));
    set(todo, CALENDAR_TODO_SYNC_DATA1, "due");
    EXPECT_TRUE(Json::parse(kTodoKind.build(todo.get()))["due"].is_null());
    set(todo, CALENDAR_TODO_HAS_DUE, 1);
    EXPECT_EQ(calendar_record_set_caltime(todo.get(), CALENDAR_TODO_DUE, date(2026, 3, 1)), 0);
    EXPECT_EQ(Json::parse(kTodoKind.build(todo.get()))["due"], "2026-03-01T00:00:00Z");
}

TEST(CalItemKind, WhatSaysTheSameComparesEqual) {
    const Json item =
        Json::parse(R"({"id": "1", "etag": "e", "status": "confirmed", "summary": "a", "location": "room",
        "start": {"dateTime": "2026-03-01T11:00:00+01:00", "timeZone": "Europe/Berlin"},
        "end": {"dateTime": "2026-03-01T12:00:00+01:00"}, "recurrence": ["RRULE:FREQ=DAILY"],
        "organizer": {"email": "me@x", "self": true}})");
    CalJsonParser parser;
    ASSERT_EQ(parser.setString(item.dump()), 0);
    const CalendarRecord event = timed();
    set(event, CALENDAR_EVENT_SUMMARY, "a");
    set(event, CALENDAR_EVENT_LOCATION, "room");
    set(event, CALENDAR_EVENT_FREQ, 1);
    EXPECT_EQ(kEventKind.comparable(event.get()), kEventKind.comparable(parser.root()));
    set(event, CALENDAR_EVENT_LOCATION, "another room");
    EXPECT_NE(kEventKind.comparable(event.get()), kEventKind.comparable(parser.root()));
}
