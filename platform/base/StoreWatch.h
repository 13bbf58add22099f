// StoreWatch: tells a process, on the default main context, that a store's file has been written, by whomever. Writers do
// nothing for it: the rollback journal stays on disk and every commit ends in a write to it, so even a writer that was killed
// right after its commit has told everybody.
// Threads: main thread. Idle costs no wake-up.
#pragma once

#include <glib.h>

#include <functional>
#include <string>

namespace platform {

class StoreWatch {
public:
    // `path` is the database's file on this machine; its folder must exist. Writes that fall together are told once, some
    // milliseconds after the first. A write of another file in the folder is told as well: whoever is told looks for himself.
    StoreWatch(const std::string& path, std::function<void()> onWritten);
    ~StoreWatch();
    StoreWatch(const StoreWatch&) = delete;
    StoreWatch& operator=(const StoreWatch&) = delete;

    [[nodiscard]] bool isWatching() const { return mDescriptor != -1; }
    // Calls again after a while, for a reader that found the store busy.
    void again();

private:
    [[nodiscard]] bool arm();
    void onEvents();
    static gboolean onReadable(gint fd, GIOCondition condition, gpointer self);
    static gboolean onTimeout(gpointer self);

    const std::string mFolder;
    const std::function<void()> mOnWritten;
    int mDescriptor = -1;
    int mWatch = -1;  // of the folder; -1 between a notice and the look that follows it
    guint mSource = 0;
    guint mTimeout = 0;
    gint64 mLastLook = 0;  // monotonic µs, 0: never
};

}  // namespace platform
