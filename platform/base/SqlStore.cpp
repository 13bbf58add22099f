#include "SqlStore.h"

#include <sys/stat.h>

#include "OpenCode.h"
#include "platform/error.h"
#include "platform/log.h"
#include "platform/root.h"

namespace platform {

namespace {

constexpr int kBusyTimeoutMs = 10'000;
constexpr mode_t kFileMode = 0660;

struct Finalize {
    void operator()(sqlite3_stmt* statement) const noexcept { sqlite3_finalize(statement); }
};

bool isDone(int code) {
    return code == SQLITE_DONE || code == SQLITE_ROW;
}

}  // namespace

std::string SqlStore::path() const {
    return rootedPath(mFile);
}

int SqlStore::codeOf(int sqliteCode) const {
    if (isDone(sqliteCode) || sqliteCode == SQLITE_OK) return PLATFORM_ERROR_NONE;
    if (sqliteCode == SQLITE_CONSTRAINT) return PLATFORM_ERROR_INVALID_PARAMETER;
    dlog_print(DLOG_ERROR, "PLATFORM_STORE", "%s: %s", mOpenPath.c_str(), sqlite3_errmsg(mHandle));
    return sqliteCode == SQLITE_FULL ? PLATFORM_ERROR_NO_SPACE : PLATFORM_ERROR_DATABASE;
}

int SqlStore::open() {
    const std::lock_guard lock(mMutex);
    const std::string wanted = path();
    if (mHandle != nullptr && mOpenPath == wanted) return PLATFORM_ERROR_NONE;
    db_util_close(std::exchange(mHandle, nullptr));
    if (const int code = makeFolder(mFile.substr(0, mFile.rfind('/')), 0770); code != PLATFORM_ERROR_NONE)
        return code;
    if (const int code = db_util_open(wanted.c_str(), &mHandle, mSchema.version()); code != SQLITE_OK)
        return codeOfOpen(code, wanted);
    mOpenPath = wanted;
    const int code = codeOf(db_util_apply_schema(mHandle, mSchema));
    if (code != PLATFORM_ERROR_NONE) db_util_close(std::exchange(mHandle, nullptr));
    // Only its owner may, and needs to: whoever made the file.
    for (const std::string& file : {wanted, wanted + "-journal"}) (void)chmod(file.c_str(), kFileMode);
    return code;
}

int SqlStore::step(const char* sql, std::initializer_list<Param> params,
                   const std::function<bool(sqlite3_stmt*)>& use) {
    sqlite3_stmt* raw = nullptr;
    int code = sqlite3_prepare_v2(mHandle, sql, -1, &raw, nullptr);
    const std::unique_ptr<sqlite3_stmt, Finalize> statement(raw);
    int index = 0;
    for (const Param& param : params) {
        if (code != SQLITE_OK) break;
        ++index;
        if (const auto* number = std::get_if<int64_t>(&param)) {
            code = sqlite3_bind_int64(raw, index, *number);
        } else {
            const auto& text = std::get<std::string>(param);
            code = sqlite3_bind_text(raw, index, text.data(), static_cast<int>(text.size()), SQLITE_STATIC);
        }
    }
    if (code == SQLITE_OK) code = sqlite3_step(raw);
    while (code == SQLITE_ROW && use && use(raw)) code = sqlite3_step(raw);
    return code;
}

int SqlStore::write(std::initializer_list<Statement> statements, int* changes) {
    const std::lock_guard lock(mMutex);
    if (const int code = open(); code != PLATFORM_ERROR_NONE) return code;
    int code = step("BEGIN IMMEDIATE", {}, nullptr);
    for (const Statement& statement : statements) {
        if (isDone(code)) code = step(statement.sql, statement.params, nullptr);
    }
    if (isDone(code) && changes != nullptr) *changes = sqlite3_changes(mHandle);
    if (isDone(code)) code = step("COMMIT", {}, nullptr);
    const int result = codeOf(code);
    if (!isDone(code) && sqlite3_get_autocommit(mHandle) == 0) (void)step("ROLLBACK", {}, nullptr);
    return result;
}

int SqlStore::read(const char* sql, std::initializer_list<Param> params,
                   const std::function<bool(sqlite3_stmt*)>& use) {
    const std::lock_guard lock(mMutex);
    if (const int code = open(); code != PLATFORM_ERROR_NONE) return code;
    return codeOf(step(sql, params, use));
}

void SqlStore::setBusyTimeout(int milliseconds) {
    const std::lock_guard lock(mMutex);
    sqlite3_busy_timeout(mHandle, milliseconds >= 0 ? milliseconds : kBusyTimeoutMs);
}

std::string SqlStore::text(sqlite3_stmt* row, int column) {
    const auto* data = static_cast<const char*>(sqlite3_column_blob(row, column));
    return data != nullptr ? std::string(data, static_cast<size_t>(sqlite3_column_bytes(row, column)))
                           : std::string();
}

}  // namespace platform
