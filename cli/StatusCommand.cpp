// status: how the syncs of the accounts stand. watch: the same, shown again whenever it changes.
#include <ctime>

#include "Command.h"
#include "Failure.h"
#include "SyncStatus.h"
#include "SyncWatch.h"

namespace {

struct StatusOptions {
    int account = 0;
    bool isJson = false;
};

std::shared_ptr<StatusOptions> declare(CLI::App& app) {
    auto options = std::make_shared<StatusOptions>();
    command::addId(app, "ACCOUNT", options->account, "Only this account");
    command::addJson(app, options->isJson);
    return options;
}

}  // namespace

Action buildStatus(CLI::App& app) {
    return [options = declare(app)] {
        const std::vector<SyncStatus> all = sync_status::all(options->account);
        if (!options->isJson) {
            output::raw(sync_status::toText(all, terminal::columns(), time(nullptr)));
            return kExitDone;
        }
        output::JsonArray array;
        for (const SyncStatus& status : all) array.add(sync_status::toJson(status));
        array.end();
        return kExitDone;
    };
}

Action buildWatch(CLI::App& app) {
    return [options = declare(app)] {
        sync_watch::run(options->account, options->isJson);
        return kExitDone;
    };
}
