// DeviceClock: what another process has used, and waiting for what the daemon publishes.
// Thread: the main thread.   Errors: std::runtime_error.
#pragma once

#include <sys/types.h>

#include <chrono>
#include <functional>
#include <string>

#include "platform/settings.h"

namespace bench {

// Processor time, user and system, of a process with all threads that it has or had.
double cpuMsOf(pid_t process);

// The daemon's process of this root, as its socket tells.
pid_t daemonPid();

class Stopwatch {
public:
    [[nodiscard]] double ms() const {
        return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - mBegin).count();
    }

private:
    const std::chrono::steady_clock::time_point mBegin = std::chrono::steady_clock::now();
};

// Wall and processor time of `work`, which begins with the request and ends with the daemon's last word.
struct Cost {
    double wallMs = 0;
    double cpuMs = 0;
};
Cost measure(const std::function<void()>& work);

// A watch of an integer settings key. What is written from its construction on is noticed.
class KeyWatch {
public:
    explicit KeyWatch(std::string key);
    ~KeyWatch();
    KeyWatch(const KeyWatch&) = delete;
    KeyWatch& operator=(const KeyWatch&) = delete;
    // Runs the main loop until a write of the key has left a value that `isEnd` takes.
    void wait(const std::function<bool(int)>& isEnd);

private:
    static void note(keynode_t* node, void* self);

    const std::string mKey;
    bool mIsWritten = false;
};

// The value of an integer key, 0 when it is unset.
int settingOf(const std::string& key);

// The key of what is published by the daemon about the account's kind.
std::string stateKey(int account, const std::string& kind, const std::string& name);

}  // namespace bench
