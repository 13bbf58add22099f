#include "platform/alarm.h"

#include <glib-unix.h>
#include <sys/timerfd.h>
#include <unistd.h>

#include <algorithm>
#include <fstream>
#include <string>
#include <vector>

#include "../base/SqlStore.h"
#include "AlarmTime.h"
#include "platform/error.h"
#include "platform/log.h"

using platform::SqlStore;

namespace {

constexpr int64_t kMsPerSecond = 1000;
constexpr int64_t kRetryMs = 60 * kMsPerSecond;  // of a store that failed
constexpr const char* kTag = "PLATFORM_ALARM";

int64_t nowMs(clockid_t clock) {
    timespec now{};
    clock_gettime(clock, &now);
    return now.tv_sec * kMsPerSecond + now.tv_nsec / 1'000'000;
}

std::string bootId() {
    std::ifstream file("/proc/sys/kernel/random/boot_id");
    std::string id;
    file >> id;
    return id;
}

struct Alarm {
    int64_t id = 0;
    int64_t interval = 0;
    int64_t due = 0;
};

// The alarms of this process' application.
class AlarmManager {
public:
    static AlarmManager& instance() {
        static AlarmManager* const manager = new AlarmManager;
        return *manager;
    }

    int init(const char* application) {
        if (application == nullptr || *application == '\0') return PLATFORM_ERROR_INVALID_PARAMETER;
        mApplication = application;
        if (const int code = mStore.open(); code != PLATFORM_ERROR_NONE) return code;
        if (const int code = rebase(); code != PLATFORM_ERROR_NONE) return code;
        return arm();
    }

    int setCallback(alarm_cb_t callback, void* userParam) {
        mCallback = callback;
        mUserParam = userParam;
        return arm();
    }

    int add(time_t first, time_t interval, alarm_id_t* id) {
        if (mApplication.empty()) return PLATFORM_ERROR_FAILED;
        const int code =
            mStore.write({{"INSERT INTO alarms(application, interval, due, boot) VALUES(?, ?, ?, ?)",
                           {mApplication, int64_t{interval} * kMsPerSecond,
                            nowMs(CLOCK_BOOTTIME) + int64_t{first} * kMsPerSecond, bootId()}}});
        if (code != PLATFORM_ERROR_NONE) return code;
        *id = static_cast<alarm_id_t>(mStore.lastRowId());
        return arm();
    }

    int remove(alarm_id_t id) {
        int removed = 0;
        const int code = mStore.write(
            {{"DELETE FROM alarms WHERE id = ? AND application = ?", {int64_t{id}, mApplication}}}, &removed);
        if (code != PLATFORM_ERROR_NONE) return code;
        return removed > 0 ? arm() : PLATFORM_ERROR_NOT_FOUND;
    }

    [[nodiscard]] int list(std::vector<Alarm>* alarms) {
        return mStore.read("SELECT id, interval, due FROM alarms WHERE application = ? ORDER BY id",
                           {mApplication}, [alarms](sqlite3_stmt* row) {
                               alarms->push_back({sqlite3_column_int64(row, 0), sqlite3_column_int64(row, 1),
                                                  sqlite3_column_int64(row, 2)});
                               return true;
                           });
    }

private:
    // Alarms that were set in another boot get a time of this one.
    int rebase() {
        return mStore.write(
            {{"UPDATE alarms SET due = ? + interval, boot = ? WHERE application = ? AND boot <> ?",
              {nowMs(CLOCK_BOOTTIME), bootId(), mApplication, bootId()}}});
    }

    // Sets the timer to the earliest alarm; off while there is nobody to call.
    int arm() {
        if (mDescriptor == -1) {
            mDescriptor = timerfd_create(CLOCK_BOOTTIME, TFD_CLOEXEC | TFD_NONBLOCK);
            if (mDescriptor == -1) return PLATFORM_ERROR_IO;
            g_unix_fd_add(mDescriptor, G_IO_IN, onTimer, this);
        }
        std::vector<Alarm> alarms;
        if (const int code = list(&alarms); code != PLATFORM_ERROR_NONE) return code;
        const auto first = std::min_element(alarms.begin(), alarms.end(),
                                            [](const Alarm& a, const Alarm& b) { return a.due < b.due; });
        if (first == alarms.end() || mCallback == nullptr) return setTimer(0);
        return setTimer(std::max<int64_t>(first->due, 1));
    }

    // 0: off.
    int setTimer(int64_t due) const {
        itimerspec time{};
        time.it_value.tv_sec = due / kMsPerSecond;
        time.it_value.tv_nsec = due % kMsPerSecond * 1'000'000;
        return timerfd_settime(mDescriptor, TFD_TIMER_ABSTIME, &time, nullptr) == 0 ? PLATFORM_ERROR_NONE
                                                                                    : PLATFORM_ERROR_IO;
    }

