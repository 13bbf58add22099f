// Calendar and task replies that nobody sends in good faith, and texts that few think of.
#include <gtest/gtest.h>

#include "calendar/CalJsonBuilder.h"
#include "calendar/CalJsonParser.h"
#include "common/SyncResult.h"
#include "platform/calendar_read.h"
#include "support/Hostile.h"

using calendar_read::intOf;
using calendar_read::textOf;
using sync_result::kFailed;
using sync_result::kOk;
using Json = nlohmann::json;

namespace {

constexpr const char* kHostileTimes =
    R"("start":{"dateTime":"2026-03-01T10:00:00Z"},"end":{"dateTime":"2026-03-01T11:00:00Z"})";

// The first entry of a list of one, by way of its text.
CalListInfoPtr listed(const std::string& item) {
    CalJsonParser parser;
    CalListPage page;
    EXPECT_EQ(parser.setString(R"({"items":[)" + item + "]}"), kOk) << item;
    EXPECT_EQ(parser.getEventAllPage(&page), kOk);
    return page.entries.empty() ? std::make_shared<CalListInfo>() : page.entries.front();
}

CalendarRecord eventOf(const std::string& members) {
    CalendarRecord record;
    const CalListInfoPtr info =
        listed(R"({"id":"e","etag":"1",)" + std::string(kHostileTimes) + "," + members + "}");
    EXPECT_EQ(CalJsonParser::convertEvent(jsonObjectOf(info->json), &record), kOk) << members;
    return record;
}

}  // namespace

TEST(CalHostileReply, WhatIsNoListProvesNothing) {
    const std::string list = R"({"items":[]})";
    CalJsonParser parser;
    ASSERT_EQ(parser.setString(list), kOk);
    for (const hostile::Body& body : hostile::badBodies(list)) {
        EXPECT_EQ(parser.setString(body.text), kFailed) << body.name;
        CalListPage page;
        EXPECT_EQ(parser.getEventAllPage(&page), kOk) << "what was read before stays";
    }
}

TEST(CalHostileReply, NoFileOfTheSuiteIsTakenForAReply) {
    constexpr int (CalJsonParser::*kLists[])(CalListPage*) const = {
        &CalJsonParser::getBookList, &CalJsonParser::getEventListPage, &CalJsonParser::getEventAllPage,
        &CalJsonParser::getTodoBookList, &CalJsonParser::getTodoListPage};
    for (const hostile::Body& body : hostile::jsonSuite()) {
        CalJsonParser parser;
        CalListPage page;
        page.nextPageToken = "before";
        std::string etag = "before";
        const int loaded = parser.setString(body.text);
        EXPECT_TRUE(body.name[0] == 'i' || (loaded == kOk) == (body.name[0] == 'y')) << body.name;
        for (const auto list : kLists) EXPECT_EQ((parser.*list)(&page), kFailed) << body.name;
        EXPECT_EQ(parser.getAccessToken(&etag), kFailed) << body.name;
        EXPECT_EQ(page.nextPageToken + etag, "beforebefore") << "a refusal changes nothing";
        CalendarRecord record;
        EXPECT_EQ(CalJsonParser::convertEvent(parser.root(), &record), kFailed) << body.name;
        // A task needs nothing but to be an object.
        const bool isObject = parser.root() != nullptr;
        EXPECT_EQ(CalJsonParser::convertTodo(parser.root(), &record), isObject ? kOk : kFailed) << body.name;
    }
}

TEST(CalHostileReply, AnyTextComesBackAsItWent) {
    for (const std::string& text : hostile::naughtyStrings()) {
        const Json event = {{"id", "i" + text},
                            {"etag", "e" + text},
                            {"summary", text},
                            {"description", text},
                            {"location", text},
                            {"start", {{"date", "2026-03-01"}}},
                            {"end", {{"date", "2026-03-02"}}},
                            {"attendees", {{{"email", text}, {"responseStatus", "accepted"}}}},
                            {"organizer", {{"displayName", text}}}};
        const CalListInfoPtr info = listed(event.dump());
        EXPECT_EQ(info->id, "i" + text);
        EXPECT_EQ(info->etag, "e" + text);
        EXPECT_EQ(Json::parse(info->jsonText()), event);
        CalendarRecord record;
        ASSERT_EQ(CalJsonParser::convertEvent(jsonObjectOf(info->json), &record), kOk);
        EXPECT_EQ(textOf(record.get(), CALENDAR_EVENT_UID), "i" + text);
        EXPECT_EQ(textOf(record.get(), CALENDAR_EVENT_ORGANIZER_NAME), text);
        const Json sent = Json::parse(kEventKind.build(record.get()));
        for (const char* member : {"summary", "description", "location", "start", "end"})
            EXPECT_EQ(sent[member], event[member]);
        EXPECT_EQ(sent["attendees"][0].value("email", ""), text);

        const Json task = {{"id", "i" + text}, {"etag", "e"}, {"title", text}, {"notes", text}};
        ASSERT_EQ(CalJsonParser::convertTodo(jsonObjectOf(listed(task.dump())->json), &record), kOk);
        const Json sentTask = Json::parse(kTodoKind.build(record.get()));
        for (const char* member : {"title", "notes"}) EXPECT_EQ(sentTask[member], task[member]);
    }
}

