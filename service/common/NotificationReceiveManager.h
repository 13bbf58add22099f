// NotificationReceiveManager: the receivers of a client process, one per kind.
// Owner: process-wide, made on first use, never destroyed.   Threads: the one that runs the default main context.
#pragma once

#include <memory>

#include "common/NotificationReceiver.h"

class NotificationReceiveManager {
public:
    static NotificationReceiveManager& getInstance();
    NotificationReceiveManager();

    // -1 for NULL. Owned from here on.
    int attachListener(std::shared_ptr<INotificationListener> listener);
    // NULL when there is no such listener.
    std::shared_ptr<INotificationListener> detachListener(vantor_pim_sync_type_e type,
                                                          vantor_pim_sync_state_changed_cb callback,
                                                          void* userData);
    // Of both kinds. None of them is called again.
    void detachAllListeners();

private:
    NotificationReceiver& receiverOf(vantor_pim_sync_type_e type);

    std::unique_ptr<NotificationReceiver> mpCalNotificationReceiver;
    std::unique_ptr<NotificationReceiver> mpCtNotificationReceiver;
};
