// daemon: the daemon of a private root. A system install has its service manager.
#include "Command.h"
#include "DaemonLink.h"
#include "Failure.h"
#include "Output.h"

Action buildDaemonStart(CLI::App&) {
    return [] {
        output::line(daemon_link::start() ? "the daemon is started" : "the daemon runs already");
        return kExitDone;
    };
}

Action buildDaemonStop(CLI::App&) {
    return [] {
        output::line(daemon_link::stop() ? "the daemon is stopped" : "the daemon does not run");
        return kExitDone;
    };
}

Action buildDaemonStatus(CLI::App& app) {
    auto isJson = std::make_shared<bool>(false);
    command::addJson(app, *isJson);
    return [isJson] {
        const std::optional<int> pid = daemon_link::servingPid();
        if (*isJson) output::json({{"running", pid.has_value()}, {"pid", pid ? Json(*pid) : Json()}});
        daemon_link::requireRunning();
        if (!*isJson) output::line("the daemon runs (process " + std::to_string(pid.value_or(0)) + ")");
        return kExitDone;
    };
}
