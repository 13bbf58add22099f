// AccountDBHelper: the daemon's account store, and the refresh-token files that the account application leaves.
// Owner: process-wide, made on first use, never destroyed.   Threads: any; the database's mutex guards every statement.
// Errors: 0, -1, or -28 for a full disk on a write. Records filled here belong to the caller (vantor_pim_sync_free_account).
#pragma once

#include <list>
#include <memory>
#include <string>

#include "common/Account.h"
#include "common/SyncDatabase.h"
#include "common/vantor_pim_sync.h"

class AccountDBHelper {
public:
    static AccountDBHelper& getInstance();
    AccountDBHelper();

    [[nodiscard]] int makeDb();
    [[nodiscard]] int openDb();

    [[nodiscard]] bool hasAccount(int accountId);
    [[nodiscard]] int getAllAccountIds(std::list<int>* accountIds);
    // Type 0 is the calendar, any other the contacts. No row: -1 without a log. Seconds since 1970.
    [[nodiscard]] int getSyncTime(int accountId, int type, int* time);
    [[nodiscard]] int updateSyncTime(int accountId, int type, int time);
    [[nodiscard]] int insertAccount(const Account& account);
    // NULL strings and ports of 0 or less keep what the store holds.
    [[nodiscard]] int updateAccount(const vantor_pim_sync_account_s& record);
    [[nodiscard]] int updateAccount(const Account& account);
    [[nodiscard]] int deleteAccount(int accountId);
    // Fills a caller-allocated record; -1 with the record filled when the token file cannot be read.
    [[nodiscard]] int getAccount(int accountId, vantor_pim_sync_account_s* record);
    // An account whose token file cannot be read ends the process: the daemon cannot run with it.
    [[nodiscard]] int getAllAccounts(std::list<std::unique_ptr<Account>>* accounts);

    // The account's refresh token, without the line end that an editor leaves.
    [[nodiscard]] int getSecureKey(int accountId, std::string* key);

private:
    [[nodiscard]] int execDb(std::string_view statement, SyncDatabase::Params params);
    [[nodiscard]] int execLogged(std::string_view statement, SyncDatabase::Params params);

    SyncDatabase mDatabase;
};
