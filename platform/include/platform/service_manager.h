// service_manager.h: what the daemon tells the service manager that started it (systemd's notification socket), and
// how the process keeps its secrets from others. Without a service manager every call is harmless and does nothing.
// Threads: any, but for watchMainLoop.
#pragma once

namespace platform {

// The service answers from now on. `status` is a line for people.
void tellReady(const char* status);
// The service has begun to end.
void tellStopping();
// What the service does at the moment.
void tellStatus(const char* status);

// Main thread: while the default main loop turns, the service manager hears of it twice in each of its watchdog
// intervals.
void watchMainLoop();

// Neither a core dump nor another process of this user gets at the memory of this one. A debugger that started the
// process has it already and keeps it.
void protectMemory();

}  // namespace platform
