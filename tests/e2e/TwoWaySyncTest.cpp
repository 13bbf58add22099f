// Both directions: what is edited on the device reaches the provider, whatever the provider answers, and nothing comes twice.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>

#include <functional>

#include "e2e/Eventually.h"
#include "e2e/SyncPair.h"

namespace {

constexpr const char* kMeeting =
    R"({"summary": "Meeting", "start": "2026-06-01T10:00:00Z", "end": "2026-06-01T11:00:00Z"})";
constexpr const char* kDaily =
    R"({"summary": "Daily", "start": "2026-06-01T08:00:00Z", "end": "2026-06-01T08:30:00Z", "rrule": "FREQ=DAILY;COUNT=9"})";

// One calendar and one task list of one account, in sync, and nobody else's items in them.
class TwoWay : public testing::Test {
protected:
    TwoWay() : mPair(1, {"--seed", "sample"}) {
        EXPECT_EQ(mPair.device.sync(1).status, 0);
        mCalendar = mPair.firstCalendar(1);
        mBook = mPair.localCalendar(1, mPair.wireCalendars(1).at(0).at("summary"));
        mList = mPair.wireTaskLists(1).at(0).at("id");
        mTodoBook = mPair.localCalendar(1, mPair.wireTaskLists(1).at(0).at("title"));
    }

    int add(const char* noun, int book, const std::string& json) {
        const CommandResult added =
            mPair.device.tool({noun, "add", "--calendar", std::to_string(book), "-"}, json);
        EXPECT_EQ(added.status, 0) << added.error;
        return std::atoi(added.output.c_str());
    }
    void run(std::vector<std::string> arguments) {
        const CommandResult result = mPair.device.tool(std::move(arguments));
        EXPECT_EQ(result.status, 0) << result.error;
    }
    std::vector<Json> eventsNamed(const std::string& summary) {
        std::vector<Json> found = mPair.wireEvents(mCalendar);
        std::erase_if(found, [&](const Json& event) { return event.value("summary", "") != summary; });
        return found;
    }
    std::vector<Json> tasksNamed(const std::string& title) {
        std::vector<Json> found = mPair.wireTasks(1, mList);
        std::erase_if(found, [&](const Json& task) { return task.value("title", "") != title; });
        return found;
    }
    // Nobody asks for a sync: the daemon notices the edit.
    void expectSoon(const std::string& what, const std::function<bool()>& holds) {
        EXPECT_TRUE(eventually(holds)) << what << "\n" << mPair.device.daemonLog();
    }
    void expectSameAndQuiet() {
        ASSERT_EQ(mPair.device.sync(1).status, 0) << mPair.device.daemonLog();
        mPair.expectSame(1);
        mPair.expectQuiet(1);
    }
    Json pending() { return mPair.device.json({"status", "1"}).at(0).at("pending"); }

    SyncPair mPair;
    std::string mCalendar;
    std::string mList;
    int mBook = 0;
    int mTodoBook = 0;
};

}  // namespace

TEST_F(TwoWay, EditsOnTheDeviceArriveWithoutAnybodyAsking) {
    const std::string event = std::to_string(add("event", mBook, kMeeting));
    expectSoon("a new event", [&] { return eventsNamed("Meeting").size() == 1; });
    run({"event", "set", event, "summary=Moved", "location=Room 2", "visibility=private", "busy=false"});
    expectSoon("a changed event", [&] {
        const auto found = eventsNamed("Moved");
        return found.size() == 1 && found[0].value("location", "") == "Room 2" &&
               found[0]["visibility"] == "private";
    });
    run({"event", "delete", event});
    expectSoon("a deleted event", [&] { return eventsNamed("Moved").empty(); });

    const std::string todo = std::to_string(add(
        "todo", mTodoBook, R"({"summary": "Post", "note": "two\nlines", "due": "2026-06-02T00:00:00Z"})"));
    expectSoon("a new task", [&] { return tasksNamed("Post").size() == 1; });
    run({"todo", "set", todo, "status=completed"});
    expectSoon("a completed task", [&] { return tasksNamed("Post").at(0)["status"] == "completed"; });
    run({"todo", "set", todo, "due="});
    expectSoon("a due time taken away", [&] { return !tasksNamed("Post").at(0).contains("due"); });
    run({"todo", "delete", todo});
    expectSoon("a deleted task", [&] { return tasksNamed("Post").empty(); });
    expectSameAndQuiet();
}

