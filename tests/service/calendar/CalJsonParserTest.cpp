// Replies of the service, good and bad.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iterator>

#include "calendar/CalJsonParser.h"
#include "calendar/CalMappings.h"
#include "calendar/CalTime.h"
#include "common/SyncResult.h"
#include "platform/calendar_read.h"

using calendar_read::intOf;
using calendar_read::textOf;
using sync_result::kFailed;
using sync_result::kOk;

namespace {

// An event as the service sends it, converted; NULL when it cannot be.
CalendarRecord convert(const std::string& members) {
    CalJsonParser parser;
    CalListPage page;
    EXPECT_EQ(parser.setString(R"({"items":[{"id":"e","etag":"1",)" + members + "}]}"), kOk) << members;
    EXPECT_EQ(parser.getEventAllPage(&page), kOk);
    CalendarRecord record;
    (void)CalJsonParser::convertEvent(jsonObjectOf(page.entries.at(0)->json), &record);
    return record;
}

const std::string kTimes =
    R"("start":{"dateTime":"2026-03-01T10:00:00Z"},"end":{"dateTime":"2026-03-01T11:00:00Z"})";

calendar_time_s timeOf(calendar_record_h record, unsigned property) {
    calendar_time_s time;
    EXPECT_EQ(calendar_record_get_caltime(record, property, &time), PLATFORM_ERROR_NONE);
    return time;
}

ExceptionInfo exceptionOf(const std::string& members, int expected = kOk) {
    CalJsonParser parser;
    CalListPage page;
    EXPECT_EQ(parser.setString(R"({"items":[{"id":"e","etag":"1",)" + members + "}]}"), kOk);
    EXPECT_EQ(parser.getEventAllPage(&page), kOk);
    ExceptionInfo info;
    EXPECT_EQ(CalJsonParser::checkException(jsonObjectOf(page.entries.at(0)->json), &info), expected)
        << members;
    return info;
}

}  // namespace

TEST(CalJsonParser, TimesBecomeInstantsOrDays) {
    struct Row {
        const char* start;
        int64_t utime;  // -1: a date
        const char* zone;
    };
    const Row rows[] = {
        {R"({"dateTime":"2014-05-01T10:00:00+09:00"})", 1398906000, ""},
        {R"({"dateTime":"2014-05-01T10:00:00-05:30"})", 1398956400, ""},  // minutes of the offset are dropped
        {R"({"dateTime":"2014-05-01T10:00:00Z","timeZone":"Asia/Seoul"})", 1398938400, "Asia/Seoul"},
        {R"({"dateTime":"2014-05-01T10:00:00.250+09:00"})", 1398906000, ""},
        {R"({"dateTime":"2014-05-01T10:00:00","timeZone":"Asia/Seoul"})", 1398906000, "Asia/Seoul"},
        {R"({"dateTime":"2014-05-01T10:00:00","timeZone":"No/Where"})", 1398938400, "No/Where"},
        {R"({"date":"2014-05-01"})", -1, ""},
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.start);
        const CalendarRecord record =
            convert(R"("end":{"dateTime":"2014-06-01T10:00:00Z"},"start":)" + std::string(row.start));
        ASSERT_TRUE(record);
        const calendar_time_s start = timeOf(record.get(), CALENDAR_EVENT_START);
        EXPECT_EQ(textOf(record.get(), CALENDAR_EVENT_START_TZID), row.zone);
        if (row.utime >= 0) {
            EXPECT_EQ(start.type, CALENDAR_TIME_UTIME);
            EXPECT_EQ(start.utime, row.utime);
        } else {
            EXPECT_EQ(start.type, CALENDAR_TIME_LOCALTIME);
            EXPECT_EQ(start.year * 10000 + start.month * 100 + start.mday, 20140501);
        }
    }
    const CalendarRecord both =
        convert(R"("start":{"dateTime":"2014-05-01T10:00:00Z","timeZone":"Asia/Seoul"},)"
                R"("end":{"dateTime":"2014-05-01T11:00:00Z","timeZone":"Europe/Rome"})");
    EXPECT_EQ(textOf(both.get(), CALENDAR_EVENT_START_TZID), "Europe/Rome") << "the end's zone stays";
}

TEST(CalJsonParser, EventsThatCannotBeReadAreRefused) {
    for (const char* members : {
             R"("summary":"no times")",
             R"("start":{"dateTime":"2026-03-01T10:00:00Z"})",
             R"("start":"soon","end":"later")",
             R"("start":{"dateTime":"2026-13-01T10:00:00Z"},"end":{"dateTime":"2026-03-01T11:00:00Z"})",
             R"("start":{"date":"yesterday"},"end":{"date":"2026-03-01"})",
             R"("start":{"dateTime":17},"end":{"dateTime":18})",
             R"("start":{"date":"2026-03-01"},"end":{"date":"2026-03-02"},"recurrence":[7])",
         }) {
        EXPECT_FALSE(convert(members)) << members;
    }
}

