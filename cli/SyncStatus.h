// SyncStatus.h: how one kind of one account stands: from the daemon while it runs, else from its stores.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "Output.h"
#include "PendingCounts.h"
#include "common/vantor_pim_sync.h"

struct SyncStatus {
    int account = 0;
    vantor_pim_sync_type_e kind = VANTOR_PIM_SYNC_TYPE_CALENDAR;
    bool isServed = false;   // the daemon runs
    bool isEnabled = false;  // the kind is switched on
    int state = SYNC_AGENT_STATE_NONE;
    int64_t lastSyncSec = 0;  // since 1970, 0: never
    int64_t nextSyncSec = 0;
    PendingCounts pending;
    std::string failure;   // of the last run, "" for none
    std::string progress;  // of a run that takes long
};

namespace sync_status {

// Every account that the account service or the daemon has; `only` 0: all. A Failure for an account that nobody has.
std::vector<SyncStatus> all(int only);

Json toJson(const SyncStatus& status);
// What a person should do, "" when nothing is wrong.
std::string adviceFor(const SyncStatus& status);
// A table, and below it what went wrong with what to do about it. `columns` 0: as wide as it needs to be.
std::string toText(const std::vector<SyncStatus>& all, size_t columns, int64_t nowSec);

}  // namespace sync_status
