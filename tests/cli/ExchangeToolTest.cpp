// export and import: what goes out comes back as it was, once, and what a file cannot hold is told.
#include <gmock/gmock.h>
#include <sys/stat.h>

#include "cli/ExchangeFixture.h"

namespace {

using testing::HasSubstr;

constexpr const char* kEvents = R"([
    {"summary": "plain", "start": "2026-03-01T10:00:00Z", "end": "2026-03-01T11:00:00Z"},
    {"summary": "all of it", "description": "two\nlines, a; b \\n c", "location": " Room \"2\" ",
    "start": "2026-03-01T10:00:30Z",
     "end": "2026-03-01T10:00:30Z", "timeZone": "Europe/Berlin", "status": "tentative", "visibility": "private",
     "busy": false,
     "organizer": {"name": "Ö, \"A\"^n", "email": "o+x y@example.com"}, "reminders": [0, 10, 61, 1440, 10, 20160,
     1500],
     "attendees": [{"name": "", "email": "a@example.com", "status": "accepted"},
                   {"name": "B;:,\\", "email": "b%40@example.com", "status": "declined"},
                   {"name": "c\nd", "email": "c@example.com", "status": "tentative"}]},
    {"summary": "days", "start": "2026-03-01", "end": "2026-03-04", "timeZone": "Asia/Tokyo",
    "visibility": "public", "status": "confirmed"},
    {"summary": "a day without length", "start": "2026-03-01", "end": "2026-03-01", "status": "cancelled"},
    {"summary": "the first of an hour that comes twice", "start": "2026-10-25T00:30:00Z",
    "end": "2026-10-25T00:40:00Z",
     "timeZone": "Europe/Berlin"},
    {"summary": "the second", "start": "2026-10-25T01:30:00Z", "end": "2026-10-25T01:40:00Z",
    "timeZone": "Europe/Berlin"},
    {"summary": "long ago", "start": "1890-01-01T10:00:00Z", "end": "1890-01-01T11:00:00Z",
    "timeZone": "America/New_York"},
    {"summary": "far off", "start": "9999-12-31T22:00:00Z", "end": "9999-12-31T23:00:00Z"},
    {"summary": "weekly", "start": "2026-03-02T08:00:00Z", "end": "2026-03-02T09:00:00Z",
    "timeZone": "America/New_York",
     "rrule": "FREQ=WEEKLY;INTERVAL=2;BYDAY=MO,-1FR;WKST=SU;UNTIL=20261231T235959Z",
     "exdates": ["2026-03-16T07:00:00Z"]},
    {"summary": "yearly", "start": "2024-02-29", "end": "2024-03-01",
     "rrule": "FREQ=YEARLY;BYMONTHDAY=-1;BYMONTH=2;BYSETPOS=1;COUNT=9", "exdates": ["2025-02-28"]},
    {"summary": "", "start": "2026-03-01T10:00:00Z", "end": "2026-03-01T11:00:00Z", "timeZone": "Etc/UTC"},
    {"summary": "twice", "start": "2026-03-01T10:00:00Z", "end": "2026-03-01T11:00:00Z"},
    {"summary": "twice", "start": "2026-03-01T10:00:00Z", "end": "2026-03-01T11:00:00Z"},
    {"summary": "twice", "description": "nearly", "start": "2026-03-01T10:00:00Z", "end": "2026-03-01T11:00:00Z"}])";

constexpr const char* kTodos = R"([
    {"summary": "plain"}, {"summary": "due", "note": "two\nlines", "due": "2026-03-01T10:00:00Z"},
    {"summary": "a day", "due": "2026-03-01"},
    {"summary": "done", "due": "2026-03-01", "completed": "2026-02-01T09:00:01Z", "status": "completed"},
    {"summary": "done without a time", "status": "completed"}, {"summary": "open again",
    "completed": "2026-02-01T09:00:01Z"}])";

