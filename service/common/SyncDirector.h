// SyncDirector: one operation that runs a whole sync half on the calling (worker) thread.
// Returns a code of SyncResult.h: 0 success, -5 token failure, other negatives failure, 1 stopped.
#pragma once

#include <string>

class SyncDirector {
public:
    virtual ~SyncDirector() = default;
    virtual int run() = 0;
    // Why the last run failed, or what it had to leave, for people, never a secret; else empty. Main thread, after the run.
    [[nodiscard]] virtual std::string lastFailure() const { return {}; }
    // Whether a run that failed did so for the server's or the network's sake, so that the next one had better wait. As above.
    [[nodiscard]] virtual bool isInTrouble() const { return true; }
    // What the server refused for good is tried again. Main thread, between runs.
    virtual void forgetRefusals() {}
};

// IStopQuery: answers whether the running request has been stopped. Any thread.
class IStopQuery {
public:
    virtual ~IStopQuery() = default;
    [[nodiscard]] virtual bool isStopped() = 0;
};
