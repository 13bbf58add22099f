// The built tool on to-dos, and on single instances of a series.
#include <gtest/gtest.h>

#include "cli/ToolRoot.h"

namespace {

constexpr const char* kTodoSeries =
    R"({"summary": "Daily", "start": "2014-05-01T10:00:00Z", "end": "2014-05-01T11:00:00Z", "rrule": "FREQ=DAILY",
        "location": "Room", "reminders": [10]})";

}  // namespace

TEST(TodoTool, ShowsWhatCanBeEditedAndPutBack) {
    ToolRoot tool;
    const std::string list = std::to_string(ToolRoot::addTaskList(7, "Tasks"));
    const Json added =
        tool.json({"todo", "add", "--calendar", list, "-", "--json"},
                  R"({"summary": "Post", "note": "two\nlines", "due": "2014-05-01T10:00:00+02:00"})");
    const std::string id = std::to_string(added["id"].get<int>());
    EXPECT_EQ(added, Json({{"id", added["id"]},
                           {"calendar", std::stoi(list)},
                           {"uid", ""},
                           {"summary", "Post"},
                           {"note", "two\nlines"},
                           {"due", "2014-05-01T08:00:00Z"},
                           {"completed", ""},
                           {"status", "needsAction"}}));
    ASSERT_EQ(
        tool.run({"todo", "set", id, "status=completed", "completed=2014-05-02T09:00:00Z", "due=2014-05-03"})
            .status,
        0);
    Json shown = tool.json({"todo", "show", id, "--json"});
    EXPECT_EQ(shown["due"], "2014-05-03");
    EXPECT_EQ(shown["completed"], "2014-05-02T09:00:00Z");
    EXPECT_EQ(shown["note"], "two\nlines");
    ASSERT_EQ(tool.run({"todo", "set", id, "due=", "completed="}).status, 0);
    shown = tool.json({"todo", "show", id, "--json"});
    EXPECT_EQ(shown["due"], "");
    EXPECT_EQ(shown["completed"], "");
    Json copy = tool.json({"todo", "add", "-", "--json"}, shown.dump());
    EXPECT_NE(copy["id"], shown["id"]);
    copy["id"] = shown["id"];
    EXPECT_EQ(copy, shown);
    EXPECT_EQ(tool.json({"todos", "list", "--account", "7", "--json"}).size(), 2U);
    EXPECT_EQ(tool.json({"todos", "list", "--account", "8", "--json"}).size(), 0U);
    ASSERT_EQ(tool.run({"todo", "delete", id}).status, 0);
    EXPECT_EQ(tool.json({"todos", "list", "--calendar", list, "--json"}).size(), 1U);
}

TEST(TodoTool, RefusesWhatIsNotRightAndLeavesTheRest) {
    ToolRoot tool;
    const std::string list = std::to_string(ToolRoot::addTaskList(7, "Tasks"));
    const std::string calendar = std::to_string(ToolRoot::addCalendar(7, "Work"));
    const std::string id = std::to_string(
        tool.json({"todo", "add", "--calendar", list, "-", "--json"}, R"({"summary": "a"})")["id"]
            .get<int>());
    struct Row {
        std::vector<std::string> arguments;
        const char* input;
        int status;
    };
    const Row rows[] = {
        {{"todo", "set", id, "summary=b", "due=soon"}, "", 1},
        {{"todo", "set", id, "completed=2014-05-01"}, "", 1},
        {{"todo", "set", id, "status=done"}, "", 1},
        {{"todo", "set", id, "uid=x"}, "", 2},
        {{"todo", "set", id, "summary=b", "summary=c"}, "", 2},
        {{"todo", "set", "99", "summary=b"}, "", 1},
        {{"todo", "show", "x"}, "", 2},
        {{"todo", "delete", "99"}, "", 1},
        {{"todo", "add", "-"}, R"({"summary": "no list"})", 1},
        {{"todo", "add", "--calendar", calendar, "-"}, R"({"summary": "wrong kind"})", 1},
        {{"todo", "add", "--calendar", list, "-"}, R"({"title": "unknown"})", 1},
        {{"todo", "add", "--calendar", list, "-"}, R"({"due": 1})", 1},
        {{"event", "add", "--calendar", list, "-"}, R"({"start": "2014-05-01", "end": "2014-05-02"})", 1},
    };
    for (const Row& row : rows) {
        const CommandResult result = tool.run(row.arguments, row.input);
        EXPECT_EQ(result.status, row.status) << row.arguments.back() << result.error;
        EXPECT_EQ(std::count(result.error.begin(), result.error.end(), '\n'), 1) << result.error;
    }
    EXPECT_EQ(tool.json({"todo", "show", id, "--json"})["summary"], "a");
}

TEST(EventTool, OneInstanceOfASeriesIsChangedAndCancelled) {
    ToolRoot tool;
    const std::string series = std::to_string(tool.addEvent(ToolRoot::addCalendar(7, "Work"), kTodoSeries));
    ASSERT_EQ(tool.run({"event", "set", series, "--instance", "20140503T100000Z", "summary=Late"}).status, 0);
    ASSERT_EQ(
        tool.run({"event", "set", series, "--instance", "2014-05-03T12:00:00+02:00", "busy=false"}).status,
        0);
    Json events = tool.json({"events", "list", "--json"});
    ASSERT_EQ(events.size(), 2U) << "one exception, however often it is changed";
    EXPECT_EQ(events[1]["summary"], "Late");
    EXPECT_EQ(events[1]["busy"], false);
    EXPECT_EQ(events[1]["start"], "2014-05-03T10:00:00Z");
    EXPECT_EQ(events[1]["end"], "2014-05-03T11:00:00Z");
    EXPECT_EQ(events[1]["location"], "Room");
    EXPECT_EQ(events[1]["reminders"], Json({10}));
    EXPECT_EQ(events[1]["rrule"], "");
    EXPECT_EQ(events[1]["originalEvent"], events[0]["id"]);
    for (const char* instance : {"20140503T100000Z", "20140504T100000Z", "20140504T100000Z"})
        ASSERT_EQ(tool.run({"event", "delete", series, "--instance", instance}).status, 0);
    events = tool.json({"events", "list", "--json"});
    ASSERT_EQ(events.size(), 1U);
    EXPECT_EQ(events[0]["exdates"], Json({"2014-05-03T10:00:00Z", "2014-05-04T10:00:00Z"}));
    EXPECT_EQ(tool.run({"event", "set", series, "--instance", "20140504T100000Z", "summary=x"}).status, 1)
        << "cancelled";
    EXPECT_EQ(tool.run({"event", "set", series, "--instance", "20140505", "summary=x"}).status, 1)
        << "not all-day";
    EXPECT_EQ(tool.run({"event", "set", series, "--instance", "20140505T100000Z", "summary=x", "start=soon"})
                  .status,
              1);
    EXPECT_EQ(tool.json({"events", "list", "--json"}).size(), 1U)
        << "nothing is left of a change that failed";
    EXPECT_EQ(tool.run({"event", "delete", series, "--instance", "tomorrow"}).status, 2);
}
