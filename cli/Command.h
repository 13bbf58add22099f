// Command.h: one command of the tool. The table in Commands.cpp makes the parser and the help from these.
#pragma once

#include <CLI/CLI.hpp>
#include <cstdint>
#include <functional>
#include <string>

// What a command does once its options are read: an exit status, a Failure or a Misuse.
using Action = std::function<int()>;

struct Command {
    const char* noun;
    const char* verb;  // NULL: the noun is the command
    const char* summary;
    const char* examples;  // one a line, without the program's name
    // Declares the options and returns the action, which owns what the options are read into.
    Action (*build)(CLI::App& app);
};

namespace command {

// An id as an argument: a whole number above 0 in decimal digits, anything else is misuse.
CLI::Option* addId(CLI::App& app, const std::string& name, int& id, const std::string& help);
// A number as an option, in decimal digits and within the bounds.
CLI::Option* addNumber(CLI::App& app, const std::string& name, int& value, int least, int most,
                       const std::string& help);
CLI::Option* addJson(CLI::App& app, bool& isJson);

// Decimal digits only, within the bounds.
bool readNumber(const std::string& text, int least, int most, int* out);

}  // namespace command

// The builders, one file a noun.
Action buildInit(CLI::App& app);
Action buildDoctor(CLI::App& app);
Action buildWatch(CLI::App& app);
Action buildLog(CLI::App& app);
Action buildKeySet(CLI::App& app);
Action buildSettingGet(CLI::App& app);
Action buildSettingSet(CLI::App& app);
Action buildAccountAdd(CLI::App& app);
Action buildAccountUpdate(CLI::App& app);
Action buildAccountRemove(CLI::App& app);
Action buildAccountList(CLI::App& app);
Action buildAccountShow(CLI::App& app);
Action buildSync(CLI::App& app);
Action buildStop(CLI::App& app);
Action buildStatus(CLI::App& app);
Action buildDaemonStart(CLI::App& app);
Action buildDaemonStop(CLI::App& app);
Action buildDaemonStatus(CLI::App& app);
Action buildCalendarsList(CLI::App& app);
Action buildEventsList(CLI::App& app);
Action buildEventShow(CLI::App& app);
Action buildEventAdd(CLI::App& app);
Action buildEventSet(CLI::App& app);
Action buildEventDelete(CLI::App& app);
Action buildTodosList(CLI::App& app);
Action buildTodoShow(CLI::App& app);
Action buildTodoAdd(CLI::App& app);
Action buildTodoSet(CLI::App& app);
Action buildTodoDelete(CLI::App& app);
Action buildContactsList(CLI::App& app);
Action buildContactShow(CLI::App& app);
Action buildContactAdd(CLI::App& app);
Action buildContactSet(CLI::App& app);
Action buildContactPhoto(CLI::App& app);
Action buildContactDelete(CLI::App& app);
Action buildGroupsList(CLI::App& app);
Action buildGroupShow(CLI::App& app);
Action buildGroupAdd(CLI::App& app);
Action buildGroupSet(CLI::App& app);
Action buildGroupDelete(CLI::App& app);
Action buildExportEvents(CLI::App& app);
Action buildExportTodos(CLI::App& app);
Action buildExportContacts(CLI::App& app);
Action buildImport(CLI::App& app);
