// SqlStore: a small SQLite store of the platform: opened on first use of a root, statements with bound parameters.
// Threads: any; the mutex is held for each call.
#pragma once

#include <sqlite3.h>

#include <functional>
#include <initializer_list>
#include <memory>
#include <mutex>
#include <string>
#include <utility>
#include <variant>

#include "platform/database.h"

namespace platform {

class SqlStore {
public:
    using Param = std::variant<int64_t, std::string>;

    // `file` is absolute, the root is applied.
    SqlStore(std::string file, const db_schema_s& schema) : mFile(std::move(file)), mSchema(schema) {}
    ~SqlStore() { sqlite3_close_v2(mHandle); }
    SqlStore(const SqlStore&) = delete;
    SqlStore& operator=(const SqlStore&) = delete;

    // Makes folder, file and tables and opens the store of the current root. A code of platform/error.h.
    [[nodiscard]] int open();
    [[nodiscard]] std::string path() const;

    // Runs statements as one transaction; `changes` receives the rows that the last one changed.
    struct Statement {
        const char* sql;
        std::initializer_list<Param> params;
    };
    [[nodiscard]] int write(std::initializer_list<Statement> statements, int* changes = nullptr);
    [[nodiscard]] int64_t lastRowId() const { return sqlite3_last_insert_rowid(mHandle); }

    // Calls `use` for each row; return false from it to end the reading. Meanwhile the store is kept from other threads;
    // `use` itself may call it.
    [[nodiscard]] int read(const char* sql, std::initializer_list<Param> params,
                           const std::function<bool(sqlite3_stmt*)>& use);

    // A reader on the main loop that must not wait for a writer sets 0 for the while.
    void setBusyTimeout(int milliseconds);

    static std::string text(sqlite3_stmt* row, int column);

private:
    [[nodiscard]] int step(const char* sql, std::initializer_list<Param> params,
                           const std::function<bool(sqlite3_stmt*)>& use);
    [[nodiscard]] int codeOf(int sqliteCode) const;

    const std::string mFile;
    const db_schema_s mSchema;
    std::recursive_mutex mMutex;
    std::string mOpenPath;       // guarded by mMutex
    sqlite3* mHandle = nullptr;  // guarded by mMutex
};

}  // namespace platform
