#include "AccountStore.h"

#include "ReadOnlyDatabase.h"

namespace account_store {

namespace {

constexpr const char* kStore = "/opt/usr/dbspace/.vantor_pim_sync_account.db";

enum Column {
    kId,
    kEmail,
    kSsl,
    kRoaming,
    kCalSync,
    kCalServer,
    kCalServerPort,
    kCalPeriod,
    kCalSyncedTime,
    kCtSync,
    kCtServer,
    kCtServerPort,
    kCtPeriod,
    kCtSyncedTime,
};
constexpr const char* kSelect =
    "SELECT account_id, email, ssl, roaming, calsync, calserver, calserverport, calperiod, calsyncedtime,"
    " ctsync, ctserver, ctserverport, ctperiod, ctsyncedtime FROM account_table ORDER BY account_id";

StoredKind readKind(const SqliteStatement& row, int first) {
    StoredKind kind;
    kind.isEnabled = ReadOnlyDatabase::number(row, first) != 0;
    kind.server = ReadOnlyDatabase::text(row, first + 1);
    kind.port = ReadOnlyDatabase::number(row, first + 2);
    kind.periodMinutes = ReadOnlyDatabase::number(row, first + 3);
    kind.syncedSec = sqlite3_column_int64(row.get(), first + 4);
    return kind;
}

}  // namespace

std::map<int, StoredAccount> accounts() {
    std::map<int, StoredAccount> found;
    const ReadOnlyDatabase store(kStore);
    if (!store.isOpen()) return found;
    const SqliteStatement row = store.prepare(kSelect);
    while (store.step(row)) {
        StoredAccount& account = found[ReadOnlyDatabase::number(row, kId)];
        account.email = ReadOnlyDatabase::text(row, kEmail);
        account.ssl = ReadOnlyDatabase::number(row, kSsl) != 0;
        account.roaming = ReadOnlyDatabase::number(row, kRoaming) != 0;
        account.calendar = readKind(row, kCalSync);
        account.contacts = readKind(row, kCtSync);
    }
    return found;
}

}  // namespace account_store
