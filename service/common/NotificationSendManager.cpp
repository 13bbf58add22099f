#include "common/NotificationSendManager.h"

#include "common/NotificationPaths.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "platform/account.h"
#include "platform/device.h"
#include "platform/error.h"
#include "platform/service_manager.h"
#include "platform/settings.h"

namespace {

// Whether the e-mail service is syncing the same account.
bool isEmailSyncing(int accountId) {
    constexpr int kEmailSyncing = 1;
    email_account_t* list = nullptr;
    int count = 0;
    if (email_get_account_list(&list, &count) != PLATFORM_ERROR_NONE) return false;
    bool syncing = false;
    for (int i = 0; i < count; ++i) {
        syncing = syncing || (list[i].account_svc_id == accountId && list[i].sync_status == kEmailSyncing);
    }
    email_free_account(&list, count);
    return syncing;
}

void updateStatus(int accountId, account_sync_state_e status) {
    const int code = account_update_sync_status_by_id(accountId, status);
    // The account may be gone from the service already while its last sync ends here.
    if (code != PLATFORM_ERROR_NONE)
        SYNC_ERR("account_update_sync_status_by_id(%d) failed (%d), ignoring", accountId, code);
}

}  // namespace

NotificationSendManager& NotificationSendManager::getInstance() {
    static NotificationSendManager* const instance = new NotificationSendManager;
    return *instance;
}

NotificationSendManager::NotificationSendManager()
    : mpCalNotificationSender(std::make_unique<NotificationSender>(kCalendarNotificationPath)),
      mpCtNotificationSender(std::make_unique<NotificationSender>(kContactsNotificationPath)) {
    SYNC_ASSERT_TEXT(mpCalNotificationSender != nullptr, "mpCalNotificationSender");
    SYNC_ASSERT_TEXT(mpCtNotificationSender != nullptr, "mpCtNotificationSender");
}

int NotificationSendManager::notifyChange(int accountId, vantor_pim_sync_type_e type, sync_state state) {
    switch (type) {
        case VANTOR_PIM_SYNC_TYPE_CALENDAR:
            mpCalNotificationSender->notifyChange();
            break;
        case VANTOR_PIM_SYNC_TYPE_CONTACTS:
            mpCtNotificationSender->notifyChange();
            break;
        default:
            SYNC_ERR("Invalid type : %d", type);
            SYNC_ASSERT_TEXT(false, "0");
    }
    setVconfSyncState(state);
    setAccountsyncState(accountId, type, state);
    return sync_result::kOk;
}

void NotificationSendManager::setVconfSyncState(sync_state state) {
    if (state == SYNC_STATE_STARTED) ++mRunningSyncCount;
    if (state == SYNC_STATE_ENDED) --mRunningSyncCount;
    platform::tellStatus(mRunningSyncCount > 0 ? "Syncing" : "Idle");
    if (mRunningSyncCount != 0 && mRunningSyncCount != 1) return;
    if (vconf_set_int("memory/sync/vantor-pim-sync", mRunningSyncCount) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("vconf_set_int is failed !!");
    }
}

void NotificationSendManager::setAccountsyncState(int accountId, vantor_pim_sync_type_e /*type*/,
                                                  sync_state state) {
    if (state == SYNC_STATE_NO_CHANGE) return;
    const int delta = state == SYNC_STATE_STARTED ? 1 : -1;
    const auto known = mAccountSyncCount.find(accountId);
    if (known == mAccountSyncCount.end()) {
        if (delta < 0) {
            SYNC_ERR("account_id=[%d]", accountId);
            return;
        }
        mAccountSyncCount.emplace(accountId, 1);
        updateStatus(accountId, ACCOUNT_SYNC_STATUS_RUNNING);
        return;
    }
    const int count = known->second + delta;
    if (count < 0) {
        SYNC_ERR("account_id=[%d]", accountId);
        return;
    }
    known->second = count;
    if (count == 1) updateStatus(accountId, ACCOUNT_SYNC_STATUS_RUNNING);
    if (count == 0 && !isEmailSyncing(accountId)) updateStatus(accountId, ACCOUNT_SYNC_STATUS_IDLE);
}