constexpr const char* kContacts = R"([
    {"name": {"first": "Mira", "middle": "Ann, B;", "last": "Öz <&>", "prefix": "Dr.", "suffix": "Jr.",
    "phoneticFirst": "mee-ra",
              "phoneticMiddle": "an", "phoneticLast": "oez"}, "nickname": "Mi, Mo",
     "emails": [{"value": "m@example.com", "type": "home"}, {"value": "n@example.com", "type": "custom",
     "label": "Club, \"x\""},
                {"value": "o@example.com"}, {"value": "p@example.com", "type": "mobile"}, {"value": "q@example.com",
                "type": "work", "label": "both"}],
     "phones": [{"value": "1", "type": "mobile"}, {"value": "2", "type": "home", "primary": true}, {"value": "3",
     "type": "work"},
                {"value": "4", "type": "work_fax"}, {"value": "5", "type": "home_fax"}, {"value": "6",
                "type": "pager"},
                {"value": "7", "type": "assistant"}, {"value": "8", "type": "car"}, {"value": "9", "type": "fax"},
                {"value": "10", "type": "isdn"}, {"value": "11", "type": "other"}, {"value": "12",
                "type": "work_mobile"},
                {"value": "13", "type": "work_pager"}, {"value": "tel:14,5;6", "type": "custom", "label": "Boat"}],
     "addresses": [{"street": "Am Weg 1\nHof, links;", "pobox": "7", "extended": "Mitte", "city": "Berlin",
     "region": "B",
                    "postcode": "10115", "country": "DE", "type": "custom", "label": "Boat", "primary": true},
                   {"city": "Rome", "type": "work"}, {"country": "IT", "type": "home"}],
     "companies": [{"name": "Öl; AG", "title": "CTO", "department": "R,D", "description": "d", "location": "l",
     "symbol": "OEL", "type": "work"},
                   {"title": "only a title"}, {"name": "B", "type": "custom", "label": "Side"},
                   {"department": "only a department"}],
     "messengers": [{"value": "mi ra@x", "protocol": "JABBER"}, {"value": "m:1", "protocol": "custom",
     "label": "IRC"},
                    {"value": "a", "protocol": "VANTOR_TALK"}, {"value": "b", "protocol": "MSN"}, {"value": "c",
                    "protocol": "YAHOO"},
                    {"value": "d", "protocol": "ICQ"}, {"value": "e", "protocol": "AIM"}, {"value": "f",
                    "protocol": "QQ"},
                    {"value": "g", "protocol": "SKYPE"}, {"value": "h"}],
     "events": [{"date": "1990-02-28", "type": "birthday"}, {"date": "2015-05-01", "type": "anniversary"},
                {"date": "2016-05-01", "type": "custom", "label": "Met"}, {"date": "1991-02-28",
                "type": "birthday"}, {"date": "2017-05-01"}, {"type": "birthday"}],
     "relations": [{"name": "A", "type": "assistant"}, {"name": "B", "type": "brother"}, {"name": "C",
     "type": "child"},
                   {"name": "D", "type": "domestic-partner"}, {"name": "E", "type": "father"}, {"name": "F",
                   "type": "friend"},
                   {"name": "G", "type": "manager"}, {"name": "H", "type": "mother"}, {"name": "I", "type": "parent"},
                   {"name": "J", "type": "partner"}, {"name": "K", "type": "referred-by"}, {"name": "L",
                   "type": "relative"},
                   {"name": "M", "type": "sister"}, {"name": "urn:N", "type": "spouse"}, {"name": "O",
                   "type": "custom", "label": "Pal"},
                   {"name": "P"}],
     "urls": [{"value": "https://m.example/a,b;c?d=\\n", "type": "work"}, {"value": "https://n.example",
     "type": "custom", "label": "Blog"},
              {"value": "https://o.example", "type": "home"}, {"value": "p"}],
     "note": "two\nlines\n\n end ", "fields": [{"key": "shoe; size", "value": "39, 40"}, {"key": "empty",
     "value": ""}]},
    {"nickname": "only a nickname"}, {"emails": [{"value": "only@example.com"}]},
    {"companies": [{"name": "Only Ltd"}]},
    {"name": {"first": "only@example.com"}}, {"note": "only a note"}, {"name": {"last": "Twin"}},
    {"name": {"last": "Twin"}}])";

}  // namespace