TEST_F(TwoWay, InstancesGoToTheirOwnIdAndLeaveTheSeriesAlone) {
    const std::string series = std::to_string(add("event", mBook, kDaily));
    expectSoon("the series", [&] { return eventsNamed("Daily").size() == 1; });
    const std::string uri = eventsNamed("Daily").at(0)["id"];
    mPair.provider.admin("PATCH", "/calendars/" + pathText(mCalendar) + "/events/" + uri,
                         {{"location", "theirs"}});

    run({"event", "set", series, "--instance", "20260603T080000Z", "summary=Late",
         "start=2026-06-03T09:00:00Z", "end=2026-06-03T09:30:00Z"});
    expectSoon("a changed instance", [&] { return eventsNamed("Late").size() == 1; });
    EXPECT_EQ(eventsNamed("Late").at(0)["id"], uri + "_20260603T080000Z");
    EXPECT_EQ(eventsNamed("Late").at(0)["recurringEventId"], uri);
    EXPECT_EQ(eventsNamed("Daily").at(0)["location"], "theirs") << "the device's older series was not sent";
    run({"event", "delete", series, "--instance", "20260604T080000Z"});
    const auto isCancelled = [&](const std::string& instance) {
        for (const Json& item : mPair.wireEvents(mCalendar)) {
            if (item["id"] == uri + "_" + instance) return item["status"] == "cancelled";
        }
        return false;
    };
    expectSoon("a cancelled instance", [&] { return isCancelled("20260604T080000Z"); });
    expectSameAndQuiet();
    // First changed, then cancelled: only the latter.
    const Json events = mPair.device.json({"events", "list", "--calendar", std::to_string(mBook)});
    for (const Json& event : events) {
        if (event["summary"] == "Late") run({"event", "delete", std::to_string(event["id"].get<int>())});
    }
    expectSoon("a changed and cancelled instance", [&] { return isCancelled("20260603T080000Z"); });
    expectSameAndQuiet();
    run({"event", "delete", series});
    expectSoon("the series goes with all of it", [&] { return eventsNamed("Daily").empty(); });
    expectSameAndQuiet();
}

