#include "common/NotificationReceiveManager.h"

#include "common/NotificationPaths.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"

NotificationReceiveManager& NotificationReceiveManager::getInstance() {
    static NotificationReceiveManager* const instance = new NotificationReceiveManager;
    return *instance;
}

NotificationReceiveManager::NotificationReceiveManager()
    : mpCalNotificationReceiver(std::make_unique<NotificationReceiver>(kCalendarNotificationPath)),
      mpCtNotificationReceiver(std::make_unique<NotificationReceiver>(kContactsNotificationPath)) {
    SYNC_ASSERT_TEXT(mpCalNotificationReceiver != nullptr, "mpCalNotificationReceiver");
    SYNC_ASSERT_TEXT(mpCtNotificationReceiver != nullptr, "mpCtNotificationReceiver");
}

NotificationReceiver& NotificationReceiveManager::receiverOf(vantor_pim_sync_type_e type) {
    if (type != VANTOR_PIM_SYNC_TYPE_CALENDAR && type != VANTOR_PIM_SYNC_TYPE_CONTACTS) {
        SYNC_ERR("Invalid type : %d", type);
        SYNC_ASSERT_TEXT(false, "0");
    }
    return type == VANTOR_PIM_SYNC_TYPE_CALENDAR ? *mpCalNotificationReceiver : *mpCtNotificationReceiver;
}

int NotificationReceiveManager::attachListener(std::shared_ptr<INotificationListener> listener) {
    if (!listener) {
        SYNC_ERR("Invalid argument");
        return sync_result::kFailed;
    }
    NotificationReceiver& receiver = receiverOf(listener->getType());
    return receiver.attachListener(std::move(listener));
}

std::shared_ptr<INotificationListener> NotificationReceiveManager::detachListener(
    vantor_pim_sync_type_e type, vantor_pim_sync_state_changed_cb callback, void* userData) {
    return receiverOf(type).detachListener(callback, userData);
}

void NotificationReceiveManager::detachAllListeners() {
    mpCalNotificationReceiver->detachAllListeners();
    mpCtNotificationReceiver->detachAllListeners();
}
