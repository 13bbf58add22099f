// SyncWait.h: waiting for the end of a sync, as long as the daemon that runs it lives.
#pragma once

#include <optional>

class SyncState;

// Made before the sync is started, so that a daemon that goes away in between is noticed. Main thread only.
class SyncWait {
public:
    SyncWait();

    // Returns when the run (or a later one) has ended. A Failure when the daemon goes away.
    void untilEnded(const SyncState& state, int run) const;

private:
    [[nodiscard]] bool isSameDaemon() const;

    std::optional<int> mDaemonPid;
};
