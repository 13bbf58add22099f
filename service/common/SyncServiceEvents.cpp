// SyncService's reactions to the account service and to settings.
#include "common/AccountDBHelper.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "common/SyncScheduleManager.h"
#include "common/SyncService.h"
#include "platform/error.h"

using sync_result::kOk;

namespace {

constexpr const char* kCalendarSyncKey = "db/private/com.morvane.calendar/calendar-sync";
constexpr const char* kPowerSavingKey = "db/setting/psmode";
constexpr int kPowerSaving = 2;

}  // namespace

void SyncService::watchEvents() {
    if (const int code = account_subscribe_create(&mSubscription); code != PLATFORM_ERROR_NONE) {
        SYNC_ERR("account_subscribe_create Failed (%d)", code);
    } else if (const int subscribed = account_subscribe_notification(mSubscription, account_cb, this);
               subscribed != PLATFORM_ERROR_NONE) {
        SYNC_ERR("account_subscribe_notification Failed (%d)", subscribed);
    }
    if (vconf_set_int("memory/sync/vantor-pim-sync", 0) != PLATFORM_ERROR_NONE)
        SYNC_ERR("vconf_set_int is failed !!");
    if (vconf_notify_key_changed(kCalendarSyncKey, calendar_sync_cb, this) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("%s cannot be watched, ignoring", kCalendarSyncKey);
    }
    if (vconf_notify_key_changed(kPowerSavingKey, psmCallback, this) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("%s cannot be watched, ignoring", kPowerSavingKey);
    }
    // What changed between the first schedules and the watch was told to nobody.
    setPowerSaving(SyncScheduleManager::isPowerSaving());
}

bool SyncService::account_cb(const char* eventType, int accountId, void* userData) {
    auto* self = static_cast<SyncService*>(userData);
    if (self == nullptr) {
        SYNC_ERR("get data fail");
        return true;
    }
    if (std::string_view(eventType) == "sync_update" && self->mAccounts.contains(accountId)) {
        self->restoreRunningStatus(accountId);
    }
    return true;
}

// Somebody else may have written "idle" while a sync of ours runs.
void SyncService::restoreRunningStatus(int accountId) {
    account_h account = nullptr;
    if (const int code = account_create(&account); code != PLATFORM_ERROR_NONE) {
        SYNC_ERR("account_create fail(%x)", static_cast<unsigned>(code));
        return;
    }
    account_sync_state_e status = ACCOUNT_SYNC_INVALID;
    if (const int code = account_query_account_by_account_id(accountId, &account);
        code != PLATFORM_ERROR_NONE) {
        SYNC_ERR("fail account_query(%x)", static_cast<unsigned>(code));
    } else if (account_get_sync_support(account, &status) == PLATFORM_ERROR_NONE &&
               status != ACCOUNT_SYNC_STATUS_RUNNING) {
        bool running = false;
        for (const Kind& kind : kKinds) {
            SyncAgent* agent = findAgent(kind, accountId);
            running = running || (agent != nullptr && agent->getState() == SYNC_AGENT_STATE_IN_PROGRESS);
        }
        if (running) (void)account_update_sync_status_by_id(accountId, ACCOUNT_SYNC_STATUS_RUNNING);
    }
    account_destroy(account);
}

void SyncService::calendar_sync_cb(keynode_t* /*node*/, void* userData) {
    auto* self = static_cast<SyncService*>(userData);
    if (self == nullptr) {
        SYNC_ERR("get data fail");
        return;
    }
    std::list<std::unique_ptr<Account>> accounts;
    if (AccountDBHelper::getInstance().getAllAccounts(&accounts) != kOk) {
        SYNC_ERR("getAllAccounts fail");
        return;
    }
    for (const std::unique_ptr<Account>& account : accounts) {
        if (account->getCalendarSync())
            (void)self->startSync(account->getAccountId(), VANTOR_PIM_SYNC_TYPE_CALENDAR);
    }
}

void SyncService::psmCallback(keynode_t* node, void* userData) {
    auto* self = static_cast<SyncService*>(userData);
    if (self == nullptr) {
        SYNC_ERR(" fail");
        return;
    }
    self->setPowerSaving(vconf_keynode_get_int(node) == kPowerSaving);
}

void SyncService::setPowerSaving(bool on) {
    if (on != mIsPowerSaving) onPowerSavingMode(on);
    mIsPowerSaving = on;
}

void SyncService::onPowerSavingMode(bool on) {
    std::list<std::unique_ptr<Account>> accounts;
    if (AccountDBHelper::getInstance().getAllAccounts(&accounts) != kOk) {
        SYNC_ERR("getAllAccounts fail");
        return;
    }
    for (const std::unique_ptr<Account>& account : accounts) {
        for (const Kind& kind : kKinds) {
            SyncAgent* agent = findAgent(kind, account->getAccountId());
            if (agent == nullptr || !((*account).*kind.isOn)()) continue;
            unschedule(agent);
            if (!on) schedule(kind, *account, agent);
        }
    }
}
