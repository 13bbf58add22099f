#include "e2e/SyncPair.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <sstream>

#include "common/UrlText.h"

std::string pathText(const std::string& id) {
    return url_text::segment(id);
}

namespace {

// The content of the device's stores, but for the account store, which keeps the time of the last sync.
std::map<std::string, std::string> storeContents(const TestRoot& root) {
    std::map<std::string, std::string> contents;
    for (const char* file :
         {"/opt/usr/data/records/calendar.db", "/opt/usr/dbspace/.vantor_pim_sync_calendar.db"}) {
        std::ifstream stream(root.at(file), std::ios::binary);
        std::stringstream text;
        text << stream.rdbuf();
        contents[file] = text.str();
    }
    return contents;
}

}  // namespace

SyncPair::SyncPair(int accounts, const std::vector<std::string>& providerArguments)
    : provider(providerArguments) {
    device.setClient(provider.clientId(), provider.clientSecret());
    for (int id = 1; id <= accounts; ++id) {
        const Provider::Account& account = provider.accounts().at(static_cast<size_t>(id - 1));
        const CommandResult added =
            device.addAccount(id, account.email, provider.url(), account.refreshToken);
        EXPECT_EQ(added.status, 0) << added.error;
    }
}

std::vector<Json> SyncPair::wireCalendars(int account) {
    const std::string& email = provider.accounts().at(static_cast<size_t>(account - 1)).email;
    return provider.admin("GET", "/accounts/" + pathText(email) + "/calendars").at("calendars");
}

std::vector<Json> SyncPair::wireEvents(const std::string& calendarId) {
    return provider.admin("GET", "/calendars/" + pathText(calendarId) + "/events").at("items");
}

void SyncPair::expectSame(int account) {
    const Json books = device.json({"calendars", "list", "--account", std::to_string(account)});
    std::map<std::string, Json> bookByName;
    for (const Json& book : books) bookByName[book.at("name")] = book;
    const std::vector<Json> calendars = wireCalendars(account);
    EXPECT_EQ(books.size(), calendars.size());
    for (const Json& calendar : calendars) {
        SCOPED_TRACE("calendar " + calendar.at("id").get<std::string>());
        ASSERT_TRUE(bookByName.contains(calendar.at("summary"))) << books.dump();
        const Json& book = bookByName[calendar.at("summary")];
        EXPECT_EQ(book.at("readOnly"), calendar.at("accessRole") == "reader");
        EXPECT_EQ(book.at("color"), calendar.at("backgroundColor"));
        EXPECT_EQ(book.at("kind"), "event");

        const Json events =
            device.json({"events", "list", "--calendar", std::to_string(book.at("id").get<int>())});
        std::map<int, std::string> uidOf;
        for (const Json& event : events) uidOf[event.at("id")] = event.at("uid");
        std::map<std::string, Json> expected = expectedEvents(wireEvents(calendar.at("id")));
        EXPECT_EQ(events.size(), expected.size());
        for (const Json& event : events) {
            const std::string uid = event.at("uid");
            ASSERT_TRUE(expected.contains(uid))
                << "not on the server, or twice on the device: " << event.dump();
            EXPECT_EQ(comparable(event, uidOf), expected[uid]) << uid;
            expected.erase(uid);
        }
        for (const auto& [uid, event] : expected)
            ADD_FAILURE() << "not on the device: " << uid << ' ' << event.dump();
    }
}

void SyncPair::expectQuiet(int account) {
    const auto before = storeContents(device.root());
    provider.admin("DELETE", "/requests");
    EXPECT_EQ(device.sync(account).status, 0);
    const auto after = storeContents(device.root());
    for (const auto& [file, content] : before)
        EXPECT_TRUE(after.at(file) == content) << file << " has changed";
    for (const auto& [method, count] : requestCounts()) EXPECT_EQ(method, "GET") << count << " requests";
}

Json SyncPair::localEvent(const std::string& uid) {
    for (const Json& event : device.json({"events", "list"})) {
        if (event.at("uid") == uid) return event;
    }
    return nullptr;
}

std::map<std::string, int> SyncPair::requestCounts() {
    std::map<std::string, int> counts;
    for (const auto& [name, count] : provider.admin("GET", "/requests").at("counts").items()) {
        counts[name.substr(0, name.find(' '))] += count.get<int>();
    }
    return counts;
}

void SyncPair::expectFaultsUsed() {
    for (const Json& fault : provider.admin("GET", "/faults").at("faults")) {
        EXPECT_EQ(fault.value("count", 0), 0) << "unused: " << fault.dump();
    }
    provider.admin("DELETE", "/faults");
}