TEST_F(TwoWay, AnAnswerThatSpoilsAnUploadLosesNothingAndDoublesNothing) {
    struct Row {
        const char* name;
        Json fault;
    };
    const std::string post = "events$";
    const std::string one = "events/";
    const Row rows[] = {
        {"refused", {{"method", "POST"}, {"path", post}, {"kind", "status"}, {"status", 400}}},
        {"forbidden", {{"method", "PATCH"}, {"path", one}, {"kind", "status"}, {"status", 403}}},
        {"too many", {{"method", "POST"}, {"path", post}, {"kind", "status"}, {"status", 429}}},
        {"conflict", {{"method", "PATCH"}, {"path", one}, {"kind", "status"}, {"status", 412}}},
        {"new, reply lost", {{"method", "POST"}, {"path", post}, {"kind", "reset"}, {"afterHandling", true}}},
        {"new, reply cut", {{"method", "POST"}, {"path", post}, {"kind", "cut"}}},
        {"new, done but 500",
         {{"method", "POST"}, {"path", post}, {"kind", "status"}, {"status", 500}, {"afterHandling", true}}},
        {"new, empty reply",
         {{"method", "POST"}, {"path", post}, {"kind", "body"}, {"body", ""}, {"afterHandling", true}}},
        {"changed, reply lost",
         {{"method", "PATCH"}, {"path", one}, {"kind", "reset"}, {"afterHandling", true}}},
        {"query unavailable",
         {{"method", "GET"}, {"path", "fields=etag%2Cid$"}, {"kind", "status"}, {"status", 503}}},
        {"query for another",
         {{"method", "GET"},
          {"path", "fields=etag%2Cid$"},
          {"kind", "body"},
          {"body", R"({"id":"x","etag":"y"})"}}},
        {"deletion unavailable", {{"method", "DELETE"}, {"path", one}, {"kind", "status"}, {"status", 503}}},
        {"deletion, reply lost",
         {{"method", "DELETE"}, {"path", one}, {"kind", "reset"}, {"afterHandling", true}}},
        {"task refused", {{"method", "POST"}, {"path", "tasks$"}, {"kind", "status"}, {"status", 400}}},
        {"task, reply lost",
         {{"method", "POST"}, {"path", "tasks$"}, {"kind", "reset"}, {"afterHandling", true}}},
        {"error body with 200",
         {{"method", "PATCH"}, {"path", one}, {"kind", "body"}, {"body", R"({"error":{"code":500}})"}}},
    };
    const std::string edited = std::to_string(add("event", mBook, kMeeting));
    std::string deleted = std::to_string(add("event", mBook, kMeeting));
    ASSERT_EQ(mPair.device.sync(1).status, 0);
    int round = 0;
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        run({"daemon", "stop"});
        const std::string name = "round " + std::to_string(++round);
        run({"event", "set", edited, "summary=" + name + " edited"});
        run({"event", "delete", deleted});
        const std::string fresh =
            R"({"summary": ")" + name + R"(", "start": "2026-07-01", "end": "2026-07-02"})";
        deleted = std::to_string(add("event", mBook, fresh));
        add("event", mBook, fresh);  // two that say the same are two
        add("todo", mTodoBook, R"({"summary": ")" + name + R"("})");
        mPair.installFault(row.fault);
        run({"daemon", "start"});
        // What waits is sent when the daemon starts, and again with each sync.
        EXPECT_TRUE(eventually([&] { return mPair.provider.admin("GET", "/faults")["faults"].empty(); }));
        EXPECT_TRUE(eventually([&] { return mPair.device.sync(1).status == 0; })) << mPair.device.daemonLog();
        mPair.expectSame(1);
        EXPECT_EQ(eventsNamed(name).size(), 2U);
        EXPECT_EQ(eventsNamed(name + " edited").size(), 1U);
        EXPECT_EQ(tasksNamed(name).size(), 1U);
        EXPECT_EQ(pending(), Json({{"dirty", 0}, {"deleted", 0}}));
    }
    mPair.expectQuiet(1);
}

TEST_F(TwoWay, WhatIsGoneOnTheServerGoesOnTheDevice) {
    const std::string event = std::to_string(add("event", mBook, kMeeting));
    expectSoon("the event", [&] { return eventsNamed("Meeting").size() == 1; });
    run({"daemon", "stop"});
    run({"event", "set", event, "summary=Mine"});
    const std::string path = "/calendars/" + pathText(mCalendar) + "/events/";
    mPair.provider.admin("DELETE", path + eventsNamed("Meeting").at(0)["id"].get<std::string>());
    run({"daemon", "start"});
    EXPECT_TRUE(eventually([&] {
        return mPair.device.sync(1).status == 0 && mPair.device.tool({"event", "show", event}).status == 1;
    }));
    expectSameAndQuiet();
}

TEST_F(TwoWay, AnInstanceEditedWhileItsSeriesGoesUpIsSentToo) {
    const std::string series = std::to_string(add("event", mBook, kDaily));
    expectSoon("the series", [&] { return eventsNamed("Daily").size() == 1; });
    // Held once before the series is read for its etag, once after.
    for (const char* method : {"GET", "PATCH"}) {
        mPair.provider.admin("POST", "/hold", {{"method", method}, {"path", "events/"}});
        run({"event", "set", series, "location=" + std::string(method)});
        mPair.provider.admin("GET", "/hold?atLeast=1&timeoutMs=10000");
        const std::string day = method[0] == 'G' ? "20260603" : "20260604";
        run({"event", "set", series, "--instance", day + "T080000Z", "summary=" + std::string(method)});
        mPair.provider.admin("POST", "/release");
        expectSoon("the instance", [&] { return eventsNamed(method).size() == 1; });
    }
    expectSameAndQuiet();
}

