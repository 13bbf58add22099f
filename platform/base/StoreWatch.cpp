#include "StoreWatch.h"

#include <glib-unix.h>
#include <sys/inotify.h>
#include <unistd.h>

#include <algorithm>
#include <string_view>

namespace platform {

namespace {

constexpr guint kGatherMs = 20;

}  // namespace

StoreWatch::StoreWatch(const std::string& path, std::function<void()> onWritten)
    : mName(path.substr(path.rfind('/') + 1)), mOnWritten(std::move(onWritten)) {
    mDescriptor = inotify_init1(IN_CLOEXEC | IN_NONBLOCK);
    if (mDescriptor == -1) return;
    if (inotify_add_watch(mDescriptor, path.substr(0, path.rfind('/')).c_str(), IN_MODIFY) == -1) {
        close(mDescriptor);
        mDescriptor = -1;
        return;
    }
    mSource = g_unix_fd_add(mDescriptor, G_IO_IN, onReadable, this);
}

StoreWatch::~StoreWatch() {
    if (mTimeout != 0) g_source_remove(mTimeout);
    if (mSource != 0) g_source_remove(mSource);
    if (mDescriptor != -1) close(mDescriptor);
}

void StoreWatch::again() {
    if (mTimeout == 0) mTimeout = g_timeout_add(kGatherMs, onTimeout, this);
}

gboolean StoreWatch::onReadable(gint fd, GIOCondition, gpointer self) {
    auto* watch = static_cast<StoreWatch*>(self);
    bool written = false;
    alignas(inotify_event) char buffer[4096];
    for (ssize_t length = 0; (length = read(fd, buffer, sizeof buffer)) > 0;) {
        for (ssize_t offset = 0; offset < length;) {
            inotify_event event{};
            std::copy_n(buffer + offset, sizeof event, reinterpret_cast<char*>(&event));
            const std::string_view name = event.len > 0 ? buffer + offset + sizeof event : "";
            written = written || name.starts_with(watch->mName) || (event.mask & IN_Q_OVERFLOW) != 0;
            offset += static_cast<ssize_t>(sizeof event + event.len);
        }
    }
    if (written) watch->again();
    return G_SOURCE_CONTINUE;
}

gboolean StoreWatch::onTimeout(gpointer self) {
    auto* watch = static_cast<StoreWatch*>(self);
    watch->mTimeout = 0;
    watch->mOnWritten();
    return G_SOURCE_REMOVE;
}

}  // namespace platform
