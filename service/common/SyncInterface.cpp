// The call interface inside the daemon: thin forwards to the process-wide service and notification managers.
#include "common/NotificationReceiveManager.h"
#include "common/NotificationSendManager.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "common/SyncRunStatus.h"
#include "common/SyncService.h"
#include "common/SyncUtil.h"
#include "common/vantor_pim_sync.h"

using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kStorageFull;

namespace {

constexpr const char* kWholeAccount = "account";

bool isStorageFull() {
    if (is_storage_full() >= 0) return false;
    SYNC_ERR("storage fail");
    return true;
}

}  // namespace

int vantor_pim_sync_initialize(void) {
    SyncService::getInstance();
    NotificationSendManager::getInstance();
    NotificationReceiveManager::getInstance();
    return kOk;
}

int vantor_pim_sync_finalize(void) {
    return kOk;
}

int vantor_pim_sync_add_account(const vantor_pim_sync_account_s* account) {
    const LogContext context(account != nullptr ? account->account_id : 0, kWholeAccount);
    return isStorageFull() ? kStorageFull : SyncService::getInstance().addAccount(account);
}

int vantor_pim_sync_remove_account(int account_id) {
    const LogContext context(account_id, kWholeAccount);
    return SyncService::getInstance().removeAccount(account_id);
}

int vantor_pim_sync_update_account(const vantor_pim_sync_account_s* account) {
    const LogContext context(account != nullptr ? account->account_id : 0, kWholeAccount);
    return isStorageFull() ? kStorageFull : SyncService::getInstance().updateAccount(account);
}

int vantor_pim_sync_get_account(int account_id, vantor_pim_sync_account_s** account) {
    return SyncService::getInstance().getAccount(account_id, account);
}

int vantor_pim_sync_start(int account_id, vantor_pim_sync_type_e type) {
    const LogContext context(account_id, SyncRunStatus::nameOf(type));
    return isStorageFull() ? kStorageFull : SyncService::getInstance().startSync(account_id, type);
}

int vantor_pim_sync_stop(int account_id, vantor_pim_sync_type_e type) {
    const LogContext context(account_id, SyncRunStatus::nameOf(type));
    return SyncService::getInstance().stopSync(account_id, type);
}

int vantor_pim_sync_get_state(int account_id, vantor_pim_sync_type_e type, int* state) {
    if (state != nullptr) *state = SyncService::getInstance().getState(account_id, type);
    return kOk;
}

int vantor_pim_sync_get_sync_time(int account_id, vantor_pim_sync_type_e type, int* time) {
    if (time == nullptr) {
        SYNC_ERR("invalid parameter");
        return kFailed;
    }
    return SyncService::getInstance().getSynctime(account_id, type, time);
}

int vantor_pim_sync_add_state_changed_cb(vantor_pim_sync_type_e type,
                                         vantor_pim_sync_state_changed_cb callback, void* user_data) {
    return NotificationReceiveManager::getInstance().attachListener(
        std::make_shared<StateChangedListener>(type, callback, user_data));
}

int vantor_pim_sync_remove_state_changed_cb(vantor_pim_sync_type_e type,
                                            vantor_pim_sync_state_changed_cb callback, void* user_data) {
    (void)NotificationReceiveManager::getInstance().detachListener(type, callback, user_data);
    return kOk;
}
