// NotificationSendManager: tells of every visible state change: the notification file of the kind, the global "a sync is
// running" key, and the account service's status of the account.
// Owner: process-wide, made on first use, never destroyed.   Threads: main thread (under the agents' own locks).
#pragma once

#include <map>
#include <memory>

#include "common/NotificationSender.h"
#include "common/vantor_pim_sync.h"

class NotificationSendManager {
public:
    enum sync_state { SYNC_STATE_NO_CHANGE = 0, SYNC_STATE_STARTED = 1, SYNC_STATE_ENDED = 2 };

    static NotificationSendManager& getInstance();
    NotificationSendManager();

    int notifyChange(int accountId, vantor_pim_sync_type_e type, sync_state state);

private:
    void setVconfSyncState(sync_state state);
    void setAccountsyncState(int accountId, vantor_pim_sync_type_e type, sync_state state);

    int mRunningSyncCount = 0;
    std::map<int, int> mAccountSyncCount;  // account id -> running syncs
    std::unique_ptr<NotificationSender> mpCalNotificationSender;
    std::unique_ptr<NotificationSender> mpCtNotificationSender;
};