TEST_F(TwoWay, ASeriesEditedBeforeItsInstanceGoesUpIsSentToo) {
    const std::string first = std::to_string(add("event", mBook, kMeeting));
    const std::string series = std::to_string(add("event", mBook, kDaily));
    expectSameAndQuiet();
    // Both are marked; the series is edited while the first goes up.
    run({"daemon", "stop"});
    run({"event", "set", first, "location=Hall"});
    run({"event", "set", series, "--instance", "20260603T080000Z", "summary=Moved"});
    mPair.provider.admin("POST", "/hold", {{"method", "GET"}, {"path", "fields=etag%2Cid$"}});
    run({"daemon", "start"});
    mPair.provider.admin("GET", "/hold?atLeast=1&timeoutMs=10000");
    run({"event", "set", series, "location=Garden"});
    mPair.provider.admin("POST", "/release");
    expectSoon("the series", [&] {
        const std::vector<Json> found = eventsNamed("Daily");
        return eventsNamed("Moved").size() == 1 && found.size() == 1 &&
               found[0].value("location", "") == "Garden";
    });
    expectSameAndQuiet();
}

TEST_F(TwoWay, AKilledDaemonSendsNothingTwice) {
    mPair.provider.admin("POST", "/faults",
                         {{"method", "POST"},
                          {"path", "events$"},
                          {"kind", "delay"},
                          {"delayMs", 3000},
                          {"afterHandling", true},
                          {"count", 3}});
    add("event", mBook, kMeeting);
    expectSoon("the event", [&] { return eventsNamed("Meeting").size() == 1; });
    ASSERT_EQ(kill(mPair.device.daemonPid(), SIGKILL), 0);
    mPair.provider.admin("DELETE", "/faults");
    run({"daemon", "start"});
    expectSoon("the late answer", [&] { return mPair.isNoted("POST /calendar"); });
    expectSameAndQuiet();
    EXPECT_EQ(eventsNamed("Meeting").size(), 1U);
}

TEST_F(TwoWay, ASeriesWhoseAnswerWasLostStillSendsItsCancelledDays) {
    run({"daemon", "stop"});
    const std::string series = std::to_string(add("event", mBook, kDaily));
    run({"event", "delete", series, "--instance", "20260604T080000Z"});
    run({"event", "set", series, "--instance", "20260605T080000Z", "summary=Late"});
    mPair.installFault({{"method", "POST"}, {"path", "events$"}, {"kind", "reset"}, {"afterHandling", true}});
    run({"daemon", "start"});
    EXPECT_TRUE(eventually([&] { return mPair.provider.admin("GET", "/faults")["faults"].empty(); }));
    EXPECT_TRUE(eventually([&] { return mPair.device.sync(1).status == 0; })) << mPair.device.daemonLog();
    expectSameAndQuiet();
    EXPECT_EQ(eventsNamed("Daily").size(), 1U);
    EXPECT_EQ(eventsNamed("Late").size(), 1U);
}

TEST_F(TwoWay, AnInstanceEditedWhileItsSeriesWaitsForItsUploadIsSentToo) {
    const std::string before = std::to_string(add("event", mBook, kMeeting));
    const std::string series = std::to_string(add("event", mBook, kDaily));
    expectSoon("the series", [&] { return eventsNamed("Daily").size() == 1; });
    expectSameAndQuiet();
    mPair.provider.admin("POST", "/hold", {{"method", "PATCH"}, {"path", "events/"}});
    run({"daemon", "stop"});
    run({"event", "set", before, "location=Room 2"});
    run({"event", "set", series, "location=Room 2"});
    run({"daemon", "start"});
    mPair.provider.admin("GET", "/hold?atLeast=1&timeoutMs=5000");
    // The changes have been looked for, the series has not been read yet.
    run({"event", "set", series, "--instance", "20260605T080000Z", "summary=Late"});
    mPair.provider.admin("POST", "/release");
    expectSoon("the instance", [&] { return eventsNamed("Late").size() == 1; });
    expectSameAndQuiet();
}

