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
         {"/opt/usr/data/records/calendar.db", "/opt/usr/dbspace/.vantor_pim_sync_calendar.db",
          "/opt/usr/dbspace/.vantor_pim_sync_todo.db", "/opt/usr/data/records/contacts.db",
          "/opt/usr/dbspace/.vantor_pim_sync_contacts.db"}) {
        std::ifstream stream(root.at(file), std::ios::binary);
        std::stringstream text;
        text << stream.rdbuf();
        contents[file] = text.str();
    }
    return contents;
}

}  // namespace

SyncPair::SyncPair(int accounts, const std::vector<std::string>& providerArguments, const std::string& kind)
    : provider(providerArguments), mKind(kind) {
    const std::string without = kind == "calendar" ? "--no-contacts" : "--no-calendar";
    device.setClient(provider.clientId(), provider.clientSecret());
    for (int id = 1; id <= accounts; ++id) {
        const Provider::Account& account = provider.accounts().at(static_cast<size_t>(id - 1));
        const CommandResult added =
            device.addAccount(id, account.email, provider.url(), account.refreshToken, {without});
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

std::vector<Json> SyncPair::wireTaskLists(int account) {
    const std::string& email = provider.accounts().at(static_cast<size_t>(account - 1)).email;
    return provider.admin("GET", "/accounts/" + pathText(email) + "/tasklists").at("items");
}

std::string SyncPair::tasksPath(int account, const std::string& listId) {
    const std::string& email = provider.accounts().at(static_cast<size_t>(account - 1)).email;
    return "/accounts/" + pathText(email) + "/tasklists/" + pathText(listId) + "/tasks";
}

std::vector<Json> SyncPair::wireTasks(int account, const std::string& listId) {
    return provider.admin("GET", tasksPath(account, listId)).at("items");
}

int SyncPair::localCalendar(int account, const std::string& name) {
    const Json books = device.json({"calendars", "list", "--account", std::to_string(account)});
    for (const Json& book : books) {
        if (book.at("name") == name) return book.at("id");
    }
    ADD_FAILURE() << name << " is not among " << books.dump();
    return 0;
}

void SyncPair::expectSame(int account) {
    const Json books = device.json({"calendars", "list", "--account", std::to_string(account)});
    std::map<std::string, Json> bookByName;
    for (const Json& book : books) {
        if (book.at("kind") == "event") bookByName[book.at("name")] = book;
    }
    const std::vector<Json> calendars = wireCalendars(account);
    EXPECT_EQ(bookByName.size(), calendars.size()) << books.dump();
    for (const Json& calendar : calendars) {
        SCOPED_TRACE("calendar " + calendar.at("id").get<std::string>());
        ASSERT_TRUE(bookByName.contains(calendar.at("summary"))) << books.dump();
        expectSameEvents(bookByName[calendar.at("summary")], calendar);
    }
    expectSameTasks(account, books);
}

void SyncPair::expectSameEvents(const Json& book, const Json& calendar) {
    EXPECT_EQ(book.at("readOnly"), calendar.at("accessRole") == "reader");
    EXPECT_EQ(book.at("color"), calendar.at("backgroundColor"));
    const Json events =
        device.json({"events", "list", "--calendar", std::to_string(book.at("id").get<int>())});
    std::map<int, std::string> uidOf;
    for (const Json& event : events) uidOf[event.at("id")] = event.at("uid");
    std::map<std::string, Json> expected = expectedEvents(wireEvents(calendar.at("id")));
    EXPECT_EQ(events.size(), expected.size());
    for (const Json& event : events) {
        const std::string uid = event.at("uid");
        ASSERT_TRUE(expected.contains(uid)) << "not on the server, or twice on the device: " << event.dump();
        EXPECT_EQ(comparable(event, uidOf), expected[uid]) << uid;
        expected.erase(uid);
    }
    for (const auto& [uid, event] : expected)
        ADD_FAILURE() << "not on the device: " << uid << ' ' << event.dump();
}

void SyncPair::expectSameTasks(int account, const Json& books) {
    std::map<std::string, Json> bookByName;
    for (const Json& book : books) {
        if (book.at("kind") == "todo") bookByName[book.at("name")] = book;
    }
    const std::vector<Json> lists = wireTaskLists(account);
    EXPECT_EQ(bookByName.size(), lists.size()) << books.dump();
    for (const Json& list : lists) {
        SCOPED_TRACE("task list " + list.at("id").get<std::string>());
        ASSERT_TRUE(bookByName.contains(list.at("title"))) << books.dump();
        const std::string book = std::to_string(bookByName[list.at("title")].at("id").get<int>());
        std::map<std::string, Json> expected;
        for (const Json& task : wireTasks(account, list.at("id")))
            expected[task.at("id")] = expectedTodo(task);
        for (const Json& todo : device.json({"todos", "list", "--calendar", book})) {
            const std::string uid = todo.at("uid");
            ASSERT_TRUE(expected.contains(uid))
                << "not on the server, or twice on the device: " << todo.dump();
            EXPECT_EQ(comparableTodo(todo), expected[uid]) << uid;
            expected.erase(uid);
        }
        for (const auto& [uid, todo] : expected)
            ADD_FAILURE() << "not on the device: " << uid << ' ' << todo.dump();
    }
}

void SyncPair::expectQuiet(int account) {
    const auto before = storeContents(device.root());
    provider.admin("DELETE", "/requests");
    EXPECT_EQ(sync(account).status, 0);
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

Json SyncPair::localTodo(const std::string& uid) {
    for (const Json& todo : device.json({"todos", "list"})) {
        if (todo.at("uid") == uid) return todo;
    }
    return nullptr;
}

std::map<std::string, int> SyncPair::requestCounts() {
    std::map<std::string, int> counts;
    const Json requests = provider.admin("GET", "/requests");
    for (const auto& [name, count] : requests.at("counts").items()) {
        counts[name.substr(0, name.find(' '))] += count.get<int>();
    }
    return counts;
}

bool SyncPair::isNoted(const std::string& request) {
    const Json counts = provider.admin("GET", "/requests").at("counts");
    for (const auto& [name, count] : counts.items()) {
        if (name.starts_with(request)) return true;
    }
    return false;
}

void SyncPair::expectFaultsUsed() {
    const Json left = provider.admin("GET", "/faults").at("faults");
    EXPECT_TRUE(left.empty()) << "unused: " << left.dump();
    provider.admin("DELETE", "/faults");
}
