// bench-device: asks the daemon of a root for one piece of work, or measures how soon it answers. The root is VANTOR_PIM_SYNC_ROOT.
#include <CLI/CLI.hpp>
#include <iostream>

#include "DeviceSync.h"

namespace {

void print(const bench::Cost& cost) {
    std::cout << "{\"wallMs\":" << cost.wallMs << ",\"cpuMs\":" << cost.cpuMs << "}" << std::endl;
}

int readAndRun(int argc, char** argv) {
    CLI::App app{"Measures what the daemon does for a client. Prints JSON."};
    app.require_subcommand(1);
    int account = 1;
    app.add_option("--account", account, "The account");

    std::string kind;
    CLI::App* sync = app.add_subcommand("sync", "One sync, from the request to its end");
    sync->add_option("KIND", kind, "calendar or contacts")
        ->required()
        ->check(CLI::IsMember({"calendar", "contacts"}));
    sync->callback([&] { print(bench::syncOnce(account, kind)); });

    int events = 0;
    CLI::App* upload = app.add_subcommand("upload", "New events, until the daemon has sent them");
    upload->add_option("COUNT", events, "How many")->required();
    upload->callback([&] { print(bench::uploadEvents(account, events)); });

    std::string daemon;
    CLI::App* start = app.add_subcommand("start", "Starts the daemon, until it answers");
    start->add_option("DAEMON", daemon, "The daemon's program")->required();
    start->callback([&] {
        std::cout << "{\"firstAnswerMs\":" << bench::firstAnswerMs(account, daemon) << "}" << std::endl;
    });

    int calls = 0;
    CLI::App* state = app.add_subcommand("state", "The latency of get_state");
    state->add_option("COUNT", calls, "How many calls")->required();
    state->callback([&] {
        const bench::Latency latency = bench::stateLatency(account, calls);
        std::cout << "{\"medianUs\":" << latency.medianUs << ",\"p99Us\":" << latency.p99Us << "}"
                  << std::endl;
    });
    CLI11_PARSE(app, argc, argv);
    return 0;
}

}  // namespace

int main(int argc, char** argv) {
    try {
        return readAndRun(argc, argv);
    } catch (const std::exception& error) {
        std::cerr << "bench-device: " << error.what() << '\n';
        return 1;
    }
}
