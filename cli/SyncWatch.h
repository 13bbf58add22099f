// SyncWatch.h: the status, shown anew at every change until the program is told to end.
#pragma once

namespace sync_watch {

// On a terminal the screen is redrawn; elsewhere each new state follows the one before, as JSON one array a line.
// `account` 0: all. Returns at SIGINT or SIGTERM.
void run(int account, bool isJson);

}  // namespace sync_watch
