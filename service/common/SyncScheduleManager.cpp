#include "common/SyncScheduleManager.h"

#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "platform/error.h"
#include "platform/settings.h"

using sync_result::kFailed;
using sync_result::kOk;

SyncScheduleManager& SyncScheduleManager::getInstance() {
    static SyncScheduleManager* const instance = new SyncScheduleManager;
    return *instance;
}

SyncScheduleManager::SyncScheduleManager() {
    initialize();
}

void SyncScheduleManager::initialize() {
    if (alarmmgr_init("vantor-pim-sync") < 0) SYNC_ERR("alarmmgr_init() failed");
    if (alarmmgr_set_cb(alarmCallback, this) < 0) SYNC_ERR("alarmmgr_set_cb() failed");
    // What an earlier run left behind: every alarm is made anew by the accounts that are loaded.
    if (alarmmgr_enum_alarm_ids(alarmClearCallback, nullptr) < 0)
        SYNC_ERR("alarmmgr_enum_alarm_ids() failed");
}

int SyncScheduleManager::alarmClearCallback(alarm_id_t id, void* /*userParam*/) {
    SYNC_ERR("remove alarm id(%d)", id);
    const int ret = alarmmgr_remove_alarm(id);
    if (ret != 0) SYNC_ERR("alarmmgr_remove_alarm() failed(ret:%d)", ret);
    return ret;
}

int SyncScheduleManager::addSchedule(ISyncScheduleListener* listener, int period) {
    constexpr time_t kSecondsPerMinute = 60;
    if (listener == nullptr) {
        SYNC_ERR("invalid parameter");
        return kFailed;
    }
    if (period < 1) return kOk;
    alarm_id_t id = 0;
    const time_t seconds = period * kSecondsPerMinute;
    if (alarmmgr_add_alarm(0, seconds, seconds, nullptr, &id) < 0) {
        SYNC_ERR("alarmmgr_add_alarm() failed");
        return kFailed;
    }
    const bool bret = mListeners.emplace(id, listener).second;
    SYNC_ASSERT_TEXT(bret, "bret");
    return kOk;
}

int SyncScheduleManager::removeSchedule(ISyncScheduleListener* listener) {
    alarm_id_t id = 0;
    for (const auto& [alarm, owner] : mListeners) {
        if (owner == listener) {
            id = alarm;
            break;
        }
    }
    if (id <= 0) {
        SYNC_ERR("alarm_id not found");
        return kFailed;
    }
    if (alarmmgr_remove_alarm(id) < 0) {
        SYNC_ERR("alarmmgr_remove_alarm() failed");
        return kFailed;
    }
    mListeners.erase(id);
    return kOk;
}

void SyncScheduleManager::forget(const ISyncScheduleListener* listener) {
    for (auto& [alarm, owner] : mListeners) {
        if (owner == listener) owner = nullptr;
    }
}

int SyncScheduleManager::nextAlarm(const ISyncScheduleListener* listener) const {
    for (const auto& [id, owner] : mListeners) {
        time_t expiry = 0;
        if (owner == listener && alarmmgr_get_next_expiry(id, &expiry) == PLATFORM_ERROR_NONE) {
            return static_cast<int>(expiry);
        }
    }
    return 0;
}

bool SyncScheduleManager::isPowerSaving() {
    constexpr int kPowerSaving = 2;
    int mode = 0;
    return vconf_get_int("db/setting/psmode", &mode) == PLATFORM_ERROR_NONE && mode == kPowerSaving;
}

int SyncScheduleManager::alarmCallback(alarm_id_t id, void* userParam) {
    auto* self = static_cast<SyncScheduleManager*>(userParam);
    if (self == nullptr) {
        SYNC_ERR("alarmcallback user_param fail");
        return kOk;
    }
    if (isPowerSaving()) {
        SYNC_ERR("PowerSavingMode");
        return kOk;
    }
    // An unknown id leaves an entry without a listener behind, which no removal ever matches.
    ISyncScheduleListener* listener = self->mListeners[id];
    if (listener != nullptr) {
        listener->onSchedule();
    } else {
        SYNC_ERR("fail");
    }
    return kOk;
}
