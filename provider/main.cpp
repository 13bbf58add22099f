// vantor-pim-provider: command line, signals, and the state file.
#include <fcntl.h>
#include <signal.h>
#include <unistd.h>

#include <CLI/CLI.hpp>
#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <sstream>

#include "ProviderServer.h"
#include "Seed.h"

namespace {

using provider::Json;

constexpr std::size_t kMaxSeedEvents = 1'000'000;

Json readJson(const std::string& file) {
    std::ifstream in(file);
    if (!in) throw std::runtime_error("cannot read " + file);
    Json body = Json::parse(in, nullptr, false);
    if (body.is_discarded()) throw std::runtime_error(file + " is not JSON");
    return body;
}

// Whole or not at all: a crash while writing leaves the old file. It holds tokens, so nobody else may read it.
void writeState(const std::string& file, const Json& state) {
    const std::string temporary = file + ".new";
    const std::string text = state.dump(-1, ' ', false, Json::error_handler_t::replace);
    std::remove(temporary.c_str());  // of a run that was cut short, with whatever mode it has
    const int fd = open(temporary.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600);
    std::FILE* out = fd != -1 ? fdopen(fd, "w") : nullptr;
    if (out == nullptr) throw std::runtime_error("cannot write " + temporary);
    const bool isWritten = std::fwrite(text.data(), 1, text.size(), out) == text.size() &&
                           std::fflush(out) == 0 && fsync(fileno(out)) == 0;
    if (std::fclose(out) != 0 || !isWritten || std::rename(temporary.c_str(), file.c_str()) != 0) {
        std::remove(temporary.c_str());
        throw std::runtime_error("cannot write " + file);
    }
}

void fill(provider::Store& store, const std::string& seed, const std::string& stateFile) {
    if (!stateFile.empty() && std::filesystem::exists(stateFile)) {
        store.load(readJson(stateFile));
        return;
    }
    const bool isNumber =
        !seed.empty() && seed.size() < 9 &&
        std::all_of(seed.begin(), seed.end(), [](unsigned char c) { return std::isdigit(c) != 0; });
    if (seed == "sample") {
        provider::seedSample(store);
    } else if (isNumber) {
        const std::size_t events = std::stoul(seed);
        if (events > kMaxSeedEvents) throw std::runtime_error("--seed takes at most 1000000 events");
        provider::seedBulk(store, events);
    } else {
        store.load(readJson(seed));
    }
}

int run(const provider::ServerOptions& options, const std::string& seed, const std::string& stateFile) {
    // Blocked before any thread is made, so that only the wait below receives them.
    sigset_t signals;
    sigemptyset(&signals);
    sigaddset(&signals, SIGTERM);
    sigaddset(&signals, SIGINT);
    pthread_sigmask(SIG_BLOCK, &signals, nullptr);

    provider::ProviderServer server(options);
    fill(server.store(), seed, stateFile);
    server.start();
    std::cout << server.ready().dump() << std::endl;
    int received = 0;
    sigwait(&signals, &received);
    server.stop();
    if (!stateFile.empty()) writeState(stateFile, server.store().dump());
    return 0;
}

int readAndRun(int argc, char** argv) {
    CLI::App app{
        "A cloud account provider on this machine: accounts, calendars and events over REST, for demos, "
        "tests and benchmarks. Prints one line of JSON when it is ready."};
    app.footer(
        "Examples:\n  vantor-pim-provider --seed sample\n  vantor-pim-provider --port 8080 --seed 5000 "
        "--tls");
    provider::ServerOptions options;
    std::string seed = "sample";
    std::string stateFile;
    int latencyMs = 0;
    int tokenLifetime = 3600;
    app.add_option("--port", options.port, "Port on 127.0.0.1; 0 takes a free one")
        ->check(CLI::Range(0, 65535));
    app.add_option("--seed", seed, "'sample', a number of events, or a file as written by --state");
    app.add_flag("--tls", options.isTls, "HTTPS with a self-signed certificate made at start");
    app.add_option("--latency", latencyMs, "Milliseconds added to each request")->check(CLI::Range(0, 60000));
    app.add_option("--state", stateFile, "File to start from when it exists, written at the end");
    app.add_option("--token-lifetime", tokenLifetime, "Seconds that an access token is valid")
        ->check(CLI::Range(1, 1000000));
    app.add_flag("--quiet", options.isQuiet, "No line per request on standard error");
    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& error) {
        return app.exit(error) == 0 ? 0 : 2;
    }
    options.latency = std::chrono::milliseconds(latencyMs);
    options.tokenLifetime = std::chrono::seconds(tokenLifetime);
    return run(options, seed, stateFile);
}

}  // namespace

int main(int argc, char** argv) {
    try {
        return readAndRun(argc, argv);
    } catch (const provider::ApiError& error) {
        std::fprintf(stderr, "vantor-pim-provider: %s\n", error.message.c_str());
    } catch (const std::exception& error) {
        std::fprintf(stderr, "vantor-pim-provider: %s\n", error.what());
    }
    return 1;
}
