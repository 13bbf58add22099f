#include "common/AccountDBHelper.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "common/Handles.h"
#include "common/SyncLog.h"
#include "platform/root.h"

using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kStorageFull;
using Row = SyncDatabase::Row;

namespace {

constexpr const char* kPath = "/opt/usr/dbspace/.vantor_pim_sync_account.db";
constexpr const char* kTrustedFolder =
    "/opt/usr/apps/com.morvane.vantor-service-account-lite/shared/trusted/";

constexpr const char* kSchema[] = {
    "CREATE TABLE account_table(account_id INTEGER PRIMARY KEY, email TEXT, ssl INTEGER, calsync INTEGER, "
    "calserver TEXT, "
    "calserverport INTEGER, calperiod INTEGER DEFAULT 0, ctsync INTEGER, ctserver TEXT, ctserverport "
    "INTEGER, ctperiod "
    "INTEGER DEFAULT 0, roaming INTEGER DEFAULT 0, calsyncedtime INTEGER DEFAULT 0, ctsyncedtime INTEGER "
    "DEFAULT 0);",
};

// The columns of "select *".
enum Column {
    kAccountId,
    kEmail,
    kSsl,
    kCalSync,
    kCalServer,
    kCalServerPort,
    kCalPeriod,
    kCtSync,
    kCtServer,
    kCtServerPort,
    kCtPeriod,
    kRoaming,
};

char* copyText(const Row& row, int column) {
    return row.isNull(column) ? nullptr : strdup(row.text(column).c_str());
}

void fillRecord(const Row& row, vantor_pim_sync_account_s* record) {
    record->account_id = row.integer(kAccountId);
    record->email = copyText(row, kEmail);
    record->ssl = row.integer(kSsl) != 0;
    record->calsync = row.integer(kCalSync) != 0;
    record->calserver = copyText(row, kCalServer);
    record->calserverport = row.integer(kCalServerPort);
    record->calperiod = row.integer(kCalPeriod);
    record->ctsync = row.integer(kCtSync) != 0;
    record->ctserver = copyText(row, kCtServer);
    record->ctserverport = row.integer(kCtServerPort);
    record->ctperiod = row.integer(kCtPeriod);
    record->roaming = row.integer(kRoaming);
}

struct FreeRecord {
    void operator()(vantor_pim_sync_account_s* record) const noexcept {
        vantor_pim_sync_free_account(record);
    }
};
using RecordPtr = std::unique_ptr<vantor_pim_sync_account_s, FreeRecord>;

RecordPtr newRecord() {
    return RecordPtr(static_cast<vantor_pim_sync_account_s*>(calloc(1, sizeof(vantor_pim_sync_account_s))));
}

using File = std::unique_ptr<FILE, FreeWith<fclose>>;

// The token file, never through a link; NULL with errno when it is none. *info is what was opened, whatever lay there before.
File openToken(const char* path, struct stat* info) {
    constexpr off_t kMaxTokenBytes = 64 * 1024;
    const int fd = open(path, O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC);
    File file(fd != -1 ? fdopen(fd, "rb") : nullptr);
    if (!file) {
        if (fd != -1) close(fd);
        return nullptr;
    }
    if (fstat(fd, info) != 0) return nullptr;
    if (!S_ISREG(info->st_mode) || info->st_size > kMaxTokenBytes) {
        file.reset();
        errno = EINVAL;
    }
    return file;
}

}  // namespace

AccountDBHelper& AccountDBHelper::getInstance() {
    static AccountDBHelper* const instance = new AccountDBHelper;
    return *instance;
}

AccountDBHelper::AccountDBHelper() : mDatabase(kPath, kSchema, "Database is not opened") {}

int AccountDBHelper::makeDb() {
    return mDatabase.makeDb();
}

int AccountDBHelper::openDb() {
    return mDatabase.openDb();
}

int AccountDBHelper::execDb(std::string_view statement, SyncDatabase::Params params) {
    const int code = mDatabase.step(statement, params);
    if (code == SQLITE_ROW || code == SQLITE_DONE) return kOk;
    if (code == SQLITE_FULL) {
        SYNC_ERR("full");
        return kStorageFull;
    }
    return kFailed;
}

int AccountDBHelper::execLogged(std::string_view statement, SyncDatabase::Params params) {
    const int result = execDb(statement, params);
    if (result != kOk) SYNC_ERR("execDb() failed");
    return result;
}

bool AccountDBHelper::hasAccount(int accountId) {
    return mDatabase.readRow("select account_id FROM account_table WHERE account_id=?", {accountId},
                             [](const Row&) {}) == kOk;
}

int AccountDBHelper::getAllAccountIds(std::list<int>* accountIds) {
    return mDatabase.readAll("SELECT account_id FROM account_table ", {},
                             [accountIds](const Row& row) { accountIds->push_back(row.integer(0)); });
}

int AccountDBHelper::getSyncTime(int accountId, int type, int* time) {
    return mDatabase.readRow(type == VANTOR_PIM_SYNC_TYPE_CALENDAR
                                 ? "select calsyncedtime FROM account_table WHERE account_id=?"
                                 : "select ctsyncedtime FROM account_table WHERE account_id=?",
                             {accountId}, [time](const Row& row) { *time = row.integer(0); });
}