TEST_F(TwoWay, AnEditThatGoesOverAnUnseenOneIsNamedInTheLog) {
    const std::string series = std::to_string(add("event", mBook, kDaily));
    run({"event", "set", series, "--instance", "20260605T080000Z", "summary=Late"});
    expectSoon("the instance", [&] { return eventsNamed("Late").size() == 1; });
    expectSameAndQuiet();
    EXPECT_THAT(mPair.device.daemonLog(), testing::Not(testing::HasSubstr("both sides")));
    run({"daemon", "stop"});
    // An event of each: a series, an exception that both know, and a day that each side changes on its own.
    const std::string path = "/calendars/" + pathText(mCalendar) + "/events/";
    const std::string uri = eventsNamed("Daily").at(0)["id"];
    for (const char* instance : {"", "_20260605T080000Z", "_20260606T080000Z"})
        mPair.provider.admin("PATCH", path + uri + instance, {{"location", "the server's"}});
    run({"event", "set", series, "location=the device's"});
    for (const char* instance : {"20260605T080000Z", "20260606T080000Z"})
        run({"event", "set", series, "--instance", instance, "location=the device's"});
    run({"event", "set", series, "--instance", "20260606T080000Z", "summary=New"});
    run({"daemon", "start"});
    expectSameAndQuiet();
    for (const char* summary : {"Daily", "Late", "New"}) {
        const Json event = eventsNamed(summary).at(0);
        EXPECT_EQ(event["location"], "the device's");
        EXPECT_THAT(mPair.device.daemonLog(), testing::HasSubstr("event(" + event["id"].get<std::string>() +
                                                                 ") was changed on both sides"));
    }
}

TEST_F(TwoWay, AnEditDuringARevokedAuthorisationGoesUpAfterIt) {
    const std::string email = mPair.provider.accounts().at(0).email;
    mPair.provider.admin("POST", "/tokens/revoke", {{"email", email}});
    add("event", mBook, kMeeting);
    EXPECT_EQ(mPair.device.sync(1).status, 1);
    const std::string token =
        mPair.provider.admin("POST", "/tokens/issue", {{"email", email}})["refreshToken"];
    EXPECT_EQ(mPair.device.tool({"account", "update", "1", "--refresh-token-file", "-"}, token).status, 0);
    expectSoon("the event", [&] { return eventsNamed("Meeting").size() == 1; });
    expectSameAndQuiet();
}

TEST_F(TwoWay, AReadOnlyCalendarTakesNothing) {
    const std::vector<Json> calendars = mPair.wireCalendars(1);
    for (const Json& calendar : calendars) {
        if (calendar["accessRole"] != "reader") continue;
        const int book = mPair.localCalendar(1, calendar["summary"]);
        EXPECT_EQ(
            mPair.device.tool({"event", "add", "--calendar", std::to_string(book), "-"}, kMeeting).status, 1);
    }
    // It became read-only while a change waited.
    run({"daemon", "stop"});
    const std::string event = std::to_string(add("event", mBook, kMeeting));
    const std::string email = mPair.provider.accounts().at(0).email;
    mPair.provider.admin("PATCH", "/accounts/" + pathText(email) + "/calendars/" + pathText(mCalendar),
                         {{"accessRole", "reader"}});
    run({"daemon", "start"});
    EXPECT_TRUE(eventually([&] { return mPair.device.sync(1).status == 0; })) << mPair.device.daemonLog();
    EXPECT_EQ(pending(), Json({{"dirty", 0}, {"deleted", 0}}));
    EXPECT_EQ(mPair.device.tool({"event", "show", event}).status, 0) << "the user's own event stays";
    EXPECT_TRUE(eventsNamed("Meeting").empty());
}
