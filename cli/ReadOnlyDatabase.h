// ReadOnlyDatabase.h: one of the daemon's stores, looked at without changing it.
#pragma once

#include <sqlite3.h>

#include <memory>
#include <string>

struct SqliteDeleter {
    void operator()(sqlite3* handle) const noexcept { sqlite3_close_v2(handle); }
    void operator()(sqlite3_stmt* statement) const noexcept { sqlite3_finalize(statement); }
};
using SqliteStatement = std::unique_ptr<sqlite3_stmt, SqliteDeleter>;

class ReadOnlyDatabase {
public:
    // A path of the system below the root. A missing file, or one that has no tables yet, is a database without rows:
    // isOpen() is false. A Failure when it is there and cannot be read.
    explicit ReadOnlyDatabase(const char* path);

    [[nodiscard]] bool isOpen() const { return mHandle != nullptr; }
    // The statement, ready for the first step().
    [[nodiscard]] SqliteStatement prepare(const char* sql) const;
    // Whether there is a row. A Failure when the database cannot be read.
    [[nodiscard]] bool step(const SqliteStatement& statement) const;

    static std::string text(const SqliteStatement& statement, int column);
    static int number(const SqliteStatement& statement, int column) {
        return sqlite3_column_int(statement.get(), column);
    }

private:
    [[noreturn]] void fail() const;

    std::string mPath;
    std::unique_ptr<sqlite3, SqliteDeleter> mHandle;
};
