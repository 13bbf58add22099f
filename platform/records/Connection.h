// Connection: one SQLite connection with kept statements and values bound by type.
// Threads: one at a time; the store's mutex is held around every use.
#pragma once

#include <sqlite3.h>

#include <map>
#include <string>
#include <unordered_map>
#include <utility>

#include "Record.h"
#include "platform/database.h"

namespace platform::records {

// A kept statement in use; goes back reset.
class Statement {
public:
    explicit Statement(sqlite3_stmt* statement) : mpStatement(statement) {}
    ~Statement();
    Statement(Statement&& other) noexcept : mpStatement(std::exchange(other.mpStatement, nullptr)) {}
    Statement(const Statement&) = delete;
    Statement& operator=(const Statement&) = delete;
    Statement& operator=(Statement&&) = delete;

    Statement& bind(int64_t value);
    Statement& bind(const std::string& value);
    // A text is not copied: the value must outlive the steps.
    Statement& bind(const Value& value);
    Statement& bind(Value&& value) = delete;

    // Steps once: SQLITE_ROW, SQLITE_DONE or an error.
    int step();
    [[nodiscard]] int64_t integer(int column) const { return sqlite3_column_int64(mpStatement, column); }
    [[nodiscard]] std::string text(int column) const;
    // The column as a value of `type`.
    [[nodiscard]] Value value(int column, Type type) const;

private:
    sqlite3_stmt* mpStatement;  // NULL: could not be prepared, every step fails
    int mNext = 1;
    int mCode = SQLITE_OK;
};

class Connection {
public:
    ~Connection() { close(); }

    // SQLite's code.
    [[nodiscard]] int open(const std::string& path, int newestSchema);
    [[nodiscard]] int apply(const db_schema_s& schema) { return db_util_apply_schema(mpHandle, schema); }
    void close();
    [[nodiscard]] bool isOpen() const { return mpHandle != nullptr; }

    [[nodiscard]] Statement prepare(const std::string& sql);
    // The statement of `kind` for a view, whose text is made by the first call alone.
    template <class MakeText>
    [[nodiscard]] Statement prepare(const View& view, int kind, MakeText text) {
        sqlite3_stmt*& known = mByView[{&view, kind}];
        if (known == nullptr) known = kept(text());
        return Statement(known);
    }
    // Runs statements without values: SQLITE_OK or an error.
    [[nodiscard]] int run(const std::string& sql);
    [[nodiscard]] int64_t lastRowId() const { return sqlite3_last_insert_rowid(mpHandle); }
    [[nodiscard]] bool inTransaction() const { return sqlite3_get_autocommit(mpHandle) == 0; }
    [[nodiscard]] const char* message() const { return sqlite3_errmsg(mpHandle); }
    // The counter in the file's header that each commit raises. SQLite's code.
    [[nodiscard]] int readChangeCounter(uint64_t* counter);
    void setBusyTimeout(int milliseconds) { sqlite3_busy_timeout(mpHandle, milliseconds); }

private:
    struct Finalize {
        void operator()(sqlite3_stmt* statement) const noexcept { sqlite3_finalize(statement); }
    };
    // NULL when the text cannot be prepared.
    [[nodiscard]] sqlite3_stmt* kept(const std::string& sql);

    sqlite3* mpHandle = nullptr;
    std::unordered_map<std::string, std::unique_ptr<sqlite3_stmt, Finalize>> mStatements;
    std::map<std::pair<const View*, int>, sqlite3_stmt*> mByView;  // of those, owned by mStatements
};

}  // namespace platform::records
