#include "platform/database.h"

#include <sqlite3.h>

#include <mutex>
#include <set>

#include "platform/log.h"

namespace {

constexpr int kBusyTimeoutMs = 10'000;

// The open connections of the process.
struct Connections {
    std::mutex mutex;
    std::set<sqlite3*> handles;
};

Connections& connections() {
    static auto* const all = new Connections;
    return *all;
}

int configure(sqlite3* handle) {
    sqlite3_busy_timeout(handle, kBusyTimeoutMs);
    // A read of the schema tells a database from any other file before anything is written.
    if (const int code =
            sqlite3_exec(handle, "SELECT count(*) FROM sqlite_master", nullptr, nullptr, nullptr);
        code != SQLITE_OK) {
        return code;
    }
    // The kernel caches the files too: pages kept beyond a page of the account's items would only be held twice.
    return sqlite3_exec(handle, "PRAGMA journal_mode=PERSIST; PRAGMA cache_size=-1024", nullptr, nullptr,
                        nullptr);
}

}  // namespace

int db_util_open(const char* path, sqlite3** handle, int /*options*/) {
    if (path == nullptr || handle == nullptr) return SQLITE_MISUSE;
    sqlite3* opened = nullptr;
    int code = sqlite3_open_v2(
        path, &opened,
        SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | SQLITE_OPEN_FULLMUTEX | SQLITE_OPEN_NOFOLLOW, nullptr);
    if (code == SQLITE_OK) code = configure(opened);
    if (code != SQLITE_OK) {
        dlog_print(DLOG_ERROR, "PLATFORM_DATABASE", "%s cannot be opened: %s", path,
                   opened != nullptr ? sqlite3_errmsg(opened) : sqlite3_errstr(code));
        sqlite3_close(opened);
        return code & 0xff;
    }
    *handle = opened;
    const std::lock_guard lock(connections().mutex);
    connections().handles.insert(opened);
    return SQLITE_OK;
}

int db_util_close(sqlite3* handle) {
    {
        const std::lock_guard lock(connections().mutex);
        connections().handles.erase(handle);
    }
    return sqlite3_close_v2(handle);
}

void db_util_release_memory() {
    const std::lock_guard lock(connections().mutex);
    for (sqlite3* handle : connections().handles) sqlite3_db_release_memory(handle);
}
