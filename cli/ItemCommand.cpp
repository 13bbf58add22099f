#include "ItemCommand.h"

#include "CalendarStore.h"
#include "Output.h"

namespace item_command {

Action buildShow(CLI::App& app, const std::string& what, Show show) {
    auto options = std::make_shared<ItemOptions>();
    command::addId(app, "ID", options->id, what)->required();
    command::addJson(app, options->isJson);
    return [options, show] {
        const CalendarStore store;
        show(options->id, options->isJson);
        return kExitDone;
    };
}

Action buildAdd(CLI::App& app, const std::string& fileHelp, Add add, Show show) {
    auto options = std::make_shared<ItemOptions>();
    app.add_option("FILE", options->file, fileHelp)->required();
    command::addId(app, "--calendar", options->calendar, "The calendar, instead of the file's");
    command::addJson(app, options->isJson);
    return [options, add, show] {
        const CalendarStore store;
        const int id = add(options->file, options->calendar);
        options->isJson ? show(id, /*isJson=*/true) : output::line(std::to_string(id));
        return kExitDone;
    };
}

void addSetOptions(CLI::App& app, ItemOptions& options, const std::string& what, const std::string& fields) {
    command::addId(app, "ID", options.id, what)->required();
    app.add_option("FIELD=VALUE", options.assignments, fields)->required();
}

}  // namespace item_command
