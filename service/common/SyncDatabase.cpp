#include "common/SyncDatabase.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <chrono>
#include <memory>
#include <optional>
#include <thread>
#include <utility>

#include "common/SyncLog.h"
#include "platform/root.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace {

constexpr mode_t kStoreMode = 0660;
constexpr auto kFirstRetrySleep = std::chrono::microseconds(100'000);
constexpr auto kRetrySleepLimit = std::chrono::microseconds(500'000);

int createWithMode(const std::string& path) {
    const int fd = open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW, kStoreMode);
    if (fd == -1) {
        SYNC_ERR("open Failed");
        return kFailed;
    }
    // The umask may have taken bits away that the other users of the group need.
    if (fchmod(fd, kStoreMode) != 0) SYNC_ERR("fchmod(%s) failed, ignoring", path.c_str());
    close(fd);
    return kOk;
}

// Gives the kept statement back in a state that holds no lock and no borrowed text.
class StatementUse {
public:
    explicit StatementUse(sqlite3_stmt* statement) : mpStatement(statement) {}
    ~StatementUse() {
        sqlite3_reset(mpStatement);
        sqlite3_clear_bindings(mpStatement);
    }
    StatementUse(const StatementUse&) = delete;
    StatementUse& operator=(const StatementUse&) = delete;

private:
    sqlite3_stmt* mpStatement;
};

struct CloseDatabase {
    void operator()(sqlite3* handle) const noexcept { db_util_close(handle); }
};
using ShortConnection = std::unique_ptr<sqlite3, CloseDatabase>;

// False only for a store that nobody finished making. Nothing for one that cannot be read: it is somebody's data.
std::optional<bool> hasTables(const std::string& path, int newestSchema) {
    sqlite3* opened = nullptr;
    if (db_util_open(path.c_str(), &opened, newestSchema) != SQLITE_OK) return std::nullopt;
    const ShortConnection database(opened);
    bool found = false;
    const auto note = [](void* any, int, char**, char**) { return *static_cast<bool*>(any) = true, 0; };
    const int code =
        sqlite3_exec(database.get(), "SELECT 1 FROM sqlite_master LIMIT 1", note, &found, nullptr);
    if (code != SQLITE_OK && !found) return std::nullopt;
    return found;
}

std::string joined(std::span<const char* const> statements) {
    std::string text;
    for (const char* statement : statements) text.append(statement).append(";");
    return text;
}

}  // namespace

int SyncDatabase::Param::bind(sqlite3_stmt* statement, int index) const {
    if (!mIsText) return sqlite3_bind_int64(statement, index, mInteger);
    // The caller's text outlives the step, so SQLite need not copy it.
    return sqlite3_bind_text64(statement, index, mText.data() != nullptr ? mText.data() : "", mText.size(),
                               SQLITE_STATIC, SQLITE_UTF8);
}

std::string SyncDatabase::Row::text(int column) const {
    const void* data = sqlite3_column_blob(mpStatement, column);
    if (data == nullptr) return {};
    return {static_cast<const char*>(data), static_cast<size_t>(sqlite3_column_bytes(mpStatement, column))};
}

bool SyncDatabase::Row::isNull(int column) const {
    return sqlite3_column_type(mpStatement, column) == SQLITE_NULL;
}

SyncDatabase::SyncDatabase(std::string path, std::span<const char* const> schema, const char* notOpenedText,
                           const char* name, std::span<const char* const> upgrades)
    : mPath(std::move(path)),
      mTables(joined(schema)),
      mUpgrades(upgrades),
      mNotOpenedText(notOpenedText),
      mName(name) {}

SyncDatabase::~SyncDatabase() {
    mStatements.clear();
    db_util_close(mpHandle);
}

int SyncDatabase::openDb() {
    const std::lock_guard lock(mMutex);
    const std::string path = platform::rootedPath(mPath);
    const int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    const bool isThere = fd != -1;
    if (isThere) close(fd);
    // A daemon that was killed while it made the store left a file without tables.
    const std::optional<bool> isMade =
        isThere && mpHandle == nullptr ? hasTables(path, schema().version()) : isThere;
    if (!isMade) {
        // Not opened, or nobody would look again once it can be read.
        SYNC_ERR("%s cannot be read", path.c_str());
        return kFailed;
    }
    if (!*isMade) {
        if (const int result = makeDb(); result != kOk) {
            SYNC_ERR("makeDb fail");
            return result;
        }
    }
    if (mpHandle != nullptr) return kOk;
    sqlite3* opened = nullptr;
    if (db_util_open(path.c_str(), &opened, schema().version()) != SQLITE_OK) {
        SYNC_ERR("db_util_open fail");
        return kFailed;
    }
    ShortConnection database(opened);
    if (db_util_apply_schema(database.get(), schema()) != SQLITE_OK) {
        SYNC_ERR("%s cannot be brought up", path.c_str());
        return kFailed;
    }
    mpHandle = database.release();
    return kOk;
}

int SyncDatabase::makeDb() {
    const std::string path = platform::rootedPath(mPath);
    sqlite3* opened = nullptr;
    const int code = db_util_open(path.c_str(), &opened, schema().version());
    const ShortConnection database(opened);
    if (code != SQLITE_OK) {
        SYNC_ERR("db_util_open() Failed(%d)", code);
        return kFailed;
    }
    // All tables or none: a reader or the next start never sees half a store.
    if (db_util_apply_schema(database.get(), schema()) != SQLITE_OK) {
        SYNC_ERR("remake %s DB file is Failed : %s", mName, sqlite3_errmsg(database.get()));
        return kFailed;  // closing undoes what was begun
    }
    if (const int result = createWithMode(path); result != kOk) return result;
    return createWithMode(path + "-journal");
}

