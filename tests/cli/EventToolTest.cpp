// The built tool on a calendar store: events are added, shown, changed and deleted as a user's edits.
#include <gtest/gtest.h>

#include "EventFields.h"
#include "cli/ToolRoot.h"

namespace {

constexpr const char* kMeeting =
    R"({"summary": "Meeting", "start": "2014-05-01T10:00:00Z", "end": "2014-05-01T11:00:00Z"})";
constexpr const char* kSeries =
    R"({"summary": "Daily", "start": "2014-05-01T10:00:00Z", "end": "2014-05-01T11:00:00Z", "rrule": "FREQ=DAILY"})";

std::string changedInstance(int series) {
    return R"({"summary": "Moved", "start": "2014-05-03T12:00:00Z", "end": "2014-05-03T13:00:00Z",)"
           R"("recurrenceId": "20140503T100000Z", "originalEvent": )" +
           std::to_string(series) + "}";
}

TEST(EventTool, ShowsAnEventThatCanBeEditedAndPutBack) {
    ToolRoot tool;
    const int work = ToolRoot::addCalendar(7, "Work");
    Json event = Json::parse(kSeries);
    event["exdates"] = {"2014-05-02T10:00:00Z"};
    event["attendees"] = {{{"email", "bob@example.com"}, {"status", "declined"}}};
    event["reminders"] = {10};
    const int first = tool.addEvent(work, event.dump());
    Json shown = tool.json({"event", "show", std::to_string(first), "--json"});
    EXPECT_EQ(shown["id"], first);
    EXPECT_EQ(shown["calendar"], work);
    EXPECT_EQ(shown["exdates"], event["exdates"]);

    shown["summary"] = "Copy";
    Json copy = tool.json({"event", "add", "-", "--json"}, shown.dump());
    EXPECT_NE(copy["id"], first);
    copy["id"] = first;
    EXPECT_EQ(copy.dump(), shown.dump());
    EXPECT_EQ(tool.json({"events", "list", "--json"}).size(), 2U);
}

TEST(EventTool, SetWritesTheNamedFieldsAndNothingElse) {
    ToolRoot tool;
    const int work = ToolRoot::addCalendar(7, "Work");
    const std::string id = std::to_string(tool.addEvent(work, kMeeting));
    Json before = tool.json({"event", "show", id, "--json"});
    const CommandResult result =
        tool.run({"event", "set", id, "summary=a=b", "start=2014-05-02", "end=2014-05-03", "busy=false",
                  "rrule=RRULE:FREQ=DAILY;COUNT=2", "status=confirmed", "timeZone=Europe/Berlin"});
    ASSERT_EQ(result.status, 0) << result.error;
    before.update({{"summary", "a=b"},
                   {"start", "2014-05-02"},
                   {"end", "2014-05-03"},
                   {"busy", false},
                   {"rrule", "FREQ=DAILY;COUNT=2"},
                   {"status", "confirmed"},
                   {"timeZone", "Europe/Berlin"}});
    EXPECT_EQ(tool.json({"event", "show", id, "--json"}).dump(), before.dump());

    // All or nothing: a bad value leaves the good ones unwritten as well.
    for (const char* bad : {"start=soon", "end=2014-05-01", "busy=yes", "visibility=secret", "rrule=FREQ=X",
                            "timeZone=Nowhere", "status=maybe", "summary=\xff"}) {
        EXPECT_EQ(tool.run({"event", "set", id, "location=here", bad}).status, 1) << bad;
    }
    EXPECT_EQ(tool.json({"event", "show", id, "--json"}).dump(), before.dump());
}

TEST(EventTool, AChangedInstanceIsAnEventOfItsSeries) {
    ToolRoot tool;
    const int work = ToolRoot::addCalendar(7, "Work");
    const int home = ToolRoot::addCalendar(7, "Home");
    const int series = tool.addEvent(work, kSeries);
    const int instance = tool.addEvent(home, changedInstance(series));
    const Json shown = tool.json({"event", "show", std::to_string(instance), "--json"});
    EXPECT_EQ(shown["calendar"], work);
    EXPECT_EQ(shown["originalEvent"], series);
    EXPECT_EQ(shown["recurrenceId"], "20140503T100000Z");
    EXPECT_EQ(tool.json({"events", "list", "--calendar", std::to_string(work), "--json"}).size(), 2U);

    ASSERT_EQ(tool.run({"event", "set", std::to_string(instance), "summary=Again"}).status, 0);
    EXPECT_EQ(tool.json({"event", "show", std::to_string(instance), "--json"})["summary"], "Again");
    EXPECT_EQ(tool.run({"event", "set", std::to_string(instance), "rrule=FREQ=DAILY"}).status, 1);
    EXPECT_EQ(tool.run({"event", "add", "-"}, changedInstance(series)).status, 1) << "one per instance";
    EXPECT_EQ(tool.run({"event", "add", "-"}, changedInstance(instance)).status, 1) << "no series";
    EXPECT_EQ(tool.run({"event", "add", "-"}, changedInstance(4711)).status, 1) << "no event";

    ASSERT_EQ(tool.run({"event", "delete", std::to_string(instance)}).status, 0);
    EXPECT_EQ(tool.run({"event", "show", std::to_string(instance)}).status, 1);
    EXPECT_EQ(tool.json({"event", "show", std::to_string(series), "--json"})["exdates"].dump(),
              R"(["2014-05-03T10:00:00Z"])");
    EXPECT_EQ(tool.run({"event", "add", "-"}, changedInstance(series)).status, 1) << "cancelled";

    ASSERT_EQ(tool.run({"event", "delete", std::to_string(series)}).status, 0);
    EXPECT_EQ(tool.json({"events", "list", "--json"}).dump(), "[]");
}

TEST(EventTool, AReadOnlyCalendarIsLeftAlone) {
    ToolRoot tool;
    const int open = ToolRoot::addCalendar(7, "Work");
    const int id = tool.addEvent(open, kMeeting);
    ASSERT_EQ(calendar_connect_with_flags(0), 0);
    calendar_record_h book = nullptr;
    ASSERT_EQ(calendar_db_get_record(_calendar_book, open, &book), 0);
    const CalendarRecord owned(book);
    ASSERT_EQ(calendar_record_set_int(book, CALENDAR_BOOK_MODE, 1), 0);
    ASSERT_EQ(calendar_db_update_record(book), 0);
    calendar_disconnect();

    const std::string before = tool.run({"events", "list", "--json"}).output;
    EXPECT_EQ(tool.run({"event", "add", "-", "--calendar", std::to_string(open)}, kMeeting).status, 1);
    EXPECT_EQ(tool.run({"event", "set", std::to_string(id), "summary=x"}).status, 1);
    EXPECT_EQ(tool.run({"event", "delete", std::to_string(id)}).status, 1);
    EXPECT_EQ(tool.run({"events", "list", "--json"}).output, before);
    EXPECT_EQ(tool.json({"calendars", "list", "--json"}).dump(),
              R"([{"id":)" + std::to_string(open) +
                  R"(,"account":7,"kind":"event","name":"Work","color":"#0a141e","readOnly":true}])");
}

TEST(EventTool, ListsAreOfOneCalendarOrOneAccount) {
    ToolRoot tool;
    const int work = ToolRoot::addCalendar(7, "Work");
    const int other = ToolRoot::addCalendar(8, "Other");
    tool.addEvent(work, kMeeting);
    tool.addEvent(other, kMeeting);
    tool.addEvent(other, kSeries);
    EXPECT_EQ(tool.json({"events", "list", "--json"}).size(), 3U);
    EXPECT_EQ(tool.json({"events", "list", "--json", "--account", "8"}).size(), 2U);
    EXPECT_EQ(
        tool.json({"events", "list", "--json", "--account", "8", "--calendar", std::to_string(work)}).size(),
        0U);
    EXPECT_EQ(tool.json({"events", "list", "--json", "--account", "9"}).size(), 0U);
    EXPECT_EQ(tool.json({"calendars", "list", "--json", "--account", "8"}).size(), 1U);
}

TEST(EventTool, AMalformedFileAddsNothing) {
    ToolRoot tool;
    const int work = ToolRoot::addCalendar(7, "Work");
    for (const std::string& text :
         {std::string(), std::string("{"), std::string("[1]"), std::string("{\"start\": 1}"),
          std::string("{\"summary\": \"\xff\"}"), std::string(100000, '[')}) {
        const CommandResult result =
            tool.run({"event", "add", "-", "--calendar", std::to_string(work)}, text);
        EXPECT_EQ(result.status, 1) << text.substr(0, 20);
    }
    EXPECT_EQ(tool.run({"event", "add", "-"}, kMeeting).status, 1) << "no calendar said";
    EXPECT_EQ(tool.run({"event", "add", "-", "--calendar", "99"}, kMeeting).status, 1);
    EXPECT_EQ(tool.json({"events", "list", "--json"}).dump(), "[]");
}

}  // namespace
