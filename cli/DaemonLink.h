// DaemonLink.h: finding, starting and ending the daemon of this root.
#pragma once

#include <optional>
#include <string>

namespace daemon_link {

// The process that serves the socket of this root; nothing when nobody does. Connects, but asks nothing: it tells
// whether a daemon is alive, also one that is busy. A Failure when the socket refuses this user.
std::optional<int> servingPid();
// Whether the daemon answers a call within the time.
bool isAnswering(int timeoutMs);

// A Failure that tells how to start it, when it does not run.
void requireRunning();
// How a person starts it here.
std::string startAdvice();

// Starts the daemon of a private root, detached from the tool, and returns when it answers. A Failure when it ends
// early (it does so without any account), or on a system install. Returns false when it ran already.
bool start();
// Asks the daemon to end and returns when it is gone. Returns false when it did not run.
bool stop();

// Returns when the daemon of a system install answers, which its service manager starts with the first account. A
// Failure when it does not in time.
void awaitService();

// Like start(), but a daemon that runs is enough on a system install as well.
bool ensureRunning();

}  // namespace daemon_link
