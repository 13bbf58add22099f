#include "SyncWatch.h"

#include <glib-unix.h>
#include <signal.h>

#include <algorithm>
#include <array>
#include <ctime>
#include <string>

#include "Failure.h"
#include "SyncStatus.h"

namespace sync_watch {

namespace {

// The daemon tells of every change of a state. Ages, counts, and a daemon that comes or goes are looked at as often.
constexpr unsigned kPeriodMs = 1000;
constexpr unsigned kProgressPeriodMs = 400;
constexpr const char* kOwnScreen = "\033[?1049h\033[?25l";
constexpr const char* kFormerScreen = "\033[?25h\033[?1049l";
constexpr const char* kClear = "\033[H\033[2J";

// The screen of the watch, which leaves what stood on the terminal before as it was.
class Screen {
public:
    explicit Screen(bool isDrawn) : mIsDrawn(isDrawn) {
        if (mIsDrawn) output::raw(kOwnScreen);
    }
    ~Screen() {
        if (!mIsDrawn) return;
        try {
            output::raw(kFormerScreen);
        } catch (const Failure&) {  // a terminal that is gone needs no tidying
            return;
        }
    }
    Screen(const Screen&) = delete;
    Screen& operator=(const Screen&) = delete;

private:
    const bool mIsDrawn;
};

// What wakes the main context: the daemon's notifications, the clock, and the signals that end the watch.
class Wakers {
public:
    explicit Wakers(bool* isEnding) {
        for (size_t i = 0; i < kSignals.size(); ++i)
            mSignals[i] = g_unix_signal_add(kSignals[i], end, isEnding);
        // Without notifications (no daemon yet, or no files for them) the clock shows every change a second later.
        for (const auto kind : kKindsWatched)
            static_cast<void>(vantor_pim_sync_add_state_changed_cb(kind, wake, nullptr));
    }
    ~Wakers() {
        for (const guint source : mSignals) g_source_remove(source);
        for (const auto kind : kKindsWatched)
            static_cast<void>(vantor_pim_sync_remove_state_changed_cb(kind, wake, nullptr));
    }
    Wakers(const Wakers&) = delete;
    Wakers& operator=(const Wakers&) = delete;

    // Until something may have changed.
    static void wait(unsigned atMostMs) {
        bool isOver = false;
        const guint timer = g_timeout_add(atMostMs, expire, &isOver);
        g_main_context_iteration(nullptr, /*may_block=*/TRUE);
        if (!isOver) g_source_remove(timer);
    }

private:
    static constexpr std::array kSignals{SIGINT, SIGTERM, SIGHUP};
    static constexpr std::array kKindsWatched{VANTOR_PIM_SYNC_TYPE_CALENDAR, VANTOR_PIM_SYNC_TYPE_CONTACTS};

    static void wake(vantor_pim_sync_type_e, void*) {}
    static gboolean end(gpointer isEnding) {
        *static_cast<bool*>(isEnding) = true;
        return G_SOURCE_CONTINUE;
    }
    static gboolean expire(gpointer isOver) {
        *static_cast<bool*>(isOver) = true;
        return G_SOURCE_REMOVE;
    }

    std::array<guint, kSignals.size()> mSignals{};
};

std::string jsonLine(const std::vector<SyncStatus>& all) {
    Json array = Json::array();
    for (const SyncStatus& status : all) array.push_back(sync_status::toJson(status));
    return array.dump(-1, ' ', false, Json::error_handler_t::replace) + "\n";
}

bool isBusy(const std::vector<SyncStatus>& all) {
    return std::any_of(all.begin(), all.end(),
                       [](const SyncStatus& status) { return status.state == SYNC_AGENT_STATE_IN_PROGRESS; });
}

}  // namespace

void run(int account, bool isJson) {
    bool isEnding = false;
    const Wakers wakers(&isEnding);
    // Before the screen is another: an account that nobody has is said where the person looks.
    std::vector<SyncStatus> all = sync_status::all(account);
    const bool isDrawn = terminal::isTerminal() && !isJson;
    const Screen screen(isDrawn);
    std::string shown;
    while (!isEnding) {
        const std::string text =
            isJson ? jsonLine(all) : sync_status::toText(all, terminal::columns(), time(nullptr));
        // On a screen the ages change too; a file shall not grow by them.
        const std::string state = isDrawn ? text : jsonLine(all);
        if (state != shown) {
            const char* const gap = shown.empty() || isJson ? "" : "\n";
            output::raw((isDrawn ? kClear : gap) + text);
            shown = state;
        }
        Wakers::wait(isBusy(all) ? kProgressPeriodMs : kPeriodMs);
        all = sync_status::all(account);
    }
}

}  // namespace sync_watch
