// NotificationReceiver: watches one notification file for its listeners. All receivers of a process share one inotify descriptor.
// Owner: NotificationReceiveManager.   Threads: the one that runs the default main context.
#pragma once

#include <glib.h>

#include <list>
#include <memory>
#include <string>

#include "common/INotificationListener.h"

class NotificationReceiver {
public:
    // `path` is absolute, the root is applied. NULL or empty breaks an invariant.
    explicit NotificationReceiver(const char* path);
    ~NotificationReceiver();
    NotificationReceiver(const NotificationReceiver&) = delete;
    NotificationReceiver& operator=(const NotificationReceiver&) = delete;

    // The first listener begins the watch.
    int attachListener(std::shared_ptr<INotificationListener> listener);
    // The first listener with this callback and data, or NULL. The last one ends the watch.
    std::shared_ptr<INotificationListener> detachListener(vantor_pim_sync_state_changed_cb callback,
                                                          void* userData);
    void detachAllListeners();

private:
    int initialize();
    void subscribe();
    void unsubscribe();
    int deinitialize();
    void notify();
    static gboolean onINotify(GIOChannel* channel, GIOCondition condition, gpointer userData);
    static void dispatch(int watch, unsigned mask);

    const std::string mPath;
    int mNotificationWd = -1;
    std::list<std::shared_ptr<INotificationListener>> mListeners;

    // Shared by all receivers of the process.
    static int mINotifyFd;
    static int mInitializeCount;
    static GIOChannel* mpINotifyChannel;
    static guint mWatchSource;
    static std::list<NotificationReceiver*> mSubscribed;
};
