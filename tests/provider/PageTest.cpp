// The page and what it stands on: the guard against other origins, parts of long lists, news, edits that clash.
#include "ProviderFixture.h"

namespace provider {
namespace {

constexpr const char* kControl = "/admin/calendars/a@x.example/events";
constexpr const char* kBook = "/admin/accounts/a@x.example/contacts";

using Page = ProviderFixture;

TEST_F(Page, IsServedWithNothingFromElsewhere) {
    const Answer page = get("/");
    EXPECT_EQ(page.status, 200);
    EXPECT_EQ(page.headers.find("Content-Type")->second, "text/html; charset=utf-8");
    EXPECT_TRUE(page.headers.find("Content-Security-Policy")
                    ->second.starts_with("default-src 'none'; script-src 'self'"));
    EXPECT_EQ(page.text.find("://"), std::string::npos);
    EXPECT_EQ(page.text.find("style="), std::string::npos);
    // Every file that the page names is there, as what it is.
    std::size_t files = 0;
    for (std::size_t at = page.text.find("/page/"); at != std::string::npos;
         at = page.text.find("/page/", at + 1)) {
        const std::string path = page.text.substr(at, page.text.find('"', at) - at);
        const Answer file = get(path);
        EXPECT_EQ(file.status, 200) << path;
        EXPECT_EQ(file.headers.find("X-Content-Type-Options")->second, "nosniff") << path;
        ++files;
    }
    EXPECT_GE(files, 3U);
    EXPECT_EQ(get("/page/none.js").status, 404);
    EXPECT_EQ(get("/page/..%2Fmain.cpp").status, 404);
    EXPECT_EQ(send("GET", "/admin/requests").body.at("total"), 1);  // the fixture's token
}

TEST_F(Page, OnlyItsOwnOriginAndProgramsAreLetIn) {
    const std::string own = mServer.url();
    const std::string port = own.substr(own.rfind(':'));
    struct Row {
        const char* method;
        httplib::Headers headers;
        const char* path;
        int status;
    };
    const std::string created = R"({"email":"b@x.example"})";
    const Row rows[] = {
        {"GET", {{"Origin", own}, {"Sec-Fetch-Site", "same-origin"}}, "/admin/accounts", 200},
        {"GET", {{"Sec-Fetch-Site", "none"}}, "/admin/accounts", 200},
        {"GET",
         {{"Host", "localhost" + port}, {"Origin", "http://localhost" + port}},
         "/admin/accounts",
         200},
        {"GET", {{"Host", "[::1]" + port}}, "/admin/accounts", 200},
        {"GET", {{"Sec-Fetch-Site", "cross-site"}}, "/admin/accounts", 403},
        {"GET", {{"Sec-Fetch-Site", "same-site"}}, "/admin/accounts", 403},
        {"GET", {{"Sec-Fetch-Site", "cross-site"}}, "/", 200},  // a link to the page
        {"POST", {{"Origin", "http://evil.example"}}, "/admin/accounts", 403},
        {"POST", {{"Origin", "null"}}, "/admin/accounts", 403},
        {"POST", {{"Origin", "http://127.0.0.1:1"}}, "/admin/accounts", 403},
        {"POST", {{"Origin", "https://127.0.0.1" + port}}, "/admin/accounts", 403},
        {"DELETE", {{"Origin", "http://evil.example"}}, "/admin/accounts/a@x.example", 403},
        {"GET", {{"Host", "evil.example" + port}}, "/", 421},
        {"GET", {{"Host", "127.0.0.1.evil.example"}}, kEvents, 421},
        {"POST", {{"Host", "evil.example"}, {"Origin", "http://evil.example"}}, "/admin/accounts", 421},
        {"OPTIONS", {{"Origin", "http://evil.example"}}, "/admin/accounts", 403},
    };
    for (const Row& row : rows) {
        const Answer answer = send(row.method, row.path, *row.method == 'P' ? created : "", row.headers);
        EXPECT_EQ(answer.status, row.status) << row.method << " " << row.path << " " << answer.text;
        EXPECT_EQ(answer.headers.count("Access-Control-Allow-Origin"), 0U);
    }
    EXPECT_EQ(get("/admin/accounts").body.at("accounts").size(), 1U);
}

TEST_F(Page, PicturesThatHoldScriptsRunNothing) {
    send("POST", kBook, R"({"id":"c1","gd$name":{"gd$givenName":{"$t":"A"}}})");
    const std::string photo = std::string(kBook) + "/c1/photo";
    EXPECT_EQ(send("PUT", photo, "<svg/>", {{"Content-Type", "image/svg+xml"}}).status, 200);
    EXPECT_NE(get(photo).headers.find("Content-Security-Policy")->second.find("sandbox"), std::string::npos);
}

TEST_F(Page, ALongListIsShownInParts) {
    const auto event = [&](const char* id, const char* title, const char* date, const char* more = "") {
        const std::string body = std::string(R"({"id":")") + id + R"(","summary":")" + title +
                                 R"(","start":{"date":")" + date + R"("},"end":{"date":"2030-01-01"})" +
                                 more + "}";
        EXPECT_EQ(send("POST", kControl, body).status, 200);
    };
    event("late0", "Überprüfung", "2026-05-01");
    event("early", "Straße nach Lisbon", "2026-01-01");
    event("weekly", "Gym", "2026-03-01", R"(,"recurrence":["RRULE:FREQ=WEEKLY"])");
    send("DELETE", std::string(kControl) + "/weekly_20260308");
    send("POST", std::string(kControl) + "?raw=true&id=odd", R"({"id":"odd","start":7})");
    send("POST", "/admin/accounts/a@x.example/tasklists", R"({"id":"L"})");
    const std::string tasks = "/admin/accounts/a@x.example/tasklists/L/tasks";
    send("POST", tasks, R"({"id":"none","title":"B"})");
    send("POST", tasks, R"({"id":"due","title":"A","notes":"Straße","due":"2026-03-02T00:00:00Z"})");
    send("POST", kBook, R"({"id":"zoe","gd$name":{"gd$givenName":{"$t":"Zoë"}}})");
    send(
        "POST", kBook,
        R"({"id":"ann","gd$name":{"gd$givenName":{"$t":"Ann"}},"gd$phoneNumber":[{"label":"x","$t":"42"}]})");
    struct Row {
        std::string query;
        int matching;
        const char* ids;
    };
    const std::string events = std::string(kControl) + "?limit=";
    const std::string contacts = std::string(kBook) + "?limit=";
    const Row rows[] = {
        {events + "2", 5, "weekly_20260308 weekly"},
        {events + "9", 5, "weekly_20260308 weekly early late0 odd"},
        {events + "9&order=place", 5, "odd early weekly weekly_20260308 late0"},
        {events + "2&offset=3&order=place", 5, "weekly_20260308 late0"},
        {events + "2&offset=9", 5, ""},
        {events + "9&q=%C3%BCBERPR%C3%9CFUNG", 1, "late0"},
        {events + "9&q=lisbon%20STRASSE", 1, "early"},
        {events + "9&q=gym", 2, "weekly_20260308 weekly"},  // a cancelled day is found by its series
        {events + "9&q=summary", 0, ""},
        {tasks + "?limit=9&order=place", 2, "due none"},
        {tasks + "?limit=9&q=stra%C3%9Fe", 1, "due"},
        {contacts + "9&order=place", 2, "ann zoe"},
        {contacts + "9&q=42", 1, "ann"},
    };
    for (const Row& row : rows) {
        const Answer answer = get(row.query);
        std::string ids;
        for (const Json& item : answer.body.value("items", Json::array()))
            ids += (ids.empty() ? "" : " ") + item.value("id", "");
        EXPECT_EQ(ids, row.ids) << row.query;
        EXPECT_EQ(answer.body.value("matching", -1), row.matching) << row.query;
    }
    EXPECT_EQ(get(events + "1").body.at("series").dump(), R"({"weekly":"Gym"})");
    EXPECT_EQ(get(kControl).body.dump().find("total"), std::string::npos);
    for (const char* bad : {"0", "x", "1&order=name", "1&offset=-1"})
        EXPECT_EQ(get(events + bad).status, 400) << bad;
}

TEST_F(Page, AnEditOfWhatOthersChangedIsRefused) {
    send("POST", kControl, R"({"id":"e1","start":{"date":"2026-01-01"},"end":{"date":"2026-01-02"}})");
    send("POST", "/admin/accounts/a@x.example/tasklists", R"({"id":"L"})");
    const std::string tasks = "/admin/accounts/a@x.example/tasklists/L/tasks";
    send("POST", tasks, R"({"id":"e1","title":"T"})");
    send("POST", kBook, R"({"id":"e1","gd$name":{"gd$givenName":{"$t":"A"}}})");
    for (const std::string& list : {std::string(kControl), tasks, std::string(kBook)}) {
        const std::string path = list + "/e1";
        const std::string etag = get(path).body.at("etag");
        EXPECT_EQ(send("PATCH", path, "{}", {{"If-Match", etag}}).status, 200) << list;
        EXPECT_EQ(send("PATCH", path, "{}", {{"If-Match", etag}}).status, 412) << list;
        EXPECT_EQ(send("DELETE", path, "", {{"If-Match", etag}}).status, 412) << list;
        EXPECT_EQ(
            send("DELETE", path, "", {{"If-Match", get(path).body.at("etag").get<std::string>()}}).status,
            200)
            << list;
    }
}

TEST_F(Page, NewsTellOfRequestsAndChanges) {
    const Json first = get("/admin/news").body;
    get(kEvents);
    get(std::string(kEvents) + "?access_token=hush");
    const Json second = get("/admin/news?since=" + first.at("last").dump()).body;
    EXPECT_EQ(second.at("changes"), first.at("changes"));  // reading and getting a token change nothing
    EXPECT_EQ(second.at("requests").size(), 2U);
    EXPECT_EQ(second.at("requests")[0].at("status"), 200);
    EXPECT_GE(second.at("requests")[0].at("ms"), 0.0);
    EXPECT_EQ(second.dump().find("hush"), std::string::npos);
    insert(Json::object());
    send("DELETE", "/admin/requests");
    const Json third = get("/admin/news?since=" + second.at("last").dump()).body;
    EXPECT_NE(third.at("changes"), second.at("changes"));
    EXPECT_TRUE(third.at("requests").empty());  // they were forgotten; the numbers go on
    EXPECT_GT(third.at("last"), second.at("last"));
    EXPECT_EQ(get("/admin/news?since=99999").body.at("requests").size(), 0U);
    EXPECT_EQ(third.at("run"), first.at("run"));
    EXPECT_NE(third.at("run"), Context(std::chrono::seconds(1)).run);
}

}  // namespace
}  // namespace provider