TEST(CalJsonParser, WordsBecomeNumbers) {
    struct Row {
        const char* members;
        unsigned property;
        int value;
    };
    const Row rows[] = {
        {R"("status":"cancelled")", CALENDAR_EVENT_STATUS, 8},
        {R"("status":"confirmed")", CALENDAR_EVENT_STATUS, 4},
        {R"("status":"tentatively")", CALENDAR_EVENT_STATUS, 2},  // nine characters count
        {R"("status":"odd")", CALENDAR_EVENT_STATUS, 1},
        {R"("x":1)", CALENDAR_EVENT_STATUS, 1},
        {R"("visibility":"private")", CALENDAR_EVENT_SENSITIVITY, 1},
        {R"("visibility":"confidential")", CALENDAR_EVENT_SENSITIVITY, 2},
        {R"("visibility":"public")", CALENDAR_EVENT_SENSITIVITY, 2},  // left at the default
        {R"("x":1)", CALENDAR_EVENT_SENSITIVITY, 2},
        {R"("transparency":"transparent")", CALENDAR_EVENT_BUSY_STATUS, 0},
        {R"("transparency":"odd")", CALENDAR_EVENT_BUSY_STATUS, 0},
        {R"("x":1)", CALENDAR_EVENT_BUSY_STATUS, 1},
        {R"("organizer":{"self":true})", CALENDAR_EVENT_MEETING_STATUS, 1},
        {R"("x":1)", CALENDAR_EVENT_MEETING_STATUS, 2},
        {R"("summary":17)", CALENDAR_EVENT_FREQ, 0},  // a member of the wrong type is absent
    };
    for (const Row& row : rows) {
        const CalendarRecord record = convert(kTimes + "," + row.members);
        ASSERT_TRUE(record) << row.members;
        EXPECT_EQ(intOf(record.get(), row.property), row.value) << row.members;
    }
}

TEST(CalJsonParser, RecurrenceRules) {
    struct Row {
        const char* rule;
        int freq;
        int rangeType;
        int count;
        int interval;
        const char* byDay;
    };
    const Row rows[] = {
        {"RRULE:FREQ=WEEKLY;INTERVAL=2;BYDAY=MO,WE;COUNT=10", 2, 1, 10, 2, "MO,WE"},
        {"RRULE:FREQ=DAILY", 1, 2, 0, 1, ""},
        {"RRULE:FREQ=HOURLY;COUNT=3", 0, 1, 3, 1, ""},
        {"RRULE:;;FREQ=YEARLY;", 4, 2, 0, 1, ""},
        {"", 0, 2, 0, 1, ""},
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.rule);
        const CalendarRecord record =
            convert(kTimes + R"(,"recurrence":[")" + row.rule + R"(","EXDATE:20260101"])");
        ASSERT_TRUE(record);
        EXPECT_EQ(intOf(record.get(), CALENDAR_EVENT_FREQ), row.freq);
        EXPECT_EQ(intOf(record.get(), CALENDAR_EVENT_RANGE_TYPE), row.rangeType);
        EXPECT_EQ(intOf(record.get(), CALENDAR_EVENT_COUNT), row.count);
        EXPECT_EQ(intOf(record.get(), CALENDAR_EVENT_INTERVAL), row.interval);
        EXPECT_EQ(textOf(record.get(), CALENDAR_EVENT_BYDAY), row.byDay);
    }
    const CalendarRecord until = convert(
        kTimes +
        R"(,"recurrence":["RRULE:FREQ=MONTHLY;UNTIL=20141231;BYMONTHDAY=3;BYMONTH=2;BYSETPOS=-1;BYWEEKNO=4;WKST=SU"])");
    EXPECT_EQ(intOf(until.get(), CALENDAR_EVENT_RANGE_TYPE), 0);
    EXPECT_EQ(timeOf(until.get(), CALENDAR_EVENT_UNTIL).type, CALENDAR_TIME_LOCALTIME);
    EXPECT_EQ(timeOf(until.get(), CALENDAR_EVENT_UNTIL).mday, 31);
    EXPECT_EQ(textOf(until.get(), CALENDAR_EVENT_BYMONTHDAY), "3");
    EXPECT_EQ(textOf(until.get(), CALENDAR_EVENT_BYMONTH), "2");
    EXPECT_EQ(textOf(until.get(), CALENDAR_EVENT_BYSETPOS), "-1");
    EXPECT_EQ(textOf(until.get(), CALENDAR_EVENT_BYWEEKNO), "4");
    EXPECT_EQ(intOf(until.get(), CALENDAR_EVENT_WKST), 1);
    const CalendarRecord instant =
        convert(kTimes + R"(,"recurrence":["RRULE:FREQ=DAILY;UNTIL=20140501T010000Z"])");
    EXPECT_EQ(timeOf(instant.get(), CALENDAR_EVENT_UNTIL).utime, 1398906000);
}

