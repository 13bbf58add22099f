// NotificationSender: tells the watchers of one notification file.   Owner: NotificationSendManager.   Threads: main thread.
#pragma once

#include <string>

class NotificationSender {
public:
    // `path` is absolute, the root is applied. NULL or empty breaks an invariant.
    explicit NotificationSender(const char* path);

    // Truncates the file; closing it wakes every watcher. A missing file breaks an invariant.
    int notifyChange();

private:
    const std::string mPath;
};
