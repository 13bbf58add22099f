// SyncProgress: how far a download is, published for people who wait for it, in the settings key
// "memory/vantor-pim-sync/ACCOUNT/KIND/progress" (str, such as "Work: 3 pages, 150 items"). A sync that is over soon writes
// nothing: the key costs a file, and nobody reads that fast. SyncRunStatus empties it at the end of the run.
// Owner: a director.   Threads: the worker's.   Errors: a key that cannot be written is left; the sync matters more.
#pragma once

#include <chrono>
#include <cstddef>
#include <string>

#include "common/vantor_pim_sync.h"

class SyncProgress {
public:
    SyncProgress(int accountId, vantor_pim_sync_type_e type);

    // A run begins: the time before the first word counts from here.
    void beginRun();
    // What the following pages belong to, by the name that people know it by.
    void beginPart(const std::string& name);
    void addPage(size_t items);

private:
    using Clock = std::chrono::steady_clock;

    const std::string mKey;
    std::string mPart;
    size_t mPages = 0;
    size_t mItems = 0;
    Clock::time_point mWritten;
};