    static gboolean onTimer(gint fd, GIOCondition, gpointer self) {
        uint64_t expirations = 0;
        (void)!read(fd, &expirations, sizeof expirations);
        static_cast<AlarmManager*>(self)->deliver();
        return G_SOURCE_CONTINUE;
    }

    void deliver() {
        const bool isStored = deliverDue(nowMs(CLOCK_BOOTTIME));
        // What could not be read or stored is still due: at once again would be a loop.
        if (isStored && arm() == PLATFORM_ERROR_NONE) return;
        dlog_print(DLOG_ERROR, kTag, "the alarms' store fails, they are looked at again in %lld s",
                   static_cast<long long>(kRetryMs / kMsPerSecond));
        if (setTimer(nowMs(CLOCK_BOOTTIME) + kRetryMs) != PLATFORM_ERROR_NONE)
            dlog_print(DLOG_ERROR, kTag, "the timer cannot be set");
    }

    // Whether the store took and told everything.
    bool deliverDue(int64_t now) {
        std::vector<Alarm> alarms;
        if (list(&alarms) != PLATFORM_ERROR_NONE) return false;
        bool isStored = true;
        for (const Alarm& alarm : alarms) {
            if (alarm.due > now || mCallback == nullptr) continue;
            // The next time is stored first: a callback that ends the process is not called again at once.
            int kept = 0;
            const int code =
                alarm.interval > 0
                    ? mStore.write(
                          {{"UPDATE alarms SET due = ? WHERE id = ?",
                            {platform::alarm::nextExpiry(alarm.due, alarm.interval, now), alarm.id}}},
                          &kept)
                    : mStore.write({{"DELETE FROM alarms WHERE id = ?", {alarm.id}}}, &kept);
            isStored = isStored && code == PLATFORM_ERROR_NONE;
            // An alarm that an earlier callback of this round removed is not delivered.
            if (code == PLATFORM_ERROR_NONE && kept > 0)
                mCallback(static_cast<alarm_id_t>(alarm.id), mUserParam);
        }
        return isStored;
    }

    SqlStore mStore{
        "/opt/usr/data/alarms/alarms.db",
        db_schema_s{"CREATE TABLE alarms(id INTEGER PRIMARY KEY AUTOINCREMENT, application TEXT NOT NULL, "
                    "interval INTEGER NOT NULL, due INTEGER NOT NULL, boot TEXT NOT NULL)"}};
    std::string mApplication;
    alarm_cb_t mCallback = nullptr;
    void* mUserParam = nullptr;
    int mDescriptor = -1;
};

}  // namespace

int alarmmgr_init(const char* application) {
    return AlarmManager::instance().init(application);
}

int alarmmgr_set_cb(alarm_cb_t handler, void* user_param) {
    return AlarmManager::instance().setCallback(handler, user_param);
}

int alarmmgr_add_alarm(int alarm_type, time_t trigger_at_time, time_t interval, const char* /*destination*/,
                       alarm_id_t* id) {
    constexpr time_t kMostSeconds = 10LL * 366 * 24 * 3600;
    const auto sane = [](time_t seconds) { return seconds >= 0 && seconds <= kMostSeconds; };
    if (alarm_type != 0 || id == nullptr || !sane(trigger_at_time) || !sane(interval)) {
        return PLATFORM_ERROR_INVALID_PARAMETER;
    }
    return AlarmManager::instance().add(trigger_at_time, interval, id);
}

int alarmmgr_remove_alarm(alarm_id_t id) {
    return AlarmManager::instance().remove(id);
}

int alarmmgr_enum_alarm_ids(alarm_enum_fn_t fn, void* user_param) {
    if (fn == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    std::vector<Alarm> alarms;
    if (const int code = AlarmManager::instance().list(&alarms); code != PLATFORM_ERROR_NONE) return code;
    for (const Alarm& alarm : alarms) fn(static_cast<alarm_id_t>(alarm.id), user_param);
    return PLATFORM_ERROR_NONE;
}

int alarmmgr_get_next_expiry(alarm_id_t id, time_t* expiry) {
    if (expiry == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    std::vector<Alarm> alarms;
    if (const int code = AlarmManager::instance().list(&alarms); code != PLATFORM_ERROR_NONE) return code;
    for (const Alarm& alarm : alarms) {
        if (alarm.id != id) continue;
        *expiry = (nowMs(CLOCK_REALTIME) + alarm.due - nowMs(CLOCK_BOOTTIME)) / kMsPerSecond;
        return PLATFORM_ERROR_NONE;
    }
    return PLATFORM_ERROR_NOT_FOUND;
}
