// bench-page-server: command line.
#include <csignal>

#include <CLI/CLI.hpp>
#include <iostream>

#include "PageServer.h"

namespace {

int readAndRun(int argc, char** argv) {
    CLI::App app{
        "Serves ready-made pages of a calendar, an address book and a task list, for measuring what a client "
        "costs. "
        "Prints one line of JSON when it is ready; runs until it is ended."};
    bench::ItemCounts counts;
    bool isTls = false;
    app.add_option("--events", counts.events, "Number of events");
    app.add_option("--contacts", counts.contacts, "Number of contacts");
    app.add_option("--tasks", counts.tasks, "Number of tasks");
    app.add_flag("--tls", isTls, "HTTPS, with a certificate made at start");
    CLI11_PARSE(app, argc, argv);
    bench::PageServer server(counts, isTls);
    std::cout << server.ready().dump() << std::endl;
    server.run();
    return 0;
}

}  // namespace

int main(int argc, char** argv) {
    std::signal(SIGPIPE, SIG_IGN);
    try {
        return readAndRun(argc, argv);
    } catch (const provider::ApiError& error) {
        std::cerr << "bench-page-server: " << error.message << '\n';
    } catch (const std::exception& error) {
        std::cerr << "bench-page-server: " << error.what() << '\n';
    }
    return 1;
}
