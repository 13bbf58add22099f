// database.h: how every SQLite file of the device is opened.
// A connection has a busy timeout of 10 s and a rollback journal that stays on disk between transactions.
#pragma once

struct sqlite3;

// Opens (and creates) the file at `path`, which is a path of the machine: callers apply the root themselves.
// Returns 0 or SQLite's error code; *handle is set on success only. A file that is not a database is refused
// (SQLITE_NOTADB) and left as it is. `options` is reserved, pass 0.
[[nodiscard]] int db_util_open(const char* path, sqlite3** handle, int options);

// Closes; a NULL handle is success.
int db_util_close(sqlite3* handle);

// Lets go of what all open connections of the process keep in memory for the next statement. Any thread; for the end of some
// large work, after which little is to be expected.
void db_util_release_memory();
