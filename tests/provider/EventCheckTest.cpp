#include "EventCheck.h"

#include <gtest/gtest.h>

#include "Recurrence.h"
#include "Times.h"

namespace provider {
namespace {

// A good event with the patch laid over it: one row, one difference.
Json eventWith(const char* patch) {
    Json event = Json::parse(R"({"summary":"s","start":{"dateTime":"2026-03-02T10:00:00Z"},
                                 "end":{"dateTime":"2026-03-02T11:00:00Z"}})");
    const Json changes = Json::parse(patch);
    for (const auto& [name, value] : changes.items()) {
        if (value.is_null())
            event.erase(name);
        else
            event[name] = value;
    }
    return event;
}

TEST(EventCheck, AcceptsGoodEvents) {
    for (
        const char* patch : {
            R"({})",
            R"({"unknown":{"kept":[1]}})",
            R"({"start":{"date":"2024-02-29"},"end":{"date":"2024-03-01"}})",
            R"({"start":{"date":"2026-03-02"},"end":{"date":"2026-03-02"}})",
            R"({"end":{"dateTime":"2026-03-02T10:00:00Z"}})",
            R"({"start":{"dateTime":"2026-03-02T10:00:00.250+05:30"}})",
            R"({"start":{"dateTime":"2026-03-02T10:00:00","timeZone":"Europe/Berlin"},
                 "end":{"dateTime":"2026-03-02T11:00:00","timeZone":"Europe/Berlin"}})",
            R"({"start":{"dateTime":"2026-03-02T23:00:00+09:00"},"end":{"dateTime":"2026-03-02T15:00:00+01:00"}})",
            R"({"recurrence":["RRULE:FREQ=DAILY","EXDATE:20260303T100000Z"]})",
            R"({"recurrence":[]})",
            R"({"visibility":"confidential","transparency":"transparent","status":"tentative"})",
            R"({"attendees":[{"email":"a@b","responseStatus":"declined","self":true}]})",
            R"({"reminders":{"useDefault":false,"overrides":[{"method":"popup","minutes":0}]}})",
            R"({"reminders":{"useDefault":true,"overrides":[]}})",
        }) {
        EXPECT_NO_THROW(checkEvent(eventWith(patch))) << patch;
    }
}

struct BadRow {
    const char* patch;
    const char* location;
};

TEST(EventCheck, NamesTheMemberAtFault) {
    const BadRow rows[] = {
        {R"({"start":null})", "start"},
        {R"({"end":null})", "end"},
        {R"({"start":"2026-03-02"})", "start"},
        {R"({"start":{}})", "start"},
        {R"({"start":{"date":"2026-03-02","dateTime":"2026-03-02T10:00:00Z"}})", "start"},
        {R"({"start":{"dateTime":20260302}})", "start.dateTime"},
        {R"({"start":{"dateTime":"2026-03-02T10:00:00"}})", "start.dateTime"},
        {R"({"start":{"dateTime":"2026-03-02 10:00:00Z"}})", "start.dateTime"},
        {R"({"start":{"dateTime":"2026-02-29T10:00:00Z"}})", "start.dateTime"},
        {R"({"start":{"dateTime":"2026-03-02T24:00:00Z"}})", "start.dateTime"},
        {R"({"start":{"dateTime":"2026-03-02T10:00:00+1:00"}})", "start.dateTime"},
        {R"({"start":{"dateTime":"2026-03-02T10:00:00.Z"}})", "start.dateTime"},
        {R"({"start":{"dateTime":"2026-03-02T10:00Z"}})", "start.dateTime"},
        {R"({"start":{"dateTime":"2026-03-02T10:00:00Z","timeZone":"Mars/Base"}})", "start.timeZone"},
        {R"({"start":{"dateTime":"2026-03-02T10:00:00Z","timeZone":"../../etc/passwd"}})", "start.timeZone"},
        {R"({"start":{"dateTime":"2026-03-02T10:00:00Z","timeZone":""}})", "start.timeZone"},
        {R"({"start":{"date":"2026-3-2"},"end":{"date":"2026-03-03"}})", "start.date"},
        {R"({"end":{"date":"2026-03-03"}})", "end"},
        {R"({"end":{"dateTime":"2026-03-02T09:59:59Z"}})", "timeRange"},
        {R"({"end":{"dateTime":"2026-03-02T11:00:00+02:00"}})", "timeRange"},
        {R"({"summary":7})", "summary"},
        {R"({"status":"done"})", "status"},
        {R"({"visibility":""})", "visibility"},
        {R"({"transparency":true})", "transparency"},
        {R"({"recurrence":"RRULE:FREQ=DAILY"})", "recurrence"},
        {R"({"recurrence":[1]})", "recurrence"},
        {R"({"recurrence":["EXDATE:20260303T100000Z"]})", "recurrence"},
        {R"({"recurrence":["RRULE:FREQ=DAILY"],"recurringEventId":"x"})", "recurrence"},
        {R"({"recurrence":["RRULE:FREQ=DAILY"],"start":{"dateTime":"2026-03-02T10:00:00+01:00"}})",
         "timeZone"},
        {R"({"attendees":{}})", "attendees"},
        {R"({"attendees":["a@b"]})", "attendees"},
        {R"({"attendees":[{"displayName":"A"}]})", "attendees.email"},
        {R"({"attendees":[{"email":"nobody"}]})", "attendees.email"},
        {R"({"attendees":[{"email":"a@b","responseStatus":"maybe"}]})", "attendees.responseStatus"},
        {R"({"reminders":[]})", "reminders"},
        {R"({"reminders":{"useDefault":1}})", "reminders.useDefault"},
        {R"({"reminders":{"useDefault":true,"overrides":[{"method":"popup","minutes":1}]}})", "reminders"},
        {R"({"reminders":{"overrides":[{"minutes":1}]}})", "reminders.overrides.method"},
        {R"({"reminders":{"overrides":[{"method":"popup","minutes":-1}]}})", "reminders.overrides.minutes"},
        {R"({"reminders":{"overrides":[{"method":"popup","minutes":1.5}]}})", "reminders.overrides.minutes"},
        {R"({"originalStartTime":{"date":"soon"}})", "originalStartTime.date"},
    };
    for (const BadRow& row : rows) {
        try {
            checkEvent(eventWith(row.patch));
            ADD_FAILURE() << "accepted: " << row.patch;
        } catch (const ApiError& error) {
            EXPECT_EQ(error.status, 400) << row.patch;
            EXPECT_EQ(error.location, row.location) << row.patch;
        }
    }
}

