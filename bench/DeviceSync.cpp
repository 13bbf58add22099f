#include "DeviceSync.h"

#include <fcntl.h>
#include <spawn.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <stdexcept>
#include <thread>
#include <vector>

#include "common/vantor_pim_sync.h"

namespace bench {

namespace {

constexpr int kMostTries = 5000;

vantor_pim_sync_type_e typeOf(const std::string& kind) {
    return kind == "contacts" ? VANTOR_PIM_SYNC_TYPE_CONTACTS : VANTOR_PIM_SYNC_TYPE_CALENDAR;
}

void requireOk(int account, const std::string& kind, const char* half) {
    const int result = settingOf(stateKey(account, kind, half));
    if (result != 0)
        throw std::runtime_error("the sync of " + kind + " failed: " + half + " is " +
                                 std::to_string(result));
}

// What a program is started with that outlives its starter: none of its pipes.
class Detached {
public:
    Detached() {
        posix_spawn_file_actions_init(&mActions);
        for (const int fd : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO})
            posix_spawn_file_actions_addopen(&mActions, fd, "/dev/null", O_RDWR, 0);
    }
    ~Detached() { posix_spawn_file_actions_destroy(&mActions); }
    Detached(const Detached&) = delete;
    Detached& operator=(const Detached&) = delete;
    [[nodiscard]] const posix_spawn_file_actions_t* actions() const { return &mActions; }

private:
    posix_spawn_file_actions_t mActions{};
};

}  // namespace

Cost syncOnce(int account, const std::string& kind) {
    if (vantor_pim_sync_initialize() != 0) throw std::runtime_error("the daemon cannot be reached");
    KeyWatch ended(stateKey(account, kind, "ended"));
    const int before = settingOf(stateKey(account, kind, "ended"));
    const Cost cost = measure([&] {
        if (vantor_pim_sync_start(account, typeOf(kind)) != 0)
            throw std::runtime_error("the sync was refused");
        ended.wait([before](int run) { return run > before; });
    });
    for (const char* half : {"down_result", "up_result"}) requireOk(account, kind, half);
    return cost;
}

double firstAnswerMs(int account, const std::string& daemon) {
    std::string program = daemon;
    char* arguments[] = {program.data(), nullptr};
    pid_t child = 0;
    const Detached detached;
    const Stopwatch clock;
    if (posix_spawn(&child, program.c_str(), detached.actions(), nullptr, arguments, environ) != 0)
        throw std::runtime_error("cannot start " + daemon);
    for (int tries = 0; tries < kMostTries; ++tries) {
        int state = 0;
        if (vantor_pim_sync_get_state(account, VANTOR_PIM_SYNC_TYPE_CALENDAR, &state) == 0) return clock.ms();
        std::this_thread::sleep_for(std::chrono::microseconds(200));
    }
    throw std::runtime_error("the daemon does not answer");
}

Latency stateLatency(int account, int count) {
    std::vector<double> times;
    times.reserve(static_cast<size_t>(count));
    for (int i = 0; i < count; ++i) {
        int state = 0;
        const Stopwatch clock;
        if (vantor_pim_sync_get_state(account, VANTOR_PIM_SYNC_TYPE_CALENDAR, &state) != 0)
            throw std::runtime_error("get_state failed");
        times.push_back(clock.ms() * 1e3);
    }
    if (times.empty()) return {};
    std::sort(times.begin(), times.end());
    return {times[times.size() / 2], times[times.size() * 99 / 100]};
}

}  // namespace bench
