// The whole way: provider, daemon, IPC, tool; each on its own root and port.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>

#include <filesystem>

#include "e2e/Eventually.h"
#include "e2e/SyncPair.h"

namespace {

constexpr const char* kEventPages = "/events\\?maxResults=50";

Json timedEvent(const std::string& summary) {
    return {{"summary", summary},
            {"start", {{"dateTime", "2026-06-01T10:00:00+02:00"}, {"timeZone", "Europe/Berlin"}}},
            {"end", {{"dateTime", "2026-06-01T11:30:00+02:00"}, {"timeZone", "Europe/Berlin"}}}};
}

std::string addEvent(SyncPair& pair, const std::string& calendar, const Json& event) {
    return pair.provider.admin("POST", "/calendars/" + pathText(calendar) + "/events", event).at("id");
}

Json statusOf(SyncPair& pair, int account) {
    for (const Json& status : pair.device.json({"status", std::to_string(account)})) {
        if (status.at("kind") == "calendar") return status;
    }
    return nullptr;
}

}  // namespace

TEST(CalendarSync, AFirstSyncShowsWhatTheProviderHoldsAndTheSecondIsQuiet) {
    SyncPair pair;
    ASSERT_EQ(pair.device.sync(1).status, 0);
    pair.expectSame(1);
    pair.expectQuiet(1);
    EXPECT_FALSE(statusOf(pair, 1).at("lastSync").is_null());
    EXPECT_EQ(statusOf(pair, 1).at("state"), "ready");
}

TEST(CalendarSync, ChangesAndDeletionsOnTheProviderFollow) {
    SyncPair pair;
    const std::string calendar = pair.firstCalendar(1);
    const std::string path = "/calendars/" + pathText(calendar) + "/events";
    const std::string changed = addEvent(pair, calendar, timedEvent("before"));
    const std::string deleted = addEvent(pair, calendar, timedEvent("goes"));
    Json daily = timedEvent("daily");
    daily["recurrence"] = {"RRULE:FREQ=DAILY;COUNT=10"};
    const std::string series = addEvent(pair, calendar, daily);
    ASSERT_EQ(pair.device.sync(1).status, 0);
    const int localId = pair.localEvent(changed).at("id");

    pair.provider.admin("PATCH", path + "/" + changed, {{"summary", "it's \"after\" \n\xF0\x9F\x8E\x89"}});
    pair.provider.admin("DELETE", path + "/" + deleted);
    pair.provider.admin("PATCH", path + "/" + series + "_20260603T080000Z", {{"summary", "moved"}});
    pair.provider.admin("DELETE", path + "/" + series + "_20260604T080000Z");
    pair.provider.admin(
        "PATCH",
        "/accounts/" + pathText(pair.provider.accounts()[0].email) + "/calendars/" + pathText(calendar),
        {{"summary", "Renamed"}, {"backgroundColor", "#010203"}});
    ASSERT_EQ(pair.device.sync(1).status, 0);

    pair.expectSame(1);
    EXPECT_EQ(pair.localEvent(changed).at("id"), localId);
    pair.expectQuiet(1);

    pair.provider.admin("DELETE",
                        path + "/" + series + "_20260603T080000Z");  // first changed, then cancelled
    ASSERT_EQ(pair.device.sync(1).status, 0);
    pair.expectSame(1);
    pair.expectQuiet(1);
}

TEST(CalendarSync, ACalendarThatIsGoneOnTheProviderGoesAndOneDeletedOnTheDeviceComesBack) {
    SyncPair pair;
    ASSERT_EQ(pair.device.sync(1).status, 0);
    const std::vector<Json> calendars = pair.wireCalendars(1);
    pair.provider.admin("DELETE", "/accounts/" + pathText(pair.provider.accounts()[0].email) + "/calendars/" +
                                      pathText(calendars.back().at("id")));
    ASSERT_EQ(pair.device.sync(1).status, 0);
    pair.expectSame(1);
}

TEST(CalendarSync, TwoAccountsThatShareACalendarStayApart) {
    SyncPair pair(2);
    ASSERT_EQ(pair.device.sync(1).status, 0);
    ASSERT_EQ(pair.device.sync(2).status, 0);
    pair.expectSame(1);
    pair.expectSame(2);
    pair.expectQuiet(1);
    pair.expectQuiet(2);

    ASSERT_EQ(pair.device.tool({"account", "remove", "1"}).status, 0);

    const Json left = pair.device.json({"calendars", "list", "--account", "1"});
    for (const Json& book : left) EXPECT_EQ(book.at("kind"), "todo") << book.dump();
    pair.expectSame(2);
    pair.expectQuiet(2);
}

