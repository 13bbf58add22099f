// The account service's records and queries.
#include "platform/account.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "AccountStore.h"
#include "platform/error.h"
#include "platform/log.h"
#include "platform/root.h"

using platform::SqlStore;
using platform::account::AccountRow;
using platform::account::store;

struct account_s {
    AccountRow row;
};

namespace {

AccountRow rowOf(sqlite3_stmt* row) {
    return {.id = sqlite3_column_int(row, 0),
            .package = SqlStore::text(row, 1),
            .email = SqlStore::text(row, 2),
            .syncStatus = sqlite3_column_int(row, 3)};
}

constexpr const char* kAddEvent = "INSERT INTO events(type, account_id) VALUES(?, ?)";
// Subscribers look within seconds; what is older was told long ago.
constexpr const char* kPruneEvents =
    "DELETE FROM events WHERE sequence <= (SELECT max(sequence) FROM events) - 1000";

constexpr const char* kPackagesFolder = "/opt/usr/data/accounts/packages";
constexpr mode_t kPackagesMode = 0770;
constexpr mode_t kMarkMode = 0664;

// The file that is there while a package has accounts; empty for a name that is none of a file.
std::string markOf(const std::string& package) {
    if (package.empty() || package.front() == '.' || package.find('/') != std::string::npos) return {};
    return platform::rootedPath(kPackagesFolder) + "/" + package;
}

// Makes the mark, or gives the one that is there a new time. What is only told is no reason for a call to fail.
void setMark(const std::string& package) {
    const std::string path = markOf(package);
    if (path.empty() || platform::makeFolder(kPackagesFolder, kPackagesMode) != PLATFORM_ERROR_NONE) return;
    const int fd = open(path.c_str(), O_WRONLY | O_CREAT | O_NOFOLLOW | O_CLOEXEC, kMarkMode);
    if (fd == -1 || !platform::giveToFolderOwner(fd, path) || futimens(fd, nullptr) != 0)
        dlog_print(DLOG_ERROR, "PLATFORM_ACCOUNT", "%s: %s, ignoring", path.c_str(), std::strerror(errno));
    if (fd != -1) close(fd);
}

bool hasAccounts(const std::string& package) {
    bool found = false;
    const int code =
        store().read("SELECT 1 FROM accounts WHERE package = ?", {package}, [&found](sqlite3_stmt*) {
            found = true;
            return false;
        });
    return found || code != PLATFORM_ERROR_NONE;
}

void clearMark(const std::string& package) {
    const std::string path = markOf(package);
    if (path.empty() || hasAccounts(package)) return;
    unlink(path.c_str());
    if (hasAccounts(package)) setMark(package);  // registered by another process meanwhile
}

// A process that ended between its registration and the mark has left none.
void makeMissingMarks() {
    std::vector<std::string> packages;
    const int code =
        store().read("SELECT DISTINCT package FROM accounts", {}, [&packages](sqlite3_stmt* row) {
            packages.push_back(SqlStore::text(row, 0));
            return true;
        });
    if (code != PLATFORM_ERROR_NONE) return;
    for (const std::string& package : packages) {
        const std::string path = markOf(package);
        if (!path.empty() && access(path.c_str(), F_OK) != 0) setMark(package);
    }
}

}  // namespace

int account_connect() {
    const int code = store().open();
    if (code == PLATFORM_ERROR_NONE) makeMissingMarks();
    return code;
}

int account_disconnect() {
    return PLATFORM_ERROR_NONE;
}