TEST_F(Exchange, EventsComeBackAsTheyWere) {
    std::vector<Json> all = Json::parse(kEvents);
    for (const std::string& text : hostile::naughtyStrings()) {
        all.push_back({{"summary", text},
                       {"description", "x\n" + text},
                       {"location", text},
                       {"start", "2026-03-01"},
                       {"end", "2026-03-02"}});
        all.back()["organizer"] = {{"name", text}, {"email", ""}};
        all.back()["attendees"] = {{{"name", text}, {"email", "x" + text}, {"status", "needsAction"}}};
    }
    insert(all, mCalendars[0]);
    const Json series =
        mTool.json({"events", "list", "--json", "--calendar", std::to_string(mCalendars[0])})[8];
    ASSERT_EQ(series["summary"], "weekly");
    ASSERT_EQ(mTool
                  .run({"event", "set", series["id"].dump(), "--instance", "20260330T080000Z", "summary=late",
                        "start=2026-03-30T10:00:00Z", "end=2026-03-30T12:00:00Z"})
                  .status,
              0);
    const std::string path = exported("events", "--calendar", std::to_string(mCalendars[0]));
    const Json report = importCalendar(path, mCalendars[1]);
    EXPECT_EQ(report["added"], all.size());
    EXPECT_EQ(report["notHeld"], Json::object());
    std::vector<Json> expected = events(mCalendars[0]);
    EXPECT_EQ(expected.size(), all.size() + 1);
    for (Json& event : expected) {
        for (const char* text : {"summary", "description", "location"})
            event[text] = asFilesHoldIt(event[text]);
        if (!event["attendees"].empty())
            event["attendees"][0]["name"] = asFilesHoldIt(event["attendees"][0]["name"]);
        event["organizer"]["name"] = asFilesHoldIt(event["organizer"]["name"]);
    }
    sort(expected);
    const std::vector<Json> got = events(mCalendars[1]);
    ASSERT_EQ(got.size(), expected.size());
    for (size_t at = 0; at < got.size(); ++at) EXPECT_EQ(got[at], expected[at]);

    EXPECT_EQ(mTool.json({"events", "list", "--json", "--calendar", std::to_string(mCalendars[1])})[0]["uid"],
              "")
        << "the server does not know it";
    for (const int calendar : mCalendars)
        EXPECT_EQ(importCalendar(path, calendar)["skipped"]["same"], all.size());
    EXPECT_EQ(events(mCalendars[1]), got);
}

TEST_F(Exchange, TodosComeBackAsTheyWere) {
    std::vector<Json> all = Json::parse(kTodos);
    for (const std::string& text : hostile::naughtyStrings())
        all.push_back({{"summary", text}, {"note", text}});
    insert(all, mLists[0], /*areTodos=*/true);
    const std::string path = exported("todos", "--account", "7");
    EXPECT_EQ(importCalendar(path, mLists[1])["added"], all.size());
    std::vector<Json> expected = todos(mLists[0]);
    for (Json& todo : expected) {
        for (const char* text : {"summary", "note"}) todo[text] = asFilesHoldIt(todo[text]);
    }
    sort(expected);
    EXPECT_EQ(todos(mLists[1]), expected);
    for (const int list : mLists) EXPECT_EQ(importCalendar(path, list)["skipped"]["same"], all.size());
    EXPECT_EQ(todos(mLists[1]).size(), all.size());
}