TEST(CalHostileReply, WhatIsKeptOfAnEntryIsJson) {
    const char* const values[] = {"1e22",
                                  "-1.5e-9",
                                  "1E5",
                                  "0.1",
                                  "9223372036854775807",
                                  "-0.0",
                                  "true",
                                  "null",
                                  R"("1e22.0")",
                                  R"("\\")",
                                  R"("\"e.0")",
                                  R"("a\u001fb\u007f")",
                                  R"(["\u001f",1e300,{"e":1e-300}])"};
    for (const char* value : values) {
        const std::string item = R"({"id":"i","etag":"e","x":)" + std::string(value) + "}";
        EXPECT_EQ(Json::parse(listed(item)->jsonText()), Json::parse(item)) << value;
    }
}

TEST(CalHostileReply, NumbersOutOfRangeAreNotTaken) {
    CalJsonParser parser;
    const std::string digits(400, '9');
    for (const std::string& number :
         {std::string("1e999"), std::string("-1E+400"), std::string("9223372036854775808"),
          std::string("-9223372036854775809"), digits, digits + ".5"}) {
        EXPECT_EQ(parser.setString(R"({"items":[],"x":)" + number + "}"), kFailed) << number;
    }
    for (const char* number : {"9223372036854775807", "-9223372036854775808", "1e308", "1e-999", "-0", "0.1"})
        EXPECT_EQ(parser.setString(R"({"items":[],"x":)" + std::string(number) + "}"), kOk) << number;
    for (const char* minutes : {"2147483648", "-1", "1e3", "9223372036854775807", "0.5", "\"30\""}) {
        const CalendarRecord record =
            eventOf(R"("reminders":{"overrides":[{"minutes":)" + std::string(minutes) + "}]}");
        unsigned count = 9;
        ASSERT_EQ(calendar_record_get_child_record_count(record.get(), CALENDAR_EVENT_ALARMS, &count), 0);
        EXPECT_EQ(count, 0U) << minutes;
    }
    for (const char* number : {"2147483648", "99999999999999999999", "-2147483649", "x", ""}) {
        const CalendarRecord record = eventOf(R"("recurrence":["RRULE:FREQ=DAILY;INTERVAL=)" +
                                              std::string(number) + ";COUNT=" + number + R"("])");
        EXPECT_EQ(intOf(record.get(), CALENDAR_EVENT_INTERVAL), 1) << number;
        EXPECT_EQ(intOf(record.get(), CALENDAR_EVENT_RANGE_TYPE), 2) << number;
    }
    for (const char* number : {"4294967297", "-4294967297", "9223372036854775807", "1e3"}) {
        ExceptionInfo info;
        const CalListInfoPtr instance =
            listed(R"({"id":"e","etag":"1","originalStartTime":{"date":"2026-03-01"},"sequence":)" +
                   std::string(number) + "}");
        ASSERT_EQ(CalJsonParser::checkException(jsonObjectOf(instance->json), &info), kOk);
        EXPECT_EQ(info.sequence, 0) << number;
        ASSERT_EQ(parser.setString(R"({"error":{"code":)" + std::string(number) + "}}"), kOk);
        EXPECT_EQ(parser.checkData(), kFailed) << number;
    }
    for (const char* time :
         {"10000-01-01T00:00:00Z", "2026-00-01T00:00:00Z", "2026-01-01T99:00:00Z", "2026-01-01T00:00:-1Z",
          "2026-02-29T00:00:00Z", "2026-04-31T00:00:00Z", "-001-01-01T00:00:00Z", "9999-12-31T23:00:00-02:00",
          "0001-01-01T00:00:00+01:00"}) {
        CalendarRecord record;
        const CalListInfoPtr event = listed(R"({"id":"e","etag":"1","start":{"dateTime":")" +
                                            std::string(time) + R"("},"end":{"date":"2026-03-01"}})");
        EXPECT_EQ(CalJsonParser::convertEvent(jsonObjectOf(event->json), &record), kFailed) << time;
    }
}