int AccountDBHelper::updateSyncTime(int accountId, int type, int time) {
    return execDb(type == VANTOR_PIM_SYNC_TYPE_CALENDAR
                      ? "UPDATE account_table SET calsyncedtime=? WHERE account_id=?"
                      : "UPDATE account_table SET ctsyncedtime=? WHERE account_id=?",
                  {time, accountId});
}

int AccountDBHelper::insertAccount(const Account& account) {
    return execLogged(
        "INSERT INTO account_table(account_id, email, ssl, calsync, calserver, calserverport, calperiod, "
        "ctsync, ctserver, "
        "ctserverport, ctperiod, roaming) VALUES(?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?)",
        {account.getAccountId(), account.getEmail(), account.getSsl(), account.getCalendarSync(),
         account.getCalendarServer(), account.getCalendarServerPort(), account.getCalendarPeriod(),
         account.getContactsSync(), account.getContactsServer(), account.getContactsServerPort(),
         account.getContactsPeriod(), account.getRoaming()});
}

int AccountDBHelper::updateAccount(const Account& account) {
    return execLogged(
        "UPDATE account_table SET email=?, ssl=?, calsync=?, calserver=?, calserverport=?, calperiod=?, "
        "ctsync=?, ctserver=?, "
        "ctserverport=?, ctperiod=?,roaming=? WHERE account_id=?",
        {account.getEmail(), account.getSsl(), account.getCalendarSync(), account.getCalendarServer(),
         account.getCalendarServerPort(), account.getCalendarPeriod(), account.getContactsSync(),
         account.getContactsServer(), account.getContactsServerPort(), account.getContactsPeriod(),
         account.getRoaming(), account.getAccountId()});
}

int AccountDBHelper::updateAccount(const vantor_pim_sync_account_s& record) {
    // The stored row takes the record's values by the rules of an account in memory.
    const RecordPtr stored = newRecord();
    if (!stored) return kFailed;
    const int read = mDatabase.readRow("select * FROM account_table WHERE account_id=?", {record.account_id},
                                       [&stored](const Row& row) { fillRecord(row, stored.get()); });
    if (read != kOk) {
        SYNC_ERR("execDb() failed");
        return read;
    }
    Account account(*stored);
    account.update(&record);
    return updateAccount(account);
}

int AccountDBHelper::deleteAccount(int accountId) {
    return execLogged("DELETE FROM account_table WHERE account_id=?", {accountId});
}

int AccountDBHelper::getAccount(int accountId, vantor_pim_sync_account_s* record) {
    *record = vantor_pim_sync_account_s{};
    if (mDatabase.readRow("select * FROM account_table WHERE account_id=?", {accountId},
                          [record](const Row& row) { fillRecord(row, record); }) != kOk) {
        return kFailed;
    }
    std::string key;
    const int result = getSecureKey(accountId, &key);
    record->refresh_token = strdup(key.c_str());
    if (result != kOk) {
        SYNC_ERR("secure key fail");
        return kFailed;
    }
    return kOk;
}

int AccountDBHelper::getAllAccounts(std::list<std::unique_ptr<Account>>* accounts) {
    std::vector<RecordPtr> records;
    const int result = mDatabase.readAll("SELECT * FROM account_table", {}, [&records](const Row& row) {
        records.push_back(newRecord());
        if (records.back()) fillRecord(row, records.back().get());
    });
    if (result != kOk) return result;
    for (const RecordPtr& record : records) {
        SYNC_ASSERT_TEXT(record != nullptr, "pAccount");
        std::string key;
        if (getSecureKey(record->account_id, &key) != kOk) {
            SYNC_ERR("get token fail");
            SYNC_ERR("account %d has no readable refresh token in %s%d_file, the daemon cannot run with it",
                     record->account_id, kTrustedFolder, record->account_id);
            SYNC_ASSERT_TEXT(false, "0");
        }
        record->refresh_token = strdup(key.c_str());
        accounts->push_back(std::make_unique<Account>(*record));
    }
    return kOk;
}

int AccountDBHelper::getSecureKey(int accountId, std::string* key) {
    char name[1024];
    char path[1024];
    snprintf(name, sizeof name, "%d_%s", accountId, "file");
    snprintf(path, sizeof path, "%s%s", platform::rootedPath(kTrustedFolder).c_str(), name);
    // The reasons of our own have an error number too, so that the log never says "Success".
    struct stat info {};
    int error = lstat(path, &info) != 0 ? errno : 0;
    if (error == 0 && info.st_size < 1) error = ENODATA;
    if (error != 0) {
        SYNC_ERR("stat(%s) failed : %s", path, strerror(error));
        return kFailed;
    }
    const File file = openToken(path, &info);
    if (!file) {
        SYNC_ERR("fopen(%s) failed : %s", path, strerror(errno));
        return kFailed;
    }
    std::string content(static_cast<size_t>(info.st_size), '\0');
    errno = ENODATA;
    if (fread(content.data(), 1, content.size(), file.get()) == 0) {
        SYNC_ERR("fread(%s) failed : %s", path, strerror(errno));
        return kFailed;
    }
    content.resize(strnlen(content.c_str(), content.size()));
    if (content.ends_with('\n')) content.pop_back();
    if (content.ends_with('\r')) content.pop_back();
    *key = content;
    return kOk;
}
