// RetryGate: until when the runs that nobody asked for leave a server alone. A server that asks for a pause gets it; after a run that
// failed for the server's or the network's sake the pause doubles, up to an hour, and is spread so that devices do not come together.
// Owner: an account, one for each kind of data.   Threads: any.   Units: seconds, of a clock that goes on while the device sleeps.
#pragma once

#include <cstdint>
#include <mutex>

class RetryGate {
public:
    // An answer said so (Retry-After); at most a day.
    void askedToWait(long seconds);
    void runFailed();
    // A run went well, or a client asks for one.
    void open();

    // 0 when it is open.
    [[nodiscard]] int secondsLeft() const;
    // Whether it is the server that asked.
    [[nodiscard]] bool isAskedToWait() const;

private:
    mutable std::mutex mMutex;
    int64_t mAskedUntil = 0;
    int64_t mFailedUntil = 0;
    int mFailures = 0;
};
