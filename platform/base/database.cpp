#include "platform/database.h"

#include <sqlite3.h>

#include <atomic>
#include <mutex>
#include <set>
#include <string>

#include "platform/log.h"

namespace {

constexpr int kBusyTimeoutMs = 10'000;
constexpr const char* kTag = "PLATFORM_DATABASE";

// The open connections of the process.
struct Connections {
    std::mutex mutex;
    std::set<sqlite3*> handles;
};

Connections& connections() {
    static auto* const all = new Connections;
    return *all;
}

std::atomic<bool> gMetNewer{false};

int run(sqlite3* handle, const char* sql) {
    return sqlite3_exec(handle, sql, nullptr, nullptr, nullptr);
}

// The number that a statement without values answers.
int readNumber(sqlite3* handle, const char* sql, int* number) {
    sqlite3_stmt* statement = nullptr;
    int code = sqlite3_prepare_v2(handle, sql, -1, &statement, nullptr);
    if (code == SQLITE_OK && (code = sqlite3_step(statement)) == SQLITE_ROW) {
        *number = sqlite3_column_int(statement, 0);
        code = SQLITE_OK;
    }
    sqlite3_finalize(statement);
    return code;
}

int configure(sqlite3* handle, const char* path, int newest) {
    sqlite3_busy_timeout(handle, kBusyTimeoutMs);
    // A read of the schema tells a database from any other file before anything is written.
    int version = 0;
    if (const int code = readNumber(handle, "SELECT count(*) FROM sqlite_master", &version);
        code != SQLITE_OK)
        return code;
    if (const int code = readNumber(handle, "PRAGMA user_version", &version); code != SQLITE_OK) return code;
    if (newest > 0 && version > newest) {
        gMetNewer = true;
        dlog_print(
            DLOG_ERROR, kTag,
            "%s was written by a newer version (its schema is %d, this one knows %d), it is left alone", path,
            version, newest);
        return kDatabaseIsNewer;
    }
    // The kernel caches the files too: pages kept beyond a page of the account's items would only be held twice.
    return run(handle, "PRAGMA journal_mode=PERSIST; PRAGMA cache_size=-1024");
}

// What `schema` still asks of a store, as one text; the caller's transaction keeps the store as it was looked at.
int missingOf(sqlite3* handle, const db_schema_s& schema, std::string* text) {
    int tables = 0;
    int version = 0;
    if (const int code = readNumber(handle, "SELECT count(*) FROM sqlite_master", &tables); code != SQLITE_OK)
        return code;
    if (const int code = readNumber(handle, "PRAGMA user_version", &version); code != SQLITE_OK) return code;
    if (tables == 0) {
        text->append(schema.tables).append(";");
    } else {
        for (size_t step = version > 1 ? static_cast<size_t>(version) - 1 : 0; step < schema.upgrades.size();
             ++step)
            text->append(schema.upgrades[step]).append(";");
    }
    if (tables == 0 || version < schema.version())
        text->append("PRAGMA user_version=").append(std::to_string(schema.version())).append(";");
    return SQLITE_OK;
}

}  // namespace

int db_util_open(const char* path, sqlite3** handle, int newest) {
    if (path == nullptr || handle == nullptr) return SQLITE_MISUSE;
    sqlite3* opened = nullptr;
    int code = sqlite3_open_v2(
        path, &opened,
        SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | SQLITE_OPEN_FULLMUTEX | SQLITE_OPEN_NOFOLLOW, nullptr);
    if (code == SQLITE_OK) code = configure(opened, path, newest);
    if (code != SQLITE_OK) {
        if (code != kDatabaseIsNewer) {
            dlog_print(DLOG_ERROR, kTag, "%s cannot be opened: %s", path,
                       opened != nullptr ? sqlite3_errmsg(opened) : sqlite3_errstr(code));
        }
        sqlite3_close(opened);
        return code & 0xff;
    }
    *handle = opened;
    const std::lock_guard lock(connections().mutex);
    connections().handles.insert(opened);
    return SQLITE_OK;
}

bool db_util_met_newer() {
    return gMetNewer;
}

int db_util_apply_schema(sqlite3* handle, const db_schema_s& schema) {
    std::string missing;
    if (const int code = missingOf(handle, schema, &missing); code != SQLITE_OK || missing.empty())
        return code;
    // Another process may be doing the same: what is missing is asked again once nobody else can write.
    int code = run(handle, "BEGIN IMMEDIATE");
    if (code != SQLITE_OK) return code;
    missing.clear();
    code = missingOf(handle, schema, &missing);
    if (code == SQLITE_OK) code = run(handle, missing.append("COMMIT").c_str());
    if (code != SQLITE_OK) {
        dlog_print(DLOG_ERROR, kTag, "the tables cannot be made or brought up to version %d: %s",
                   schema.version(), sqlite3_errmsg(handle));
        if (sqlite3_get_autocommit(handle) == 0) (void)run(handle, "ROLLBACK");
    }
    return code;
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
