// database.h: how every SQLite file of the device is opened.
// A connection has a busy timeout of 10 s and a rollback journal that stays on disk between transactions.
// A store carries the version of its schema (SQLite's user_version): an older store is brought up, a newer one is
// left alone.
#pragma once

#include <span>

struct sqlite3;

// Opens (and creates) the file at `path`, which is a path of the machine: callers apply the root themselves.
// Returns 0 or SQLite's error code; *handle is set on success only. A file that is not a database is refused
// (SQLITE_NOTADB) and left as it is. So is one whose schema is newer than `newest` (kDatabaseIsNewer); 0 takes any.
[[nodiscard]] int db_util_open(const char* path, sqlite3** handle, int newest);
inline constexpr int kDatabaseIsNewer = 20;  // SQLite never answers it to the opening of a file

// Whether this process has refused a newer store; from then on it cannot do its work with all of the device's data.
[[nodiscard]] bool db_util_met_newer();

// The tables of a store. A change of them is written down twice: in `tables` as they are now, and as one more upgrade.
struct db_schema_s {
    const char* tables;  // makes the newest version in an empty store; several statements
    std::span<const char* const> upgrades{};  // [i] takes a store from version i + 1 to i + 2
    [[nodiscard]] int version() const { return static_cast<int>(upgrades.size()) + 1; }
};

// Brings an open store to `schema`: an empty one gets its tables, an older one the upgrades that it lacks, as one
// transaction. A store with tables and without a version is of version 1. Returns 0 or SQLite's error code; the store
// is then as before.
[[nodiscard]] int db_util_apply_schema(sqlite3* handle, const db_schema_s& schema);

// Closes; a NULL handle is success.
int db_util_close(sqlite3* handle);

// Lets go of what all open connections of the process keep in memory for the next statement. Any thread; for the end of some
// large work, after which little is to be expected.
void db_util_release_memory();