TEST(CalJsonParser, AttendeesAndReminders) {
    const CalendarRecord record = convert(
        kTimes +
        R"(,"attendees":[{"email":"a@x","self":true,"responseStatus":"declined"},)"
        R"({"email":"b@x","displayName":"B","organizer":true,"responseStatus":"accepted"},"odd"],)"
        R"("reminders":{"overrides":[{"method":"email","minutes":30},{"method":"popup"},{"minutes":-1}]})");
    ASSERT_TRUE(record);
    EXPECT_EQ(textOf(record.get(), CALENDAR_EVENT_SYNC_DATA1), "declined");
    calendar_record_h child = nullptr;
    ASSERT_EQ(calendar_record_get_child_record_at_p(record.get(), CALENDAR_EVENT_ATTENDEES, 1, &child), 0);
    EXPECT_EQ(textOf(child, CALENDAR_ATTENDEE_NAME), "B");
    EXPECT_EQ(intOf(child, CALENDAR_ATTENDEE_ROLE), 3);
    EXPECT_EQ(intOf(child, CALENDAR_ATTENDEE_STATUS), 1);
    unsigned count = 0;
    ASSERT_EQ(calendar_record_get_child_record_count(record.get(), CALENDAR_EVENT_ALARMS, &count), 0);
    EXPECT_EQ(count, 1U);
    ASSERT_EQ(calendar_record_get_child_record_at_p(record.get(), CALENDAR_EVENT_ALARMS, 0, &child), 0);
    EXPECT_EQ(intOf(child, CALENDAR_ALARM_TICK) * intOf(child, CALENDAR_ALARM_TICK_UNIT), 1800);
}

TEST(CalJsonParser, ExceptionKinds) {
    struct Row {
        const char* start;
        const char* status;
        ExceptionKind kind;
        const char* recurrenceId;
    };
    const Row rows[] = {
        {R"({"date":"2014-05-01"})", "confirmed", ExceptionKind::kModified, "20140501"},
        {R"({"dateTime":"2014-05-01T10:00:00+09:00"})", "cancelled", ExceptionKind::kCancelled,
         "20140501T010000Z"},
        {R"({"dateTime":"2014-05-01T10:00:00-05:00"})", "", ExceptionKind::kModified, "20140501T100000Z"},
        {R"({"dateTime":"2014-05-01T10:00:00Z"})", "", ExceptionKind::kModified, "20140501T100000Z"},
        {R"({"dateTime":"2014-05-01T10:00:00+00:30"})", "", ExceptionKind::kModified, "20140501T100000Z"},
    };
    for (const Row& row : rows) {
        const ExceptionInfo info =
            exceptionOf(std::string(R"("recurringEventId":"s","sequence":3,"originalStartTime":)") +
                        row.start + R"(,"status":")" + row.status + R"(")");
        EXPECT_EQ(info.kind, row.kind) << row.start;
        EXPECT_EQ(info.recurrenceId, row.recurrenceId);
        EXPECT_EQ(info.seriesUri, "s");
        EXPECT_EQ(info.sequence, 3);
    }
    EXPECT_EQ(exceptionOf(R"("status":"cancelled")").kind, ExceptionKind::kOrdinary);
    exceptionOf(R"("originalStartTime":{"date":"odd"})", kFailed);
    exceptionOf(R"("originalStartTime":7)", kFailed);
}

TEST(CalJsonParser, ListsTellWhatTheyCannotCompare) {
    CalJsonParser parser;
    CalListPage page;
    ASSERT_EQ(
        parser.setString(
            R"({"nextPageToken":"t","items":[{"id":"a","etag":"1","summary":"A","backgroundColor":"#010203",)"
            R"("accessRole":"reader"},{"id":"b"},{"etag":"x"},7]})"),
        kOk);
    ASSERT_EQ(parser.getBookList(&page), kOk);
    ASSERT_EQ(page.entries.size(), 1U);
    EXPECT_EQ(page.entries[0]->accessRole, "reader");
    EXPECT_EQ(page.nextPageToken, "t");
    EXPECT_THAT(page.idOnly, testing::ElementsAre("b"));
    EXPECT_EQ(page.unreadable, 2U);
    ASSERT_EQ(parser.getTodoBookList(&page), kOk);
    EXPECT_EQ(page.entries.size(), 2U) << "task lists need no etag";
}

