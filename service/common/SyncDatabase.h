// SyncDatabase: what the daemon's private stores share: creating and opening the file, prepared statements that are
// kept, bound parameters, nested transactions.
// Owner: a store helper.   Threads: any; mMutex (recursive) is held for each statement, and by the thread of an open
// transaction from begin to end.   Errors: SyncResult.h codes; outputs untouched on failure.
#pragma once

#include <cstdint>
#include <functional>
#include <initializer_list>
#include <mutex>
#include <span>
#include <string>
#include <string_view>
#include <unordered_map>

#include "common/Handles.h"
#include "common/SyncResult.h"
#include "platform/database.h"

class SyncDatabase {
public:
    // A bound parameter.
    class Param {
    public:
        Param(int value) : mInteger(value), mIsText(false) {}           // NOLINT(google-explicit-constructor)
        Param(int64_t value) : mInteger(value), mIsText(false) {}       // NOLINT(google-explicit-constructor)
        Param(std::string_view value) : mText(value), mIsText(true) {}  // NOLINT(google-explicit-constructor)
        Param(const std::string& value)
            : Param(std::string_view(value)) {}  // NOLINT(google-explicit-constructor)
        int bind(sqlite3_stmt* statement, int index) const;

    private:
        int64_t mInteger = 0;
        std::string_view mText;
        bool mIsText;
    };
    using Params = std::initializer_list<Param>;

    // The current row of a read; NULL text is empty.
    class Row {
    public:
        explicit Row(sqlite3_stmt* statement) : mpStatement(statement) {}
        [[nodiscard]] int integer(int column) const { return sqlite3_column_int(mpStatement, column); }
        [[nodiscard]] std::string text(int column) const;
        [[nodiscard]] bool isNull(int column) const;

    private:
        sqlite3_stmt* mpStatement;
    };

    // `path` is absolute, the root is applied here. The schema texts are executed together when the file is made;
    // `upgrades` bring an older one up, as in db_schema_s.
    // `notOpenedText` is what a read logs when the store cannot be opened; by `name` the log calls a file that cannot be made.
    SyncDatabase(std::string path, std::span<const char* const> schema,
                 const char* notOpenedText = "Database is not opended", const char* name = "calendar",
                 std::span<const char* const> upgrades = {});
    ~SyncDatabase();
    SyncDatabase(const SyncDatabase&) = delete;
    SyncDatabase& operator=(const SyncDatabase&) = delete;

    // Makes the file when it is missing and opens the handle when there is none.
    [[nodiscard]] int openDb();
    [[nodiscard]] int makeDb();

    // One write statement outside or inside a transaction: SQLITE_DONE or SQLITE_ROW, else SQLite's error code
    // (SQLITE_ABORT_ROLLBACK when SQLite has undone the transaction: nothing more is written until its end, which fails);
    // kNotOpened when the store cannot be opened (logged).
    static constexpr int kNotOpened = -1;
    [[nodiscard]] int step(std::string_view sql, Params params);

    // A write that is a transaction of its own, or part of the open one.
    [[nodiscard]] int write(std::string_view sql, Params params);

    // Reads the first row: 0 with `use` called, or -1 (no row: without a log).
    [[nodiscard]] int readRow(std::string_view sql, Params params,
                              const std::function<void(const Row&)>& use);
    // Reads all rows; none is success.
    [[nodiscard]] int readAll(std::string_view sql, Params params,
                              const std::function<void(const Row&)>& use);

    [[nodiscard]] int begin_trans();
    int end_trans(bool success);

    std::recursive_mutex& mutex() { return mMutex; }

    // The rows that the last successful write changed.
    [[nodiscard]] int changes() const;

private:
    [[nodiscard]] db_schema_s schema() const { return {mTables.c_str(), mUpgrades}; }
    [[nodiscard]] bool isUndone() const;
    [[nodiscard]] sqlite3_stmt* prepare(std::string_view sql);
    [[nodiscard]] int execRetried(const char* sql);
    [[nodiscard]] int read(std::string_view sql, Params params, bool firstOnly,
                           const std::function<void(const Row&)>& use);

    const std::string mPath;  // constant after construction, as the next four
    const std::string mTables;
    const std::span<const char* const> mUpgrades;
    const char* const mNotOpenedText;
    const char* const mName;

    std::recursive_mutex mMutex;
    sqlite3* mpHandle = nullptr;  // guarded by mMutex, as all below
    int mTransactionDepth = 0;
    struct TextHash {
        using is_transparent = void;
        size_t operator()(std::string_view text) const noexcept {
            return std::hash<std::string_view>()(text);
        }
    };
    std::unordered_map<std::string, SqliteStmt, TextHash, std::equal_to<>> mStatements;  // by SQL text
};

// A transaction that is rolled back unless commit() was called; holds the store's mutex.
class SyncTransaction {
public:
    explicit SyncTransaction(SyncDatabase& database)
        : mDatabase(database), mLock(database.mutex()), mBegun(database.begin_trans() == sync_result::kOk) {}
    ~SyncTransaction() {
        if (mBegun) mDatabase.end_trans(/*success=*/false);
    }
    SyncTransaction(const SyncTransaction&) = delete;
    SyncTransaction& operator=(const SyncTransaction&) = delete;
    [[nodiscard]] bool begun() const { return mBegun; }
    [[nodiscard]] int commit() {
        mBegun = false;
        return mDatabase.end_trans(/*success=*/true);
    }

private:
    SyncDatabase& mDatabase;
    std::unique_lock<std::recursive_mutex> mLock;
    bool mBegun;
};
