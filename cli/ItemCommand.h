// ItemCommand.h: what the commands for one event, to-do, contact and group share.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Command.h"
#include "Failure.h"
#include "Output.h"
#include "platform/error.h"

struct ItemOptions {
    int id = 0;
    int place = 0;  // the calendar or account that a new item goes to
    std::string file;
    std::string instance;
    std::vector<std::string> assignments;
    bool isJson = false;
};

namespace item_command {

using Show = void (*)(int id, bool isJson);

// `Store` is open while the command runs.
template <class Store>
Action buildShow(CLI::App& app, const std::string& what, Show show) {
    auto options = std::make_shared<ItemOptions>();
    command::addId(app, "ID", options->id, what)->required();
    command::addJson(app, options->isJson);
    return [options, show] {
        const Store store;
        show(options->id, options->isJson);
        return kExitDone;
    };
}

// `add` reads the file, writes the record into the chosen place (0: the file's) and gives its id.
using Add = int (*)(const std::string& path, int chosenPlace);

struct AddTexts {
    const char* file;    // help of the argument
    const char* option;  // that chooses the place
    const char* place;   // its help
};

template <class Store>
Action buildAdd(CLI::App& app, const AddTexts& texts, Add add, Show show) {
    auto options = std::make_shared<ItemOptions>();
    app.add_option("FILE", options->file, texts.file)->required();
    command::addId(app, texts.option, options->place, texts.place);
    command::addJson(app, options->isJson);
    return [options, add, show] {
        const Store store;
        const int id = add(options->file, options->place);
        options->isJson ? show(id, /*isJson=*/true) : output::line(std::to_string(id));
        return kExitDone;
    };
}

// A list of all accounts' items or of one account's.
using AccountList = void (*)(std::optional<int> account);
template <class Store>
Action buildAccountList(CLI::App& app, AccountList asJson, AccountList asTable) {
    auto options = std::make_shared<ItemOptions>();
    command::addId(app, "--account", options->place, "Only those of this account");
    command::addJson(app, options->isJson);
    return [options, asJson, asTable] {
        const Store store;
        (options->isJson ? asJson : asTable)(options->place > 0 ? std::optional(options->place)
                                                                : std::nullopt);
        return kExitDone;
    };
}

using Delete = void (*)(int id);
template <class Store>
Action buildDelete(CLI::App& app, const std::string& what, Delete remove) {
    auto options = std::make_shared<ItemOptions>();
    command::addId(app, "ID", options->id, what)->required();
    return [options, remove] {
        const Store store;
        remove(options->id);
        return kExitDone;
    };
}

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
