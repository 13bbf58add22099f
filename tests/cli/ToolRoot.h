// ToolRoot: the built tool on a root of its own.
#pragma once

#include <string>
#include <vector>

#include "Output.h"
#include "e2e/Process.h"
#include "platform/calendar.h"
#include "support/TestRoot.h"

class ToolRoot {
public:
    ToolRoot();  // runs init

    [[nodiscard]] const TestRoot& root() const { return mRoot; }
    CommandResult run(const std::vector<std::string>& arguments, const std::string& input = "");
    // A command that must succeed with JSON.
    Json json(const std::vector<std::string>& arguments, const std::string& input = "");
    // Adds an event to the calendar and returns its id, which must be what the tool prints.
    int addEvent(int calendar, const std::string& object);

    // A calendar of the store, made as another program would.
    static int addCalendar(int account, const char* name, bool isReadOnly = false, int storeType = 1);
    static int addAddressBook(int account);
    static int addSystemGroup(int book, const char* name);
    static int addTaskList(int account, const char* name) { return addCalendar(account, name, false, 2); }

private:
    TestRoot mRoot;
};
