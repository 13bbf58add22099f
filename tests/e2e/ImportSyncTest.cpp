// What is imported on the device goes up by itself, once, and a second import of the same file adds nothing on either
// side.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fstream>

#include "e2e/Eventually.h"
#include "e2e/SyncPair.h"

namespace {

constexpr const char* kCalendar =
    "BEGIN:VCALENDAR\r\nVERSION:2.0\r\n"
    "BEGIN:VEVENT\r\nUID:foreign-1@elsewhere.example\r\nSUMMARY:Imported\r\nDTSTART;TZID=Europe/"
    "Berlin:20260601T100000\r\n"
    "DTEND;TZID=Europe/Berlin:20260601T110000\r\nRRULE:FREQ=DAILY;COUNT=5\r\nEXDATE;TZID=Europe/"
    "Berlin:20260604T100000\r\n"
    "LOCATION:Room\r\nATTENDEE;CN=ada@example.com:mailto:ada@example.com\r\nBEGIN:VALARM\r\nACTION:"
    "DISPLAY\r\nTRIGGER:-"
    "PT10M\r\nEND:VALARM\r\n"
    "END:VEVENT\r\n"
    "BEGIN:VEVENT\r\nUID:foreign-1@elsewhere.example\r\nRECURRENCE-ID;TZID=Europe/"
    "Berlin:20260603T100000\r\nSUMMARY:Imported late\r\n"
    "DTSTART;TZID=Europe/Berlin:20260603T120000\r\nDTEND;TZID=Europe/Berlin:20260603T130000\r\nEND:VEVENT\r\n"
    "BEGIN:VTODO\r\nUID:foreign-2\r\nSUMMARY:Imported "
    "to-do\r\nDUE:20260602T000000Z\r\nDESCRIPTION:note\r\nEND:VTODO\r\nEND:VCALENDAR\r\n";

constexpr const char* kCard =
    "BEGIN:VCARD\r\nVERSION:3.0\r\nUID:foreign-3\r\nFN:Iris "
    "Imported\r\nN:Imported;Iris;;;\r\nTEL;TYPE=CELL:+49 30 1\r\n"
    "CATEGORIES:Imported friends\r\nPHOTO;ENCODING=b;TYPE=PNG:iVBORw0KGgpwaG90bw==\r\nEND:VCARD\r\n";

std::string write(const SyncPair& pair, const char* name, const char* content) {
    const std::string path = pair.device.root().at(std::string("/") + name);
    std::ofstream(path, std::ios::binary) << content;
    return path;
}

// What an import sums up; one that ends with anything but 0 fails the test.
Json import(SyncPair& pair, const std::string& path, const char* place, int id) {
    const CommandResult result = pair.device.tool({"import", path, place, std::to_string(id), "--json"});
    EXPECT_EQ(result.status, 0) << result.error;
    return Json::parse(result.output);
}

size_t countOf(const std::vector<Json>& items, const char* member, const std::string& value) {
    return static_cast<size_t>(std::count_if(
        items.begin(), items.end(), [&](const Json& item) { return item.value(member, "") == value; }));
}

}  // namespace

TEST(ImportSync, EventsAndTodosGoUpOnce) {
    SyncPair pair;
    ASSERT_EQ(pair.sync(1).status, 0);
    const std::string calendar = pair.firstCalendar(1);
    const int book = pair.localCalendar(1, pair.wireCalendars(1).at(0).at("summary"));
    const std::string list = pair.wireTaskLists(1).at(0).at("id");
    const int todos = pair.localCalendar(1, pair.wireTaskLists(1).at(0).at("title"));
    const std::string path = write(pair, "foreign.ics", kCalendar);
    for (const int place : {book, todos}) EXPECT_EQ(import(pair, path, "--calendar", place).at("added"), 1);

    const auto areThere = [&] {
        return countOf(pair.wireEvents(calendar), "summary", "Imported") >= 1 &&
               countOf(pair.wireEvents(calendar), "summary", "Imported late") == 1 &&
               countOf(pair.wireTasks(1, list), "title", "Imported to-do") == 1;
    };
    EXPECT_TRUE(eventually(areThere)) << pair.device.daemonLog();
    for (int sync = 0; sync < 2; ++sync) ASSERT_EQ(pair.sync(1).status, 0) << pair.device.daemonLog();
    pair.expectSame(1);
    pair.expectQuiet(1);
    for (const int place : {book, todos}) EXPECT_EQ(import(pair, path, "--calendar", place).at("added"), 0);
    // What goes out and comes back is what is there.
    const std::string out = pair.device.root().at("/out.ics");
    ASSERT_EQ(pair.device.tool({"export", "events", "--calendar", std::to_string(book), out}).status, 0);
    const Json again = import(pair, out, "--calendar", book);
    EXPECT_EQ(again.at("skipped").at("same"), again.at("read"));
    pair.expectSame(1);
    pair.expectQuiet(1);
    size_t series = 0;
    for (const Json& event : pair.wireEvents(calendar))
        series += event.value("summary", "") == "Imported" && event.contains("recurrence") ? 1 : 0;
    EXPECT_EQ(series, 1U);
    EXPECT_EQ(countOf(pair.wireEvents(calendar), "summary", "Imported late"), 1U);
    EXPECT_EQ(countOf(pair.wireTasks(1, list), "title", "Imported to-do"), 1U);
}

TEST(ImportSync, ContactsGoUpOnceWithGroupAndPhoto) {
    SyncPair pair(1, {"--seed", "sample"}, "contacts");
    pair.removeProfileLinks();
    ASSERT_EQ(pair.sync(1).status, 0);
    const std::string path = write(pair, "foreign.vcf", kCard);
    EXPECT_EQ(import(pair, path, "--account", 1).at("added"), 1);
    const auto found = [&] {
        std::vector<Json> contacts = pair.wireContacts(1);
        std::erase_if(contacts, [](const Json& contact) {
            return contact.dump().find("Imported") == std::string::npos;
        });
        return contacts;
    };
    EXPECT_TRUE(eventually([&] { return found().size() == 1 && found()[0].value("photo", "") != ""; }))
        << pair.device.daemonLog();
    for (int sync = 0; sync < 2; ++sync) ASSERT_EQ(pair.sync(1).status, 0) << pair.device.daemonLog();
    EXPECT_EQ(import(pair, path, "--account", 1).at("added"), 0);
    const std::string out = pair.device.root().at("/out.vcf");
    ASSERT_EQ(pair.device.tool({"export", "contacts", "--account", "1", out}).status, 0);
    const Json again = import(pair, out, "--account", 1);
    EXPECT_EQ(again.at("skipped").at("same"), again.at("read"));
    EXPECT_EQ(again.at("groupsAdded"), 0);
    pair.expectSameContacts(1);
    pair.expectQuiet(1);
    EXPECT_EQ(found().size(), 1U);
}
