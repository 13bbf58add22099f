// SyncDirector: one operation that runs a whole sync half on the calling (worker) thread.
// Returns a code of SyncResult.h: 0 success, -5 token failure, other negatives failure, 1 stopped.
#pragma once

class SyncDirector {
  public:
    virtual ~SyncDirector() = default;
    virtual int run() = 0;
};

// IStopQuery: answers whether the running request has been stopped. Any thread.
class IStopQuery {
  public:
    virtual ~IStopQuery() = default;
    [[nodiscard]] virtual bool isStopped() = 0;
};