TEST_F(Exchange, ContactsComeBackAsTheyWere) {
    std::vector<Json> all = Json::parse(kContacts);
    std::string hostileText;
    for (const std::string& text : hostile::naughtyStrings()) hostileText += asFilesHoldIt(text) + "\n";
    all.push_back(
        {{"name", {{"first", hostileText}, {"last", hostileText}, {"phoneticLast", hostileText}}},
         {"nickname", hostileText},
         {"note", hostileText},
         {"emails", {{{"value", hostileText}, {"label", hostileText}}}},
         {"addresses", {{{"street", hostileText}, {"city", hostileText}}}},
         {"companies", {{{"name", hostileText}, {"department", hostileText}, {"symbol", hostileText}}}},
         {"messengers", {{{"value", hostileText}, {"label", hostileText}}}},
         {"relations", {{{"name", hostileText}}}},
         {"urls", {{{"value", hostileText}}}},
         {"fields", {{{"key", hostileText}, {"value", hostileText}}}}});
    all[0]["photo"] = file("photo", std::string("\xFF\xD8\xFF\0\r\n", 6) + hostile::repeated("x", 100'000));
    const std::string group =
        mTool.json({"group", "add", "--account", "7", "-", "--json"}, R"({"name": "Choir, A"})")["id"].dump();
    all[0]["groups"] = {std::stoi(group)};
    for (const Json& contact : all)
        ASSERT_EQ(mTool.run({"contact", "add", "--account", "7", "-"}, contact.dump()).status, 0);

    const std::string path = exported("contacts", "--account", "7");
    const Json report = importCards(path, 8);
    EXPECT_EQ(report["added"], all.size());
    EXPECT_EQ(report["groupsAdded"], 1);
    EXPECT_EQ(report["notHeld"], Json::object());
    const std::vector<Json> expected = contacts(7);
    const std::vector<Json> got = contacts(8);
    ASSERT_EQ(got.size(), expected.size());
    for (size_t at = 0; at < got.size(); ++at) EXPECT_EQ(got[at], expected[at]);
    for (const int account : {7, 8}) EXPECT_EQ(importCards(path, account)["skipped"]["same"], all.size());
    EXPECT_EQ(contacts(8), got);
    EXPECT_TRUE(std::filesystem::is_empty(mTool.root().at("/tmp"))) << "nothing staged is left";
}

TEST_F(Exchange, WhatDiffersStaysUntilItIsReplaced) {
    const std::string calendar = std::to_string(mCalendars[0]);
    const std::string list = std::to_string(mLists[0]);
    insert(Json::parse(kEvents), mCalendars[0]);
    insert(Json::parse(kTodos), mLists[0], /*areTodos=*/true);
    for (const Json& contact : Json::parse(kContacts))
        ASSERT_EQ(mTool.run({"contact", "add", "--account", "7", "-"}, contact.dump()).status, 0);
    const std::string ics = exported("events", "--calendar", calendar);
    const std::string tasks = exported("todos", "--calendar", list);
    const std::string vcf = exported("contacts", "--account", "7");
    const std::vector<Json> before[] = {events(mCalendars[0]), todos(mLists[0]), contacts(7)};

    const Json shown = mTool.json({"events", "list", "--json", "--calendar", calendar});
    ASSERT_EQ(mTool.run({"event", "set", shown[1]["id"].dump(), "location=edited"}).status, 0);
    ASSERT_EQ(
        mTool
            .run({"event", "set", shown[8]["id"].dump(), "--instance", "20260330T080000Z", "location=edited"})
            .status,
        0);
    const std::string todo = mTool.json({"todos", "list", "--json", "--calendar", list})[1]["id"].dump();
    ASSERT_EQ(mTool.run({"todo", "set", todo, "note=edited"}).status, 0);
    const std::string contact = mTool.json({"contacts", "list", "--json"})[0]["id"].dump();
    ASSERT_EQ(mTool.run({"contact", "set", contact, "note=edited", "emails=[]"}).status, 0);
    const std::vector<Json> edited[] = {events(mCalendars[0]), todos(mLists[0]), contacts(7)};

    struct Row {
        std::vector<std::string> arguments;
        int differ;
        const char* title;
    };
    const Row rows[] = {{{ics, "--calendar", calendar}, 2, "all of it"},
                        {{tasks, "--calendar", list}, 1, "due"},
                        {{vcf, "--account", "7"}, 1, "Dr. Mira"}};
    for (const Row& row : rows) {
        std::string error;
        EXPECT_EQ(import(row.arguments, 0, &error)["skipped"]["differs"], row.differ);
        EXPECT_THAT(error, HasSubstr(row.title));
    }
    EXPECT_EQ(events(mCalendars[0]), edited[0]);
    EXPECT_EQ(todos(mLists[0]), edited[1]);
    EXPECT_EQ(contacts(7), edited[2]);
    for (const char* flag : {"--dry-run", "--json"}) {
        for (const Row& row : rows) {
            std::vector<std::string> arguments = {"import", "--replace", flag};
            arguments.insert(arguments.end(), row.arguments.begin(), row.arguments.end());
            const CommandResult result = mTool.run(arguments);
            EXPECT_EQ(result.status, 0) << result.error;
            EXPECT_THAT(result.output, HasSubstr(flag == std::string("--json") ? "\"replaced\": "
                                                                               : "nothing was written; "));
        }
        if (flag == std::string("--dry-run")) {
            EXPECT_EQ(contacts(7), edited[2]);
        }
    }
    EXPECT_EQ(todos(mLists[0]), before[1]);
    EXPECT_EQ(contacts(7), before[2]);
    std::vector<Json> now = events(mCalendars[0]);
    EXPECT_EQ(std::erase_if(now, [](const Json& event) { return !event["originalEvent"].is_null(); }), 1U)
        << "a changed instance that the file does not name stays";
    EXPECT_EQ(now, before[0]);
}

TEST_F(Exchange, ThePlaceDecidesWhatIsTaken) {
    const std::string path = file(
        "both.ics",
        "BEGIN:VCALENDAR\r\nBEGIN:VEVENT\r\nSUMMARY:an event\r\nDTSTART:20260301T100000Z\r\nEND:VEVENT\r\n"
        "BEGIN:VTODO\r\nSUMMARY:a to-do\r\nEND:VTODO\r\nBEGIN:VJOURNAL\r\nEND:VJOURNAL\r\nEND:VCALENDAR\r\n");
    for (const int calendar : {mCalendars[0], mLists[0]}) {
        const Json report = importCalendar(path, calendar);
        EXPECT_EQ(report["added"], 1);
        EXPECT_EQ(report["skipped"]["otherKind"], 1);
        EXPECT_EQ(report["notHeld"], Json({{"VJOURNAL", 1}}));
    }
    EXPECT_EQ(events(mCalendars[0]).size(), 1U);
    EXPECT_EQ(todos(mLists[0]).size(), 1U);
    const std::string readOnly = std::to_string(ToolRoot::addCalendar(7, "Theirs", /*isReadOnly=*/true));
    const std::string id = std::to_string(mCalendars[0]);
    struct Row {
        std::vector<std::string> arguments;
        int status;
    };
    const Row rows[] = {{{"import", path, "--calendar", readOnly}, 1},
                        {{"import", path, "--calendar", "99"}, 1},
                        {{"import", path, "--account", "7"}, 2},
                        {{"import", path}, 2},
                        {{"import", path, "--account", "7", "--calendar", id}, 2},
                        {{"import", path, "--calendar", id, "--time-zone", "Nowhere"}, 2},
                        {{"import", mTool.root().at("/none"), "--calendar", id}, 1},
                        {{"import", mTool.root().at("/"), "--calendar", id}, 1},
                        {{"export", "events", "--calendar", std::to_string(mLists[0])}, 1},
                        {{"export", "todos", "--calendar", id}, 1},
                        {{"export", "events", "--calendar", id, "--account", "8"}, 1},
                        {{"export", "events", "--account", "9"}, 1},
                        {{"export", "contacts", "--account", "9"}, 1},
                        {{"export", "events", mTool.root().at("/none/x.ics")}, 1},
                        {{"export", "events", mTool.root().at("/")}, 1},
                        {{"export", "events", "/dev/full"}, 1}};
    for (const Row& row : rows)
        EXPECT_EQ(mTool.run(row.arguments).status, row.status) << row.arguments.back();
}

TEST_F(Exchange, AFileIsPrivateAndReplacedOnlyWhole) {
    const std::string path = file("out.vcf", "former");
    ASSERT_EQ(mTool.run({"contact", "add", "--account", "7", "-"}, R"({"nickname": "n"})").status, 0);
    ASSERT_EQ(mTool.run({"export", "contacts", path}).status, 0);
    struct stat info {};
    ASSERT_EQ(stat(path.c_str(), &info), 0);
    EXPECT_EQ(info.st_mode & 0777, 0600);
    EXPECT_EQ(hostile::contentOf(path), mTool.run({"export", "contacts"}).output);
    EXPECT_EQ(mTool.run({"export", "contacts", "--account", "9", path}).status, 1);
    EXPECT_THAT(hostile::contentOf(path), HasSubstr("NICKNAME:n"));
    size_t files = 0;
    for (const auto& entry : std::filesystem::directory_iterator(mTool.root().at("/")))
        files += entry.path().string().find("out.vcf") != std::string::npos ? 1 : 0;
    EXPECT_EQ(files, 1U);
}
