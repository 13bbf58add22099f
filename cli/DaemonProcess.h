// DaemonProcess.h: a daemon that this tool started. It is detached: a session of its own, no descriptor of the tool,
// its output in a log file. The object only watches it; destroying the object leaves the daemon alone.
#pragma once

#include <sys/types.h>

#include <string>

class DaemonProcess {
public:
    // Standard output and standard error of the daemon go to this file, below the root. One of more than 10 MB becomes
    // daemon.log.1 at a start.
    static constexpr const char* kLog = "/opt/usr/data/vantor-pim-sync/daemon.log";

    // The program beside the tool's own, else from PATH. A Failure when it cannot be run.
    static DaemonProcess spawn();

    // Whether it ended within the time.
    bool waitForEnd(int timeoutMs);
    // Valid after waitForEnd() was true.
    [[nodiscard]] std::string howItEnded() const;
    // Ends it for good, for one that never answered.
    void kill();

private:
    explicit DaemonProcess(pid_t pid) : mPid(pid) {}

    pid_t mPid;
    int mStatus = 0;
    bool mHasEnded = false;
};
