#include "common/NotificationReceiver.h"

#include <fcntl.h>
#include <sys/inotify.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "platform/root.h"

using sync_result::kFailed;
using sync_result::kOk;

int NotificationReceiver::mINotifyFd = -1;
int NotificationReceiver::mInitializeCount = 0;
GIOChannel* NotificationReceiver::mpINotifyChannel = nullptr;
guint NotificationReceiver::mWatchSource = 0;
std::list<NotificationReceiver*> NotificationReceiver::mSubscribed;

namespace {

const char* checked(const char* path) {
    SYNC_ASSERT_TEXT(path != nullptr && strlen(path) > 0, "path != __null && strlen(path) > 0");
    return path;
}

// Reads up to `size` bytes, going on after a short read. The bytes read.
size_t readFully(int fd, void* buffer, size_t size) {
    size_t done = 0;
    while (done < size) {
        const ssize_t count = read(fd, static_cast<char*>(buffer) + done, size - done);
        if (count < 0 && errno == EINTR) continue;
        if (count < 1) break;
        done += static_cast<size_t>(count);
    }
    return done;
}

}  // namespace

NotificationReceiver::NotificationReceiver(const char* path) : mPath(checked(path)) {}

NotificationReceiver::~NotificationReceiver() {
    if (mNotificationWd != -1) unsubscribe();
}

int NotificationReceiver::attachListener(std::shared_ptr<INotificationListener> listener) {
    SYNC_ASSERT_TEXT(listener != nullptr, "pNotificationListener");
    if (mListeners.empty()) subscribe();
    mListeners.push_back(std::move(listener));
    return kOk;
}

std::shared_ptr<INotificationListener> NotificationReceiver::detachListener(
    vantor_pim_sync_state_changed_cb callback, void* userData) {
    std::shared_ptr<INotificationListener> detached;
    const auto found = std::find_if(mListeners.begin(), mListeners.end(), [&](const auto& listener) {
        return listener->isSame(callback, userData);
    });
    if (found != mListeners.end()) {
        detached = *found;
        mListeners.erase(found);
    }
    if (mListeners.empty() && mNotificationWd != -1) unsubscribe();
    return detached;
}

void NotificationReceiver::detachAllListeners() {
    mListeners.clear();
    if (mNotificationWd != -1) unsubscribe();
}

int NotificationReceiver::initialize() {
    if (++mInitializeCount > 1) return kOk;
    mINotifyFd = inotify_init();
    SYNC_ASSERT(mINotifyFd != -1);
    int ret = fcntl(mINotifyFd, F_SETFD, FD_CLOEXEC);
    SYNC_ASSERT(ret != -1);
    ret = fcntl(mINotifyFd, F_SETFL, O_NONBLOCK);
    SYNC_ASSERT(ret != -1);
    mpINotifyChannel = g_io_channel_unix_new(mINotifyFd);
    SYNC_ASSERT_TEXT(mpINotifyChannel != nullptr, "mpINotifyChannel");
    g_io_channel_set_flags(mpINotifyChannel, G_IO_FLAG_NONBLOCK, nullptr);
    mWatchSource = g_io_add_watch(mpINotifyChannel, G_IO_IN, onINotify, nullptr);
    g_io_channel_unref(mpINotifyChannel);
    return kOk;
}

void NotificationReceiver::subscribe() {
    initialize();
    if (mNotificationWd == -1) {
        const std::string path = platform::rootedPath(mPath);
        mNotificationWd = inotify_add_watch(mINotifyFd, path.c_str(), IN_ACCESS | IN_DONT_FOLLOW);
        SYNC_ASSERT(mNotificationWd != -1);
        // Replaces the mask: from here on only the closing of a written file is told.
        const int ret = inotify_add_watch(mINotifyFd, path.c_str(), IN_CLOSE_WRITE | IN_DONT_FOLLOW);
        SYNC_ASSERT(ret == mNotificationWd);
    }
    mSubscribed.push_back(this);
}

void NotificationReceiver::unsubscribe() {
    inotify_rm_watch(mINotifyFd, mNotificationWd);
    mNotificationWd = -1;
    mSubscribed.remove(this);
    (void)deinitialize();
}

int NotificationReceiver::deinitialize() {
    if (--mInitializeCount < 0) {
        mInitializeCount = 0;
        return kFailed;
    }
    if (mInitializeCount > 0) return kOk;
    g_source_remove(mWatchSource);
    close(mINotifyFd);
    mListeners.clear();
    mWatchSource = 0;
    mpINotifyChannel = nullptr;
    mINotifyFd = -1;
    return kOk;
}

gboolean NotificationReceiver::onINotify(GIOChannel* channel, GIOCondition, gpointer) {
    constexpr size_t kHeaderBytes = 16;
    constexpr size_t kNamePieceBytes = 4096;
    const int fd = g_io_channel_unix_get_fd(channel);
    inotify_event event{};
    static_assert(sizeof event == kHeaderBytes);
    while (readFully(fd, &event, kHeaderBytes) == kHeaderBytes) {
        dispatch(event.wd, event.mask);
        if (mINotifyFd == -1) return FALSE;  // a listener has detached the last one
        char name[kNamePieceBytes];
        for (size_t left = event.len; left > 0;) {
            const size_t count = readFully(fd, name, std::min(left, sizeof name));
            if (count == 0) break;
            left -= count;
        }
    }
    return TRUE;
}

void NotificationReceiver::dispatch(int watch, unsigned mask) {
    if ((mask & IN_CLOSE_WRITE) == 0) return;
    const std::list<NotificationReceiver*> receivers = mSubscribed;
    for (NotificationReceiver* receiver : receivers) {
        const bool alive = std::find(mSubscribed.begin(), mSubscribed.end(), receiver) != mSubscribed.end();
        if (alive && receiver->mNotificationWd == watch) receiver->notify();
    }
}

void NotificationReceiver::notify() {
    // A listener may attach and detach others, or itself, from inside the call.
    const std::list<std::shared_ptr<INotificationListener>> listeners = mListeners;
    for (const auto& listener : listeners) {
        if (std::find(mListeners.begin(), mListeners.end(), listener) != mListeners.end()) listener->notify();
    }
}
