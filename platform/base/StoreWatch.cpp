#include "StoreWatch.h"

#include <glib-unix.h>
#include <sys/inotify.h>
#include <unistd.h>

#include <utility>

namespace platform {

namespace {

// A single write is told soon; a writer that writes page after page is looked at twenty times a second, not at each page.
constexpr guint kGatherMs = 5;
constexpr guint kBusyGatherMs = 50;
constexpr gint64 kBusyUs = 200'000;  // since the look before
constexpr guint kRetryMs = 1000;

}  // namespace

StoreWatch::StoreWatch(const std::string& path, std::function<void()> onWritten)
    : mFolder(path.substr(0, path.rfind('/'))), mOnWritten(std::move(onWritten)) {
    mDescriptor = inotify_init1(IN_CLOEXEC | IN_NONBLOCK);
    if (mDescriptor == -1) return;
    if (!arm()) {
        close(mDescriptor);
        mDescriptor = -1;
        return;
    }
    mSource = g_unix_fd_add(mDescriptor, G_IO_IN, onReadable, this);
}

bool StoreWatch::arm() {
    mWatch = inotify_add_watch(mDescriptor, mFolder.c_str(), IN_MODIFY);
    return mWatch != -1;
}

StoreWatch::~StoreWatch() {
    if (mTimeout != 0) g_source_remove(mTimeout);
    if (mSource != 0) g_source_remove(mSource);
    if (mDescriptor != -1) close(mDescriptor);
}

void StoreWatch::again() {
    if (mTimeout != 0) return;
    const bool isBusy = mLastLook != 0 && g_get_monotonic_time() - mLastLook < kBusyUs;
    mTimeout = g_timeout_add(isBusy ? kBusyGatherMs : kGatherMs, onTimeout, this);
}

gboolean StoreWatch::onReadable(gint, GIOCondition, gpointer self) {
    static_cast<StoreWatch*>(self)->onEvents();
    return G_SOURCE_CONTINUE;
}

void StoreWatch::onEvents() {
    char buffer[4096];
    bool any = false;
    while (read(mDescriptor, buffer, sizeof buffer) > 0) any = true;
    if (!any) return;
    // Until the look, more writes say nothing new, and each would cost its writer and this thread. So would each write of another
    // store in the folder if it were told apart.
    if (mWatch != -1) (void)inotify_rm_watch(mDescriptor, std::exchange(mWatch, -1));
    again();
}

gboolean StoreWatch::onTimeout(gpointer self) {
    auto* watch = static_cast<StoreWatch*>(self);
    watch->mTimeout = 0;
    watch->mLastLook = g_get_monotonic_time();
    // Watching comes first: a write is either seen by the look or told afterwards.
    if (watch->mWatch == -1 && !watch->arm()) watch->mTimeout = g_timeout_add(kRetryMs, onTimeout, watch);
    watch->mOnWritten();
    return G_SOURCE_REMOVE;
}

}  // namespace platform