TEST(CalendarSync, AnExpiredTokenIsRenewedAndARevokedOneIsToldOnce) {
    SyncPair pair;
    ASSERT_EQ(pair.device.sync(1).status, 0);
    pair.provider.admin("POST", "/tokens/expire");
    EXPECT_EQ(pair.device.sync(1).status, 0);

    // A renewal changes nothing: where its connection breaks it is sent again.
    pair.provider.admin("POST", "/tokens/expire");
    pair.installFault({{"path", "oauth2/token"}, {"kind", "reset"}});
    EXPECT_EQ(pair.device.sync(1).status, 0);
    pair.expectFaultsUsed();

    // A token server in trouble says nothing about the authorisation.
    for (const int status : {429, 500, 503}) {
        pair.provider.admin("POST", "/tokens/expire");
        pair.installFault(
            {{"path", "oauth2/token"}, {"kind", "status"}, {"status", status}, {"count", 1000}});
        EXPECT_EQ(pair.device.sync(1).status, 1);
        EXPECT_EQ(statusOf(pair, 1).at("state"), "ready") << status;
        pair.provider.admin("DELETE", "/faults");
        EXPECT_EQ(pair.device.sync(1).status, 0);
    }

    const std::string email = pair.provider.accounts()[0].email;
    pair.provider.admin("POST", "/tokens/revoke", {{"email", email}});
    EXPECT_EQ(pair.device.sync(1).status, 1);
    EXPECT_EQ(statusOf(pair, 1).at("state"), "unavailable");
    EXPECT_EQ(pair.device.sync(1).status, 1);
    pair.expectSame(1);

    const std::string token =
        pair.provider.admin("POST", "/tokens/issue", {{"email", email}}).at("refreshToken");
    ASSERT_EQ(pair.device.tool({"account", "update", "1", "--refresh-token-file", "-"}, token).status, 0);
    EXPECT_EQ(statusOf(pair, 1).at("state"), "ready");
    EXPECT_EQ(pair.device.sync(1).status, 0);
    EXPECT_EQ(pair.device.daemonLog().find(token), std::string::npos) << "a token stands in the log";
}

// A server that misbehaves once: the run fails or goes on, the device keeps what it has, the next sync is complete.
TEST(CalendarSync, AFaultOfTheServerLosesNothing) {
    struct Fault {
        const char* name;
        Json fault;
        int status;
    };
    const std::vector<Fault> faults = {
        {"500 on a page", {{"kind", "status"}, {"status", 500}, {"path", kEventPages}}, 1},
        {"403 on the list", {{"kind", "status"}, {"status", 403}, {"path", "calendarList"}}, 1},
        // libcurl asks once more by itself when a kept connection is reset; a read may be asked twice.
        {"reset connections", {{"kind", "reset"}, {"count", 2}, {"path", kEventPages}}, 1},
        {"a body cut short", {{"kind", "cut"}, {"path", kEventPages}}, 1},
        {"gzip that is broken", {{"kind", "corrupt-gzip"}, {"path", kEventPages}}, 1},
        {"no JSON", {{"kind", "body"}, {"body", "<html>"}, {"path", kEventPages}}, 1},
        {"an error body with status 200",
         {{"kind", "body"}, {"body", R"({"error":{"code":503,"message":"later"}})"}, {"path", kEventPages}},
         1},
        {"no items", {{"kind", "body"}, {"body", "{}"}, {"path", kEventPages}}, 1},
    };
    SyncPair pair;
    ASSERT_EQ(pair.device.sync(1).status, 0);
    for (const Fault& fault : faults) {
        SCOPED_TRACE(fault.name);
        Json request = fault.fault;
        request["method"] = "GET";
        if (!request.contains("count")) request["count"] = 1;
        pair.installFault(request);
        const CommandResult result = pair.device.sync(1);
        EXPECT_EQ(result.status, fault.status) << result.error;
        pair.expectFaultsUsed();
        pair.expectSame(1);
        EXPECT_EQ(pair.device.sync(1).status, 0);
        pair.expectSame(1);
    }
}

TEST(CalendarSync, AKilledDaemonLeavesNothingTwice) {
    SyncPair pair;
    // The third page of events is held, so that the kill falls between pages.
    pair.provider.admin("POST", "/hold", {{"method", "GET"}, {"path", "pageToken"}});
    ASSERT_EQ(pair.device.tool({"sync", "1", "calendar"}).status, 0);
    pair.provider.admin("GET", "/hold?atLeast=1&timeoutMs=20000");
    ASSERT_FALSE(pair.device.json({"events", "list"}).empty()) << "the first page is there";
    ::kill(pair.device.daemonPid(), SIGKILL);
    pair.provider.admin("POST", "/release");

    EXPECT_EQ(pair.device.tool({"sync", "1", "--wait"}).status, 1) << "the daemon is gone";
    ASSERT_EQ(pair.device.tool({"daemon", "start"}).status, 0);
    ASSERT_EQ(pair.device.sync(1).status, 0);
    pair.expectSame(1);
    pair.expectQuiet(1);
}

