#include "ReadOnlyDatabase.h"

#include <unistd.h>

#include "Failure.h"
#include "platform/root.h"

namespace {
constexpr int kBusyTimeoutMs = 10000;
constexpr int kNewestSchema = 1;  // of the daemon's stores
}  // namespace

ReadOnlyDatabase::ReadOnlyDatabase(const char* path) : mPath(platform::rootedPath(path)) {
    if (access(mPath.c_str(), F_OK) != 0) return;
    // A journal that a killed daemon left must be rolled back before anything can be read, which needs a writable
    // connection; query_only keeps our own statements from writing.
    for (const int mode : {SQLITE_OPEN_READWRITE, SQLITE_OPEN_READONLY}) {
        sqlite3* handle = nullptr;
        const int code = sqlite3_open_v2(mPath.c_str(), &handle, mode, nullptr);
        mHandle.reset(handle);
        if (code == SQLITE_OK) break;
    }
    sqlite3_busy_timeout(mHandle.get(), kBusyTimeoutMs);
    const SqliteStatement version = prepare("PRAGMA user_version");
    if (step(version) && number(version, 0) > kNewestSchema)
        throw Failure("the store " + mPath +
                      " was written by a newer version of this software; install that version again");
    // journal_mode=PERSIST keeps the journal file in place, as the daemon's own connections do.
    for (const char* sql : {"PRAGMA query_only=1", "PRAGMA journal_mode=PERSIST"}) {
        sqlite3_exec(mHandle.get(), sql, nullptr, nullptr, nullptr);
    }
    // A daemon that starts makes the file first and its tables, all together, a moment later.
    if (!step(prepare("SELECT 1 FROM sqlite_master LIMIT 1"))) mHandle.reset();
}

SqliteStatement ReadOnlyDatabase::prepare(const char* sql) const {
    sqlite3_stmt* statement = nullptr;
    if (sqlite3_prepare_v2(mHandle.get(), sql, -1, &statement, nullptr) != SQLITE_OK) fail();
    return SqliteStatement(statement);
}

bool ReadOnlyDatabase::step(const SqliteStatement& statement) const {
    const int code = sqlite3_step(statement.get());
    if (code != SQLITE_ROW && code != SQLITE_DONE) fail();
    return code == SQLITE_ROW;
}

std::string ReadOnlyDatabase::text(const SqliteStatement& statement, int column) {
    const unsigned char* value = sqlite3_column_text(statement.get(), column);
    return value == nullptr ? std::string() : std::string(reinterpret_cast<const char*>(value));
}

void ReadOnlyDatabase::fail() const {
    throw Failure("the store " + mPath + " cannot be read: " + sqlite3_errmsg(mHandle.get()));
}
