// DeviceSync: the daemon's work and answers as a client of the call interface sees them.
// Thread: the main thread.   Errors: std::runtime_error.
#pragma once

#include <string>

#include "DeviceClock.h"

namespace bench {

// One sync of the kind ("calendar" or "contacts"), from the request until the daemon says that it has ended. Fails when it did
// not end well.
Cost syncOnce(int account, const std::string& kind);

// Adds `count` events to the account's first calendar in one write, and waits until the daemon, which notices by itself, says that
// nothing waits any more. Measured from the end of the write.
Cost uploadEvents(int account, int count);

// Milliseconds from the start of the program `daemon` until a call is answered. The daemon goes on running.
double firstAnswerMs(int account, const std::string& daemon);

// Microseconds of `count` get_state calls over one connection.
struct Latency {
    double medianUs = 0;
    double p99Us = 0;
};
Latency stateLatency(int account, int count);

}  // namespace bench
