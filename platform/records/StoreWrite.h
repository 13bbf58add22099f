// Store::Write: one writing call. Begins a transaction, or a savepoint in the thread's open one; everything is undone unless
// finish() succeeds. The store's version moves only when something was written.
#pragma once

#include <unordered_map>

#include "Store.h"

namespace platform::records {

class Store::Write {
public:
    Write(Store& store, const record_write_options_s& options);
    ~Write();
    Write(const Write&) = delete;
    Write& operator=(const Write&) = delete;

    [[nodiscard]] int begun() const { return mBegun; }
    [[nodiscard]] int version() const { return mVersion; }
    [[nodiscard]] bool bySync() const { return mOptions.by_sync; }
    // The expected version of the record at `position`.
    [[nodiscard]] int expected(size_t position) const;
    // Notes that records of the view were written.
    void touch(const View& view);
    // Stores the version and commits. `result` is the call's so far.
    [[nodiscard]] int finish(int result);

private:
    Store& mStore;
    const record_write_options_s& mOptions;
    std::unique_lock<std::recursive_mutex> mLock;
    const bool mNested;
    const FileKeep::Mark mFilesBefore;
    int mBegun;
    int mVersion = 0;
    uint64_t mViews = 0;
    bool mDone = false;
};

// The version of each thread's own last write of a store.
std::unordered_map<const Store*, int>& lastVersions();

}  // namespace platform::records