TEST(CalendarSync, AnEditDuringTheDownloadSurvives) {
    SyncPair pair;
    const std::string calendar = pair.firstCalendar(1);
    const std::string uid = addEvent(pair, calendar, timedEvent("theirs"));
    ASSERT_EQ(pair.device.sync(1).status, 0);
    const std::string id = std::to_string(pair.localEvent(uid).at("id").get<int>());
    pair.provider.admin("PATCH", "/calendars/" + pathText(calendar) + "/events/" + uid,
                        {{"summary", "theirs again"}});
    pair.provider.admin("POST", "/hold", {{"method", "GET"}, {"path", kEventPages}});
    ASSERT_EQ(pair.device.tool({"sync", "1", "calendar"}).status, 0);
    pair.provider.admin("GET", "/hold?atLeast=1&timeoutMs=20000");

    ASSERT_EQ(pair.device.tool({"event", "set", id, "summary=mine"}).status, 0);
    pair.provider.admin("POST", "/release");

    ASSERT_TRUE(eventually([&] { return statusOf(pair, 1).at("state") == "ready"; }));
    EXPECT_EQ(pair.localEvent(uid).at("summary"), "mine");
    ASSERT_EQ(pair.device.sync(1).status, 0);
    pair.expectSame(1);
    EXPECT_EQ(pair.localEvent(uid).at("summary"), "mine");
}

TEST(CalendarSync, StopEndsARunAndRemovalDuringOneSucceeds) {
    SyncPair pair;
    pair.provider.admin("POST", "/hold", {{"method", "GET"}, {"path", "pageToken"}});
    ASSERT_EQ(pair.device.tool({"sync", "1"}).status, 0);
    pair.provider.admin("GET", "/hold?atLeast=1&timeoutMs=20000");
    EXPECT_EQ(statusOf(pair, 1).at("state"), "in progress");
    EXPECT_EQ(pair.device.tool({"stop", "1"}).status, 0);
    EXPECT_TRUE(eventually([&] { return statusOf(pair, 1).at("state") == "ready"; }));

    ASSERT_EQ(pair.device.tool({"sync", "1"}).status, 0);
    EXPECT_EQ(pair.device.tool({"account", "remove", "1"}).status, 0);
    pair.provider.admin("POST", "/release");
    EXPECT_TRUE(pair.device.json({"account", "list"}).empty());
    EXPECT_TRUE(pair.device.json({"events", "list"}).empty());
}

TEST(CalendarSync, WaitingForTwoSyncsWithinOneSecondSeesBoth) {
    SyncPair pair;
    const std::string calendar = pair.firstCalendar(1);
    ASSERT_EQ(pair.device.sync(1).status, 0);
    const std::string first = addEvent(pair, calendar, timedEvent("first"));
    ASSERT_EQ(pair.device.sync(1).status, 0);
    EXPECT_FALSE(pair.localEvent(first).is_null());
    const std::string second = addEvent(pair, calendar, timedEvent("second"));
    ASSERT_EQ(pair.device.sync(1).status, 0);
    EXPECT_FALSE(pair.localEvent(second).is_null());
}

TEST(CalendarSync, ASyncWhoseNumberCannotBeWrittenIsWaitedForAllTheSame) {
    SyncPair pair;
    ASSERT_EQ(pair.device.sync(1).status, 0);
    const std::string key =
        pair.device.root().at("/opt/usr/data/settings/memory/vantor-pim-sync/1/calendar/run");
    std::filesystem::remove(key);
    std::filesystem::create_directory(key);  // nothing can be renamed over it
    const std::string added = addEvent(pair, pair.firstCalendar(1), timedEvent("new"));
    pair.installFault({{"method", "GET"}, {"path", "calendarList"}, {"kind", "delay"}, {"delayMs", 700}});

    EXPECT_EQ(pair.device.sync(1).status, 0);

    EXPECT_FALSE(pair.localEvent(added).is_null());
}

TEST(CalendarSync, OverHttpsWithAnUnknownCertificateVerifiesOnlyWhenAsked) {
    SyncPair pair(1, {"--seed", "20", "--tls"});
    for (const auto& [asked, status] :
         {std::pair{"", 0}, std::pair{"1", 1}, std::pair{"0", 0}, std::pair{"true", 1}}) {
        const std::string key = "db/vantor-pim-sync/verify_peer";
        if (*asked != '\0') {
            EXPECT_EQ(pair.device.tool({"setting", "set", key, asked}).status, 0);
        }
        EXPECT_EQ(pair.device.sync(1).status, status) << asked;
    }
    pair.expectSame(1);
}
