#include <set>

#include "ProviderFixture.h"
#include "Seed.h"

namespace provider {
namespace {

using CalendarApi = ProviderFixture;

TEST_F(CalendarApi, TheListShowsRolesAndColours) {
    const Json items = get("/calendar/v3/users/me/calendarList?maxResults=100000000").body.at("items");
    ASSERT_EQ(items.size(), 2U);
    EXPECT_EQ(items[0].at("summary"), "Main");
    EXPECT_EQ(items[0].at("accessRole"), "owner");
    EXPECT_EQ(items[1].at("accessRole"), "reader");
    EXPECT_EQ(items[1].at("backgroundColor"), "#9fe1e7");
    EXPECT_EQ(get("/calendar/v3/users/me/calendarList?maxResults=1").body.count("nextPageToken"), 1U);
}

TEST_F(CalendarApi, PagesHoldEveryEventOnceWhateverHappensInBetween) {
    addBulkEvents(mServer.store().calendar("a@x.example"), 130);
    std::vector<std::string> ids;
    std::string token;
    int pages = 0;
    do {
        const Answer page = get(std::string(kEvents) + "?fields=items(id),nextPageToken&maxResults=50" +
                                (token.empty() ? "" : "&pageToken=" + token));
        ASSERT_EQ(page.status, 200);
        for (const Json& item : page.body.at("items")) ids.push_back(item.at("id"));
        token = page.body.value("nextPageToken", "");
        // Behind the reader and in front of it: neither moves the place where the list goes on.
        if (++pages == 1) {
            EXPECT_EQ(send("DELETE", event(ids[3])).status, 204);
            insert(Json::object());
        }
    } while (!token.empty());
    EXPECT_EQ(pages, 3);
    EXPECT_EQ(ids.size(), 131U);
    EXPECT_EQ(std::set<std::string>(ids.begin(), ids.end()).size(), ids.size());
}

TEST_F(CalendarApi, ALastPageThatIsFullHasNoToken) {
    addBulkEvents(mServer.store().calendar("a@x.example"), 4);
    const Answer page = get(std::string(kEvents) + "?maxResults=2");
    const std::string next = page.body.at("nextPageToken");
    EXPECT_EQ(get(std::string(kEvents) + "?maxResults=2&pageToken=" + next).body.count("nextPageToken"), 0U);
    // A token belongs to its list.
    EXPECT_EQ(get("/calendar/v3/calendars/read@x.example/events?pageToken=" + next).status, 400);
    // Only deleted events behind the page: nothing to go on with.
    const Json rest = get(std::string(kEvents) + "?pageToken=" + next).body.at("items");
    for (const Json& item : rest) EXPECT_EQ(send("DELETE", event(item)).status, 204);
    EXPECT_EQ(get(std::string(kEvents) + "?maxResults=2").body.count("nextPageToken"), 0U);
}

TEST_F(CalendarApi, EachWriteHasANewEtagAndReadsHaveNone) {
    std::set<std::string> etags;
    const Json made = insert({{"summary", "a"}});
    etags.insert(made.at("etag"));
    etags.insert(get(event(made)).body.at("etag"));
    EXPECT_EQ(etags.size(), 1U);
    for (const char* method : {"PATCH", "PUT", "PATCH"}) {
        const Answer answer = send(method, event(made), made.dump());
        ASSERT_EQ(answer.status, 200) << answer.text;
        EXPECT_TRUE(etags.insert(answer.body.at("etag")).second) << method;
        EXPECT_EQ(get(event(made) + "?fields=etag%2Cid").text,
                  Json({{"etag", answer.body.at("etag")}, {"id", made.at("id")}}).dump());
    }
}

TEST_F(CalendarApi, PatchMergesAndNullRemoves) {
    Json body = Json::parse(R"({"summary":"a","location":"here","reminders":{"useDefault":false,
        "overrides":[{"method":"popup","minutes":5}]},"attendees":[{"email":"x@y"}],"extra":{"a":1,"b":2}})");
    const Json made = insert(body);
    const Answer patched =
        send("PATCH", event(made), R"({"summary":"b","location":null,"attendees":[{"email":"z@y"}],
        "extra":{"a":null,"c":3},"id":"other","organizer":{"email":"mallory@x"},"etag":"mine"})");
    ASSERT_EQ(patched.status, 200) << patched.text;
    Json expected = made;
    expected["summary"] = "b";
    expected.erase("location");
    expected["attendees"] = Json::parse(R"([{"email":"z@y"}])");
    expected["extra"] = Json::parse(R"({"b":2,"c":3})");
    for (const char* name : {"etag", "updated"}) expected[name] = patched.body.at(name);
    EXPECT_EQ(patched.body, expected);
    EXPECT_EQ(get(event(made)).body, expected);
}