TEST(CalJsonParser, ErrorsAndTokens) {
    struct Row {
        const char* body;
        int code;
    };
    for (const Row& row : {Row{R"({"error":{"code":404}})", 404}, Row{R"({"error":{"code":"403"}})", 403},
                           Row{R"({"error":{}})", kFailed}, Row{R"({"error":"text"})", 0}, Row{"[]", 0}}) {
        CalJsonParser parser;
        ASSERT_EQ(parser.setString(row.body), kOk);
        EXPECT_EQ(parser.checkData(), row.code) << row.body;
    }
    CalJsonParser parser;
    std::string token = "before";
    ASSERT_EQ(parser.setString(R"({"access_token":5})"), kOk);
    EXPECT_EQ(parser.getAccessToken(&token), kFailed);
    EXPECT_EQ(token, "before");
}

TEST(CalJsonParser, TakesJsonToTheLetter) {
    int good = 0, bad = 0, free = 0;
    for (const auto& entry : std::filesystem::directory_iterator(VPS_CORPUS_DIR "/json-suite/test_parsing")) {
        std::ifstream file(entry.path(), std::ios::binary);
        const std::string body{std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
        const std::string name = entry.path().filename();
        CalJsonParser parser;
        const int loaded = parser.setString(body);
        CalListPage page;
        if (loaded == kOk) {
            (void)parser.checkData();
            EXPECT_EQ(parser.getEventAllPage(&page), kFailed) << name << " has not the shape of a list";
        }
        if (name.starts_with("y_")) {
            ++good;
            EXPECT_EQ(loaded, kOk) << name;
        } else if (name.starts_with("n_")) {
            ++bad;
            EXPECT_EQ(loaded, kFailed) << name;
        } else {
            ++free;
        }
    }
    EXPECT_EQ(good, 95);
    EXPECT_EQ(bad, 188);
    EXPECT_EQ(free, 35);
}

TEST(CalJsonParser, HalfASurrogatePairIsOneUnknownCharacter) {
    struct Row {
        const char* json;
        const char* text;
    };
    for (const Row& row :
         {Row{R"(a\ud83d\ude00b)",
              "a\xF0\x9F\x98\x80"
              "b"},
          Row{R"(a\uD800b)",
              "a\xEF\xBF\xBD"
              "b"},
          Row{R"(a\uDFAA)", "a\xEF\xBF\xBD"},
          Row{R"(\uDd1e\uD834b)",
              "\xEF\xBF\xBD\xEF\xBF\xBD"
              "b"},
          Row{R"(\uD888\u0041)",
              "\xEF\xBF\xBD"
              "A"},
          Row{R"(\uD83D\uD83D\uDE00)", "\xEF\xBF\xBD\xF0\x9F\x98\x80"},
          Row{R"(\uD83D\uDE00\uDE00)", "\xF0\x9F\x98\x80\xEF\xBF\xBD"}, Row{R"(\\uD800)", "\\uD800"}}) {
        const CalendarRecord record = convert(kTimes + R"(,"summary":")" + row.json + R"(")");
        EXPECT_EQ(textOf(record.get(), CALENDAR_EVENT_SUMMARY), row.text) << row.json;
    }
}

TEST(CalMappings, GoBothWaysButForTheLossyRows) {
    using namespace cal_mapping;
    const auto check = [](const auto& table, std::initializer_list<std::string_view> oneWay) {
        for (const NameOf& row : table) {
            const bool back = nameOf(table, row.value) == row.name;
            EXPECT_NE(back, std::find(oneWay.begin(), oneWay.end(), row.name) != oneWay.end()) << row.name;
            EXPECT_EQ(valueOf(table, row.name), row.value);
        }
    };
    check(kStatus, {});
    check(kVisibility, {"confidential"});
    check(kTransparency, {});
    check(kResponseStatus, {});
    check(kFrequency, {});
    check(kWeekday, {});
    check(kTodoStatus, {});
    EXPECT_EQ(std::size(kLossyRows), 10U);
    const CalendarRecord half = convert(std::string(R"("end":{"date":"2026-03-02"},"start":{"dateTime":")") +
                                        std::string(kLossyRows[2].wire) + R"("})");
    EXPECT_EQ(timeOf(half.get(), CALENDAR_EVENT_START).utime, 1772341200) << kLossyRows[2].device;
    EXPECT_EQ(exceptionOf(R"("originalStartTime":{"dateTime":")" + std::string(kLossyRows[3].wire) + R"("})")
                  .recurrenceId,
              kLossyRows[3].device);
}
