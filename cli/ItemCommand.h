// ItemCommand.h: what the commands for one event and for one to-do share.
#pragma once

#include <string>
#include <vector>

#include "Command.h"
#include "Failure.h"
#include "platform/calendar.h"

struct ItemOptions {
    int id = 0;
    int calendar = 0;
    std::string file;
    std::string instance;
    std::vector<std::string> assignments;
    bool isJson = false;
};

namespace item_command {

using Show = void (*)(int id, bool isJson);
Action buildShow(CLI::App& app, const std::string& what, Show show);

// `add` reads the file, writes the record into the chosen calendar (0: the file's) and gives its id.
using Add = int (*)(const std::string& path, int chosenCalendar);
Action buildAdd(CLI::App& app, const std::string& fileHelp, Add add, Show show);

void addSetOptions(CLI::App& app, ItemOptions& options, const std::string& what, const std::string& fields);

// Writes until nobody else has written in between; a Failure of `what` when that does not end.
template <class TryToWrite>
void write(const std::string& what, TryToWrite tryToWrite) {
    constexpr int kMostTries = 5;
    int code = PLATFORM_ERROR_CONFLICT;
    for (int tries = 0; code == PLATFORM_ERROR_CONFLICT && tries < kMostTries; ++tries) code = tryToWrite();
    check(code, what);
}

}  // namespace item_command
