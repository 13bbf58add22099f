// PendingCounts.h: what waits on the device to go up, counted from the stores while the daemon is down.
#pragma once

struct PendingCounts {
    int dirty = 0;
    int deleted = 0;
};

namespace pending_counts {

PendingCounts calendarOf(int accountId);
PendingCounts contactsOf(int accountId);

}  // namespace pending_counts
