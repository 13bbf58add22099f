// The watches of this process: one inotify descriptor on the default main context. A write replaces a key's file, so a
// watched folder reports the key's name.
#include <glib-unix.h>
#include <sys/inotify.h>
#include <unistd.h>

#include <algorithm>
#include <map>
#include <vector>

#include "SettingsFile.h"
#include "platform/error.h"
#include "platform/log.h"
#include "platform/root.h"
#include "platform/settings.h"

struct keynode_s {
    std::string name;
    platform::settings::Value value;
};

namespace {

using platform::settings::Value;

struct Watch {
    std::string key;
    vconf_callback_fn callback;
    void* userData;
};

class Watcher {
public:
    static Watcher& instance() {
        static Watcher* const watcher = new Watcher;
        return *watcher;
    }

    int add(const std::string& key, vconf_callback_fn callback, void* userData) {
        if (find(key, callback) != mWatches.end()) return PLATFORM_ERROR_INVALID_PARAMETER;
        const std::string folder = platform::settings::folderOf(key);
        if (const int code = platform::makeFolder(folder); code != PLATFORM_ERROR_NONE) return code;
        if (mDescriptor == -1) {
            mDescriptor = inotify_init1(IN_CLOEXEC | IN_NONBLOCK);
            if (mDescriptor == -1) return PLATFORM_ERROR_IO;
            mSource = g_unix_fd_add(mDescriptor, G_IO_IN, onReadable, this);
        }
        const int descriptor =
            inotify_add_watch(mDescriptor, platform::rootedPath(folder).c_str(), IN_MOVED_TO | IN_DELETE);
        if (descriptor == -1) return PLATFORM_ERROR_IO;
        mFolders[descriptor] = key.substr(0, key.rfind('/'));
        mWatches.push_back({key, callback, userData});
        return PLATFORM_ERROR_NONE;
    }

    int remove(const std::string& key, vconf_callback_fn callback) {
        const auto found = find(key, callback);
        if (found == mWatches.end()) return PLATFORM_ERROR_NOT_FOUND;
        mWatches.erase(found);
        if (!mWatches.empty()) return PLATFORM_ERROR_NONE;
        g_source_remove(mSource);
        close(mDescriptor);
        mDescriptor = -1;
        mFolders.clear();
        return PLATFORM_ERROR_NONE;
    }

private:
    std::vector<Watch>::iterator find(const std::string& key, vconf_callback_fn callback) {
        return std::find_if(mWatches.begin(), mWatches.end(), [&](const Watch& watch) {
            return watch.key == key && watch.callback == callback;
        });
    }

    static gboolean onReadable(gint, GIOCondition, gpointer self) {
        static_cast<Watcher*>(self)->dispatch();
        return G_SOURCE_CONTINUE;
    }

    void dispatch() {
        std::vector<std::string> changed;
        alignas(inotify_event) char buffer[16384];
        for (ssize_t length = 0; (length = read(mDescriptor, buffer, sizeof buffer)) > 0;) {
            for (ssize_t offset = 0; offset < length;) {
                inotify_event event{};
                std::copy_n(buffer + offset, sizeof event, reinterpret_cast<char*>(&event));
                if ((event.mask & IN_Q_OVERFLOW) != 0) return tell(allKeys());
                const auto folder = mFolders.find(event.wd);
                if (folder != mFolders.end() && event.len > 0) {
                    changed.push_back(folder->second + "/" + (buffer + offset + sizeof event));
                }
                offset += static_cast<ssize_t>(sizeof event + event.len);
            }
        }
        tell(changed);
    }

    [[nodiscard]] std::vector<std::string> allKeys() const {
        std::vector<std::string> keys;
        for (const Watch& watch : mWatches) keys.push_back(watch.key);
        return keys;
    }

    // A callback may add and remove watches, its own included.
    void tell(std::vector<std::string> keys) {
        std::sort(keys.begin(), keys.end());
        keys.erase(std::unique(keys.begin(), keys.end()), keys.end());
        for (const std::string& key : keys) {
            const std::vector<Watch> watches = mWatches;
            for (const Watch& watch : watches) {
                if (watch.key != key || find(key, watch.callback) == mWatches.end()) continue;
                keynode_t node{key, platform::settings::read(key).value_or(Value{})};
                watch.callback(&node, watch.userData);
            }
        }
    }

    int mDescriptor = -1;
    guint mSource = 0;
    std::map<int, std::string> mFolders;  // watch descriptor -> the key's part before its name
    std::vector<Watch> mWatches;
};

}  // namespace

int vconf_notify_key_changed(const char* key, vconf_callback_fn callback, void* user_data) {
    if (key == nullptr || callback == nullptr || !platform::settings::isValidKey(key)) {
        return PLATFORM_ERROR_INVALID_PARAMETER;
    }
    return Watcher::instance().add(key, callback, user_data);
}

int vconf_ignore_key_changed(const char* key, vconf_callback_fn callback) {
    if (key == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    return Watcher::instance().remove(key, callback);
}

const char* vconf_keynode_get_name(const keynode_t* node) {
    return node->name.c_str();
}
vconf_type_e vconf_keynode_get_type(const keynode_t* node) {
    return node->value.type;
}
int vconf_keynode_get_int(const keynode_t* node) {
    return node->value.type == VCONF_TYPE_INT ? node->value.number : 0;
}
