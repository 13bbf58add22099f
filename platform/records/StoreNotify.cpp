// Change callbacks: what other writers did since the last look.
#include <algorithm>

#include "Store.h"
#include "platform/error.h"
#include "platform/root.h"

namespace platform::records {

int Store::addCallback(const View& view, Callback callback, void* userData) {
    const Watcher watcher{&view, callback, userData};
    if (callback == nullptr || std::find(mWatchers.begin(), mWatchers.end(), watcher) != mWatchers.end()) {
        return PLATFORM_ERROR_INVALID_PARAMETER;
    }
    if (!mWatch) {
        auto watch = std::make_unique<StoreWatch>(rootedPath(mFile), [this] { look(); });
        if (!watch->isWatching()) return PLATFORM_ERROR_IO;
        int seen = 0;
        if (const int code = currentVersion(&seen); code != PLATFORM_ERROR_NONE) return code;
        mSeen = seen;
        mWatch = std::move(watch);
    }
    mWatchers.push_back(watcher);
    return PLATFORM_ERROR_NONE;
}

int Store::removeCallback(const View& view, Callback callback, void* userData) {
    if (std::erase(mWatchers, Watcher{&view, callback, userData}) == 0) return PLATFORM_ERROR_NOT_FOUND;
    if (mWatchers.empty()) mWatch.reset();
    return PLATFORM_ERROR_NONE;
}

// The views that others wrote, as bits. A write that is no longer noted may have been anybody's.
int Store::readForeignWrites(uint64_t* views) {
    constexpr uint64_t kEverything = ~uint64_t{0};
    Statement statement =
        mConnection.prepare("SELECT version, writer, views FROM writes WHERE version > ? ORDER BY version");
    statement.bind(mSeen);
    int64_t seen = mSeen;
    int code = statement.step();
    for (; code == SQLITE_ROW; code = statement.step()) {
        if (statement.integer(0) > seen + 1) *views = kEverything;
        seen = statement.integer(0);
        if (statement.integer(1) != mWriterId) *views |= static_cast<uint64_t>(statement.integer(2));
    }
    if (code != SQLITE_DONE) return code;
    mSeen = seen;
    return SQLITE_OK;
}

void Store::look() {
    uint64_t written = 0;
    {
        // The main loop waits for nobody: a busy store is looked at again a little later.
        const std::unique_lock lock(mMutex, std::try_to_lock);
        if (!lock.owns_lock()) return mWatch->again();
        if (!mConnection.isOpen()) return;
        mConnection.setBusyTimeout(0);
        const int code = readForeignWrites(&written);
        mConnection.setBusyTimeout(kBusyTimeoutMs);
        if (code != SQLITE_OK) return mWatch->again();
    }
    const std::vector<Watcher> watchers = mWatchers;
    for (const Watcher& watcher : watchers) {
        const bool alive = std::find(mWatchers.begin(), mWatchers.end(), watcher) != mWatchers.end();
        const auto bit =
            static_cast<uint64_t>(std::find(mViews.begin(), mViews.end(), watcher.view) - mViews.begin());
        if (alive && (written >> bit & 1) != 0) watcher.callback(watcher.view->uri, watcher.userData);
    }
}

}  // namespace platform::records