int account_create(account_h* account) {
    if (account == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    *account = new account_s;
    return PLATFORM_ERROR_NONE;
}

int account_destroy(account_h account) {
    delete account;
    return PLATFORM_ERROR_NONE;
}

int account_query_account_by_account_id(int account_id, account_h* account) {
    if (account == nullptr || *account == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    bool found = false;
    const int code = store().read("SELECT id, package, email, sync_status FROM accounts WHERE id = ?",
                                  {int64_t{account_id}}, [&](sqlite3_stmt* row) {
                                      (*account)->row = rowOf(row);
                                      found = true;
                                      return false;
                                  });
    if (code != PLATFORM_ERROR_NONE) return code;
    return found ? PLATFORM_ERROR_NONE : PLATFORM_ERROR_NOT_FOUND;
}

int account_query_account_by_package_name(account_cb callback, const char* package_name, void* user_data) {
    if (callback == nullptr || package_name == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    std::vector<account_s> found;
    const int code =
        store().read("SELECT id, package, email, sync_status FROM accounts WHERE package = ? ORDER BY id",
                     {std::string(package_name)}, [&found](sqlite3_stmt* row) {
                         found.push_back({rowOf(row)});
                         return true;
                     });
    if (code != PLATFORM_ERROR_NONE) return code;
    if (found.empty()) return PLATFORM_ERROR_NOT_FOUND;
    for (account_s& account : found) {
        if (!callback(&account, user_data)) break;
    }
    return PLATFORM_ERROR_NONE;
}

int account_get_account_id(account_h account, int* account_id) {
    if (account == nullptr || account_id == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    *account_id = account->row.id;
    return PLATFORM_ERROR_NONE;
}

int account_get_email_address(account_h account, const char** email) {
    if (account == nullptr || email == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    *email = account->row.email.c_str();
    return PLATFORM_ERROR_NONE;
}

int account_get_sync_support(account_h account, account_sync_state_e* status) {
    if (account == nullptr || status == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    *status = static_cast<account_sync_state_e>(account->row.syncStatus);
    return PLATFORM_ERROR_NONE;
}

int account_insert(int account_id, const char* package_name, const char* email) {
    if (account_id <= 0 || package_name == nullptr || *package_name == '\0')
        return PLATFORM_ERROR_INVALID_PARAMETER;
    const int code =
        store().write({{"INSERT INTO accounts(id, package, email, sync_status) VALUES(?, ?, ?, ?)",
                        {int64_t{account_id}, std::string(package_name),
                         std::string(email != nullptr ? email : ""), int64_t{ACCOUNT_SYNC_STATUS_OFF}}},
                       {kAddEvent, {std::string("insert"), int64_t{account_id}}},
                       {kPruneEvents, {}}});
    if (code == PLATFORM_ERROR_NONE) setMark(package_name);
    return code;
}

namespace {

// A write of one account with its event; PLATFORM_ERROR_NOT_FOUND when there is no such account.
int writeOne(const char* event, int accountId, const SqlStore::Statement& statement) {
    bool known = false;
    const int code =
        store().read("SELECT 1 FROM accounts WHERE id = ?", {int64_t{accountId}}, [&known](sqlite3_stmt*) {
            known = true;
            return false;
        });
    if (code != PLATFORM_ERROR_NONE) return code;
    if (!known) return PLATFORM_ERROR_NOT_FOUND;
    return store().write(
        {statement, {kAddEvent, {std::string(event), int64_t{accountId}}}, {kPruneEvents, {}}});
}

}  // namespace

int account_delete(int account_id) {
    std::string package;
    const int known = store().read("SELECT package FROM accounts WHERE id = ?", {int64_t{account_id}},
                                   [&package](sqlite3_stmt* row) {
                                       package = SqlStore::text(row, 0);
                                       return false;
                                   });
    if (known != PLATFORM_ERROR_NONE) return known;
    const int code =
        writeOne("delete", account_id, {"DELETE FROM accounts WHERE id = ?", {int64_t{account_id}}});
    if (code == PLATFORM_ERROR_NONE) clearMark(package);
    return code;
}

int account_update_sync_status_by_id(int account_id, int status) {
    if (status < ACCOUNT_SYNC_INVALID || status > ACCOUNT_SYNC_STATUS_RUNNING)
        return PLATFORM_ERROR_INVALID_PARAMETER;
    return writeOne(
        "sync_update", account_id,
        {"UPDATE accounts SET sync_status = ? WHERE id = ?", {int64_t{status}, int64_t{account_id}}});
}