sqlite3_stmt* SyncDatabase::prepare(std::string_view sql) {
    if (const auto known = mStatements.find(sql); known != mStatements.end()) return known->second.get();
    const std::string text(sql);
    sqlite3_stmt* statement = nullptr;
    if (sqlite3_prepare_v3(mpHandle, text.c_str(), -1, SQLITE_PREPARE_PERSISTENT, &statement, nullptr) !=
        SQLITE_OK) {
        return nullptr;
    }
    mStatements.emplace(text, SqliteStmt(statement));
    return statement;
}

// SQLite undoes a transaction by itself, as on a full disk. What comes after must not be kept without what came before.
bool SyncDatabase::isUndone() const {
    return mTransactionDepth > 0 && sqlite3_get_autocommit(mpHandle) != 0;
}

int SyncDatabase::step(std::string_view sql, Params params) {
    const std::lock_guard lock(mMutex);
    if (mpHandle == nullptr && openDb() != kOk) {
        SYNC_ERR("Database is not opened");
        return kNotOpened;
    }
    if (isUndone()) {
        SYNC_ERR("the transaction was undone, nothing more of it is written");
        return SQLITE_ABORT_ROLLBACK;
    }
    sqlite3_stmt* statement = prepare(sql);
    if (statement == nullptr) return sqlite3_errcode(mpHandle);
    const StatementUse use(statement);
    int index = 0;
    for (const Param& param : params) {
        if (const int code = param.bind(statement, ++index); code != SQLITE_OK) return code;
    }
    return sqlite3_step(statement);
}

int SyncDatabase::execRetried(const char* sql) {
    int code = step(sql, {});
    for (auto sleep = kFirstRetrySleep; code != SQLITE_DONE && sleep < kRetrySleepLimit; sleep *= 2) {
        std::this_thread::sleep_for(sleep);
        code = step(sql, {});
    }
    if (code == SQLITE_DONE) return kOk;
    SYNC_ERR("execDb() Failed(%d)", code);
    return kFailed;
}

int SyncDatabase::begin_trans() {
    mMutex.lock();
    if (mTransactionDepth > 0) {
        ++mTransactionDepth;
        return kOk;
    }
    if (execRetried("BEGIN IMMEDIATE TRANSACTION") != kOk) {
        mMutex.unlock();
        return kFailed;
    }
    mTransactionDepth = 1;
    return kOk;
}

int SyncDatabase::end_trans(bool success) {
    // The thread that began holds the mutex once for each begin; this is its last word at this depth.
    const std::unique_lock<std::recursive_mutex> lock(mMutex, std::adopt_lock);
    const bool undone = isUndone();
    if (--mTransactionDepth != 0) return kOk;
    if (undone) return success ? kFailed : kOk;
    if (success) {
        if (execRetried("COMMIT TRANSACTION") == kOk) return kOk;
        (void)step("ROLLBACK TRANSACTION", {});
        SYNC_ERR("rollback trans");
        return kFailed;
    }
    (void)step("ROLLBACK TRANSACTION", {});
    return kOk;
}

int SyncDatabase::write(std::string_view sql, Params params) {
    const std::lock_guard lock(mMutex);
    if (mpHandle == nullptr && openDb() != kOk) {
        SYNC_ERR("Database is not opened");
        return kFailed;
    }
    // Outside of a transaction a statement is one by itself.
    const int code = step(sql, params);
    if (code == SQLITE_DONE || code == SQLITE_ROW) return kOk;
    SYNC_ERR("execDb() failed: %s", sqlite3_errmsg(mpHandle));
    return kFailed;
}

int SyncDatabase::read(std::string_view sql, Params params, bool firstOnly,
                       const std::function<void(const Row&)>& use) {
    const std::lock_guard lock(mMutex);
    if (mpHandle == nullptr) {
        if (const int result = openDb(); result != kOk) {
            SYNC_ERR("%s", mNotOpenedText);
            return result;
        }
    }
    sqlite3_stmt* statement = prepare(sql);
    if (statement == nullptr) {
        SYNC_ERR("sqlite3_prepare_v2(%s) failed(%s).", std::string(sql).c_str(), sqlite3_errmsg(mpHandle));
        return kFailed;
    }
    const StatementUse reset(statement);
    int index = 0;
    for (const Param& param : params) {
        if (param.bind(statement, ++index) != SQLITE_OK) return kFailed;
    }
    int code = sqlite3_step(statement);
    bool found = false;
    while (code == SQLITE_ROW) {
        found = true;
        use(Row(statement));
        if (firstOnly) return kOk;
        code = sqlite3_step(statement);
    }
    if (code != SQLITE_DONE) {
        SYNC_ERR("sqlite3_step() failed(%d, %s).", code, sqlite3_errmsg(mpHandle));
        return kFailed;
    }
    return found || !firstOnly ? kOk : kFailed;
}

int SyncDatabase::readRow(std::string_view sql, Params params, const std::function<void(const Row&)>& use) {
    return read(sql, params, /*firstOnly=*/true, use);
}

int SyncDatabase::readAll(std::string_view sql, Params params, const std::function<void(const Row&)>& use) {
    return read(sql, params, /*firstOnly=*/false, use);
}

int SyncDatabase::changes() const {
    return sqlite3_changes(mpHandle);
}
