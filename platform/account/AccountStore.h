// AccountStore: the file behind the account service.
#pragma once

#include <string>

#include "../base/SqlStore.h"

namespace platform::account {

struct AccountRow {
    int id = 0;
    std::string package;
    std::string email;
    int syncStatus = 0;
};

// One for the process, never destroyed.
inline SqlStore& store() {
    static SqlStore* const instance = new SqlStore(
        "/opt/usr/data/accounts/accounts.db",
        db_schema_s{"CREATE TABLE accounts(id INTEGER PRIMARY KEY, package TEXT NOT NULL, email TEXT NOT "
                    "NULL, sync_status INTEGER NOT NULL);"
                    "CREATE TABLE events(sequence INTEGER PRIMARY KEY AUTOINCREMENT, type TEXT NOT NULL, "
                    "account_id INTEGER NOT NULL)"});
    return *instance;
}

}  // namespace platform::account
