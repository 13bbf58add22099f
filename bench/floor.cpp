// bench-floor: what a sync costs at the very least. Measures inside the process, from the first request to the last commit.
#include <sys/resource.h>

#include <CLI/CLI.hpp>
#include <chrono>
#include <ctime>
#include <iostream>

#include "FloorWork.h"

namespace {

double cpuMs() {
    timespec now{};
    clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &now);
    return static_cast<double>(now.tv_sec) * 1e3 + static_cast<double>(now.tv_nsec) / 1e6;
}

int readAndRun(int argc, char** argv) {
    CLI::App app{
        "The least that a sync costs: one libcurl handle, json-glib, two SQLite rows an item. Prints JSON."};
    std::string url;
    std::string folder;
    std::string work;
    int count = 1000;
    app.add_option("--url", url, "Address of the page server")->required();
    app.add_option("--folder", folder, "Where the two files lie; empty for a first sync")->required();
    app.add_option("--count", count, "Number of uploads");
    app.add_option("WORK", work, "calendar, contacts or upload")
        ->required()
        ->check(CLI::IsMember({"calendar", "contacts", "upload"}));
    CLI11_PARSE(app, argc, argv);

    curl_global_init(CURL_GLOBAL_ALL);
    bench::FloorStore store(folder);
    bench::FloorHttp http(url);
    bench::FloorWork floor(&http, &store);
    // A daemon that has synced before has its token and its connection; one that has not gets both within the measured time.
    const bool isFirst = work != "upload" && store.etags().empty();
    if (!isFirst) http.logIn();
    const double cpu = cpuMs();
    const auto begin = std::chrono::steady_clock::now();
    if (isFirst) http.logIn();
    work == "upload" ? floor.upload(count) : floor.sync(work);
    const std::chrono::duration<double, std::milli> wall = std::chrono::steady_clock::now() - begin;
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    std::cout << "{\"wallMs\":" << wall.count() << ",\"cpuMs\":" << cpuMs() - cpu
              << ",\"peakKb\":" << usage.ru_maxrss << ",\"requests\":" << http.requests()
              << ",\"written\":" << floor.written() << "}" << std::endl;
    return 0;
}

}  // namespace

int main(int argc, char** argv) {
    try {
        return readAndRun(argc, argv);
    } catch (const std::exception& error) {
        std::cerr << "bench-floor: " << error.what() << '\n';
        return 1;
    }
}
