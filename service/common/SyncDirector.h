// SyncDirector: one operation that runs a whole sync half on the calling (worker) thread.
// Returns a code of SyncResult.h: 0 success, -5 token failure, other negatives failure, 1 stopped.
#pragma once

#include <string>

class SyncDirector {
public:
    virtual ~SyncDirector() = default;
    virtual int run() = 0;
    // Why the last run failed, for people, never a secret; empty after a run that ended well. Main thread, after the run.
    [[nodiscard]] virtual std::string lastFailure() const { return {}; }
};

// IStopQuery: answers whether the running request has been stopped. Any thread.
class IStopQuery {
public:
    virtual ~IStopQuery() = default;
    [[nodiscard]] virtual bool isStopped() = 0;
};