TEST(Recurrence, KnowsGoodLinesFromBad) {
    for (const char* line :
         {"RRULE:FREQ=WEEKLY;INTERVAL=2;BYDAY=MO,WE;WKST=SU;COUNT=10", "RRULE:FREQ=MONTHLY;BYDAY=-1FR,+2MO",
          "RRULE:FREQ=DAILY;UNTIL=20261231", "RRULE:FREQ=DAILY;UNTIL=20261231T235959Z",
          "RRULE:BYMONTHDAY=-31,31;FREQ=MONTHLY",
          "RRULE:FREQ=YEARLY;BYYEARDAY=366;BYWEEKNO=-53;BYMONTH=12;BYSETPOS=-1",
          "EXDATE;VALUE=DATE:20260501,20260508", "EXDATE;TZID=Europe/Berlin:20260501T090000",
          "RDATE:20260501T090000Z"}) {
        EXPECT_EQ(recurrenceFault(line), "") << line;
    }
    for (const char* line : {"",
                             "FREQ=DAILY",
                             "RRULE:",
                             "RRULE:COUNT=3",
                             "RRULE:FREQ=DAILY;",
                             "RRULE:FREQ=daily",
                             "RRULE:FREQ=HOURLY",
                             "RRULE:FREQ=DAILY;FREQ=DAILY",
                             "RRULE:FREQ=DAILY;COUNT=0",
                             "RRULE:FREQ=DAILY;COUNT=2;UNTIL=20261231",
                             "RRULE:FREQ=DAILY;INTERVAL=-1",
                             "RRULE:FREQ=DAILY;UNTIL=2026-12-31",
                             "RRULE:FREQ=DAILY;UNTIL=20261301",
                             "RRULE:FREQ=WEEKLY;BYDAY=",
                             "RRULE:FREQ=WEEKLY;BYDAY=MO,",
                             "RRULE:FREQ=WEEKLY;BYDAY=XX",
                             "RRULE:FREQ=WEEKLY;BYDAY=0MO",
                             "RRULE:FREQ=WEEKLY;BYDAY=MO WE",
                             "RRULE:FREQ=MONTHLY;BYMONTHDAY=32",
                             "RRULE:FREQ=MONTHLY;BYMONTHDAY=-32",
                             "RRULE:FREQ=MONTHLY;BYMONTHDAY=-2147483648",
                             "RRULE:FREQ=YEARLY;BYMONTH=0",
                             "RRULE:FREQ=YEARLY;BYMONTH=99999999999",
                             "RRULE:FREQ=DAILY;WKST=1",
                             "RRULE:FREQ=DAILY;X-A=1",
                             "EXRULE:FREQ=DAILY",
                             "EXDATE",
                             "EXDATE;20260501",
                             "EXDATE:20260501T0900",
                             "EXDATE:20260501T090000",
                             "EXDATE;TZID=Nowhere:20260501T090000",
                             "RDATE:"}) {
        EXPECT_NE(recurrenceFault(line), "") << line;
    }
}

TEST(Times, CompactTextNamesTheInstant) {
    struct Row {
        const char* time;
        const char* compact;
    };
    const Row rows[] = {{R"({"date":"2026-03-01"})", "20260301"},
                        {R"({"dateTime":"2026-03-01T00:30:00+05:30"})", "20260228T190000Z"},
                        {R"({"dateTime":"2025-12-31T22:00:00-03:00"})", "20260101T010000Z"},
                        {R"({"dateTime":"1969-12-31T23:59:59Z"})", "19691231T235959Z"}};
    for (const Row& row : rows) {
        const EventTime time = readTime(Json::parse(row.time), "start");
        EXPECT_EQ(compactText(time), row.compact);
        EXPECT_EQ(parseCompact(row.compact)->utc(), time.utc()) << row.compact;
        EXPECT_EQ(timeJson(time), Json::parse(row.time));
    }
}

}  // namespace
}  // namespace provider
