// ExchangeFixture: a device with two calendars, two task lists and two address books, to go from one to the other
// through a file.
#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>

#include "EventJson.h"
#include "RecordAccess.h"
#include "TodoJson.h"
#include "cli/ToolRoot.h"
#include "exchange/Identity.h"
#include "platform/contacts.h"
#include "support/Hostile.h"

class Exchange : public testing::Test {
protected:
    Exchange() {
        for (const int account : {7, 8}) {
            mCalendars.push_back(ToolRoot::addCalendar(account, "Work"));
            mLists.push_back(ToolRoot::addTaskList(account, "Tasks"));
            ToolRoot::addAddressBook(account);
        }
    }

    std::string file(const std::string& name, const std::string& text) {
        std::ofstream(mTool.root().at("/" + name), std::ios::binary) << text;
        return mTool.root().at("/" + name);
    }
    // Writes a calendar's events or to-dos without a process for each.
    static void insert(const std::vector<Json>& items, int calendar, bool areTodos = false) {
        ASSERT_EQ(calendar_connect_with_flags(0), 0);
        ASSERT_EQ(calendar_db_begin_transaction(), 0);
        for (const Json& item : items) {
            const CalendarRecord record =
                areTodos ? todo_json::parse(item).record : event_json::parse(item).record;
            ASSERT_EQ(calendar_record_set_int(
                          record.get(), areTodos ? CALENDAR_TODO_BOOK_ID : CALENDAR_EVENT_BOOK_ID, calendar),
                      0);
            int id = 0;
            ASSERT_EQ(calendar_db_insert_record(record.get(), &id), 0) << item;
        }
        ASSERT_EQ(calendar_db_end_transaction(true), 0);
        calendar_disconnect();
    }
    std::vector<Json> listed(const std::vector<std::string>& arguments) {
        return withoutIds(mTool.json(arguments));
    }
    std::vector<Json> events(int calendar) {
        return listed({"events", "list", "--json", "--calendar", std::to_string(calendar)});
    }
    std::vector<Json> todos(int calendar) {
        return listed({"todos", "list", "--json", "--calendar", std::to_string(calendar)});
    }
    std::vector<Json> contacts(int account) {
        return listed({"contacts", "list", "--json", "--account", std::to_string(account)});
    }
    // What does not depend on where the items are, in an order of its own.
    std::vector<Json> withoutIds(const Json& list) {
        std::map<int, std::string> groups;
        for (const Json& group : mTool.json({"groups", "list", "--json"}))
            groups[group["id"]] = group["name"];
        std::vector<Json> items;
        for (Json item : list) {
            for (const char* member : {"id", "calendar", "account", "uid"}) item.erase(member);
            if (item.contains("originalEvent") && !item["originalEvent"].is_null())
                item["originalEvent"] = "series";
            if (item.contains("groups")) {
                for (Json& group : item["groups"]) group = groups[group.get<int>()];
            }
            if (item.contains("photo") && item["photo"] != "")
                item["photo"] =
                    exchange::identity::sha256(hostile::contentOf(item["photo"].get<std::string>()));
            items.push_back(std::move(item));
        }
        sort(items);
        return items;
    }

    static void sort(std::vector<Json>& items) {
        std::sort(items.begin(), items.end(),
                  [](const Json& a, const Json& b) { return a.dump() < b.dump(); });
    }

    // The sum of an import that may end with 0 or 1.
    Json import(const std::vector<std::string>& arguments, int status = 0, std::string* error = nullptr) {
        std::vector<std::string> all = {"import", "--json"};
        all.insert(all.end(), arguments.begin(), arguments.end());
        const CommandResult result = mTool.run(all);
        EXPECT_EQ(result.status, status) << result.error;
        if (error != nullptr) *error = result.error;
        Json report = Json::parse(result.output, nullptr, /*allow_exceptions=*/false);
        EXPECT_FALSE(report.is_discarded()) << result.output << result.error;
        return report;
    }
    Json importCalendar(const std::string& path, int calendar, int status = 0) {
        return import({path, "--calendar", std::to_string(calendar), "--time-zone", "Europe/Berlin"}, status);
    }
    Json importCards(const std::string& path, int account, int status = 0) {
        return import({path, "--account", std::to_string(account)}, status);
    }
    std::string exported(const char* what, const std::string& place, const std::string& id) {
        const std::string path = mTool.root().at(std::string("/") + what + id);
        const CommandResult result = mTool.run({"export", what, place, id, path});
        EXPECT_EQ(result.status, 0) << result.error;
        return path;
    }

    ToolRoot mTool;
    std::vector<int> mCalendars;
    std::vector<int> mLists;
};

// A text as a file can hold it: line ends of one kind, no other control characters.
inline std::string asFilesHoldIt(std::string text) {
    for (size_t at = 0; (at = text.find('\r', at)) != std::string::npos;) {
        const bool isPair = text.compare(at, 2, "\r\n") == 0;
        isPair ? text.erase(at, 1) : text.replace(at, 1, "\n");
    }
    std::erase_if(text, [](char c) {
        return (static_cast<unsigned char>(c) < 0x20 && c != '\n' && c != '\t') || c == 0x7F;
    });
    return text;
}
