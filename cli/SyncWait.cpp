#include "SyncWait.h"

#include <glib.h>

#include <string>
#include <utility>

#include "DaemonLink.h"
#include "Failure.h"
#include "Output.h"
#include "SyncClient.h"
#include "SyncState.h"
#include "platform/error.h"
#include "platform/settings.h"

namespace {

constexpr unsigned kLivenessPeriodMs = 300;
// So many looks in a row at a daemon that runs no sync and says nothing of one that ended: it cannot write its keys.
constexpr int kSilentLooks = 10;

// Being called is enough: it wakes the main context, and the loop looks at the key itself.
void wake(keynode_t*, void*) {}

// A watch of one settings key.
class Watch {
public:
    explicit Watch(std::string key) : mKey(std::move(key)) {
        check(vconf_notify_key_changed(mKey.c_str(), wake, nullptr), "watching " + mKey);
    }
    ~Watch() { vconf_ignore_key_changed(mKey.c_str(), wake); }
    Watch(const Watch&) = delete;
    Watch& operator=(const Watch&) = delete;

private:
    std::string mKey;
};

// Sets a flag again and again.
class Ticker {
public:
    Ticker() : mSource(g_timeout_add(kLivenessPeriodMs, tick, &mIsDue)) {}
    ~Ticker() { g_source_remove(mSource); }
    Ticker(const Ticker&) = delete;
    Ticker& operator=(const Ticker&) = delete;
    bool take() { return std::exchange(mIsDue, false); }

private:
    static gboolean tick(gpointer isDue) {
        *static_cast<bool*>(isDue) = true;
        return G_SOURCE_CONTINUE;
    }

    bool mIsDue = false;
    guint mSource;
};

// Whatever comes next on the terminal begins on a line of its own.
struct PassingProgress {
    PassingProgress() = default;
    ~PassingProgress() { output::passingProgress(""); }
    PassingProgress(const PassingProgress&) = delete;
    PassingProgress& operator=(const PassingProgress&) = delete;
};

}  // namespace

SyncWait::SyncWait() : mDaemonPid(daemon_link::servingPid()) {}

bool SyncWait::isSameDaemon() const {
    const std::optional<int> now = daemon_link::servingPid();
    return now && now == mDaemonPid;
}

void SyncWait::untilEnded(const SyncState& state, int run) const {
    const Watch watch(state.endedKey());
    Ticker ticker;
    const PassingProgress cleared;
    bool isAlive = true;
    int silentLooks = 0;
    while (state.ended() < run) {
        if (!isAlive) throw Failure("the daemon ended before the sync did; its log tells why");
        g_main_context_iteration(nullptr, /*may_block=*/TRUE);
        // Looked at before the key is read again: a daemon may end right after a sync that ended well.
        if (!ticker.take()) continue;
        isAlive = isSameDaemon();
        if (const std::string progress = state.progress(); !progress.empty())
            output::passingProgress(sync_client::kindName(state.kind()) + ": " + progress);
        const bool isRunning =
            isAlive && sync_client::state(state.accountId(), state.kind()) == SYNC_AGENT_STATE_IN_PROGRESS;
        silentLooks = isRunning ? 0 : silentLooks + 1;
        if (isAlive && silentLooks > kSilentLooks) {
            throw Failure(
                "the sync has ended but the daemon could not publish how; free some storage, its log tells "
                "more");
        }
    }
}
