#include "ItemCommand.h"

namespace item_command {

void addSetOptions(CLI::App& app, ItemOptions& options, const std::string& what, const std::string& fields) {
    command::addId(app, "ID", options.id, what)->required();
    app.add_option("FIELD=VALUE", options.assignments, fields)->required();
}

}  // namespace item_command
