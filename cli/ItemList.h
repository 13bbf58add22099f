// ItemList.h: lists of events and to-dos, chosen by account or calendar. One query a list, and no look-up per item.
#pragma once

#include <span>
#include <vector>

#include "CalendarStore.h"
#include "Command.h"

struct ListOptions {
    int account = 0;
    int calendar = 0;
    bool isJson = false;
};

namespace item_list {

struct View {
    const char* uri;
    unsigned id;
    unsigned bookId;
};

// One list a calendar when they are chosen by calendar or account, else one list of all.
std::vector<CalendarList> find(const View& view, const ListOptions& options,
                               std::span<const unsigned> projection);

using List = void (*)(const ListOptions& options);
Action build(CLI::App& app, List asJson, List asTable);

}  // namespace item_list