TEST_F(CalendarApi, PatchMovesBetweenAllDayAndTimed) {
    const Json made = insert(Json::object());
    const Answer allDay =
        send("PATCH", event(made), R"({"start":{"date":"2026-03-02"},"end":{"date":"2026-03-03"}})");
    EXPECT_EQ(allDay.body.value("start", Json()).dump(), R"({"date":"2026-03-02"})");
    EXPECT_EQ(allDay.body.at("sequence"), 1);
    const Answer timed = send("PATCH", event(made), R"({"start":{"dateTime":"2026-03-02T10:00:00Z"},
                                                        "end":{"dateTime":"2026-03-02T11:00:00Z"}})");
    EXPECT_EQ(timed.body.value("end", Json()).dump(), R"({"dateTime":"2026-03-02T11:00:00Z"})");
    // One time alone would mix the kinds.
    EXPECT_EQ(send("PATCH", event(made), R"({"end":{"date":"2026-03-03"}})").status, 400);
    EXPECT_EQ(get(event(made)).body.at("etag"), timed.body.at("etag"));
}

TEST_F(CalendarApi, PutReplacesWhatTheClientOwns) {
    const Json made = insert({{"summary", "a"}, {"location", "here"}});
    const Answer put =
        send("PUT", event(made), R"({"start":{"date":"2026-03-02"},"end":{"date":"2026-03-03"}})");
    EXPECT_EQ(put.body.count("summary") + put.body.count("location"), 0U);
    for (const char* name : {"id", "iCalUID", "created", "organizer"})
        EXPECT_EQ(put.body[name], made[name]) << name;
    EXPECT_EQ(send("PUT", event(made), R"({"summary":"no times"})").status, 400);
}

TEST_F(CalendarApi, ADeletedEventIsGoneButNotUnknown) {
    const Json made = insert(Json::object());
    EXPECT_EQ(send("DELETE", event(made)).status, 204);
    EXPECT_EQ(get(kEvents).body.at("items").size(), 0U);
    for (const char* method : {"GET", "DELETE"}) EXPECT_EQ(send(method, event(made)).status, 410) << method;
    EXPECT_EQ(send("PATCH", event(made), "{}").status, 410);
    EXPECT_EQ(get(event(made) + "?showDeleted=true").body.at("status"), "cancelled");
    EXPECT_EQ(get(std::string(kEvents) + "?showDeleted=true").body.at("items").size(), 1U);
    for (const char* method : {"GET", "DELETE"})
        EXPECT_EQ(send(method, event("never0")).status, 404) << method;
}

TEST_F(CalendarApi, IfMatchGuardsEveryWrite) {
    const Json made = insert(Json::object());
    const std::string etag = made.at("etag");
    const Answer moved = send("PATCH", event(made), R"({"summary":"b"})", {{"If-Match", etag}});
    ASSERT_EQ(moved.status, 200);
    EXPECT_EQ(send("PATCH", event(made), R"({"summary":"c"})", {{"If-Match", etag}}).status, 412);
    EXPECT_EQ(send("PUT", event(made), made.dump(), {{"If-Match", etag}}).status, 412);
    EXPECT_EQ(send("DELETE", event(made), "", {{"If-Match", etag}}).status, 412);
    EXPECT_EQ(get(event(made)).body.at("summary"), "b");
    EXPECT_EQ(send("DELETE", event(made), "", {{"If-Match", "*"}}).status, 204);
}

TEST_F(CalendarApi, SharedCalendarsShowTheSameEventsWithRightsOfTheirOwn) {
    const Json made = insert({{"summary", "shared"}});
    Account& second = mServer.store().addAccount("b@x.example", "B");
    EXPECT_EQ(get("/calendar/v3/calendars/b@x.example/events").status, 404);
    mServer.store().share(second, "a@x.example", "reader");
    mToken = token(second.refreshToken).body.at("access_token");
    EXPECT_EQ(get(event(made)).body, made);
    EXPECT_EQ(send("PATCH", event(made), "{}").status, 403);
    EXPECT_EQ(get("/calendar/v3/calendars/read@x.example/events").status, 404);
}

TEST(Sample, IsTheSameEachTimeAndSurvivesDumpAndLoad) {
    Store first;
    seedSample(first);
    Store second;
    seedSample(second);
    const Json dump = first.dump();
    EXPECT_TRUE(dump == second.dump());
    Store loaded;
    loaded.load(dump);
    EXPECT_TRUE(loaded.dump() == dump);
    std::size_t events = 0;
    for (const Json& calendar : dump.at("calendars")) events += calendar.at("events").size();
    EXPECT_GT(events, 300U);
    // What does not load leaves everything as it was.
    for (const char* bad : {R"([])", R"({"accounts":[{"email":"a@b","calendars":[{"id":"none"}]}]})",
                            R"({"calendars":[{"id":"c","events":[{"summary":"no times"}]}]})"}) {
        EXPECT_THROW(loaded.load(Json::parse(bad)), ApiError) << bad;
        EXPECT_TRUE(loaded.dump() == dump) << bad;
    }
}

}  // namespace
}  // namespace provider
