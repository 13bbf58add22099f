// The call interface inside the daemon, with a storage that is full when a test says so. One device for all tests: the service
// is made once a process.
#include <gtest/gtest.h>

#include <string>

#include "calendar/CalDataManager.h"
#include "common/Handles.h"
#include "common/SyncService.h"
#include "common/SyncUtil.h"
#include "common/vantor_pim_sync.h"
#include "contacts/CtDataManager.h"
#include "platform/account.h"
#include "platform/contacts.h"
#include "platform/database.h"
#include "support/TestRoot.h"

struct CtDataManagerProbe {
    static bool isPending(CtDataManager& manager, int addressBookId) {
        return manager.mPending[addressBookId];
    }
};

namespace {

int gStorage = 0;

constexpr auto kCalendar = VANTOR_PIM_SYNC_TYPE_CALENDAR;
constexpr const char* kAccountStore = "/opt/usr/dbspace/.vantor_pim_sync_account.db";

const TestRoot& device() {
    static const TestRoot* const root = [] {
        auto* made = new TestRoot;
        EXPECT_EQ(account_insert(7, "com.morvane.vantor-service-account-lite", "me@x"), 0);
        atexit([] { delete &device(); });
        return made;
    }();
    return *root;
}

vantor_pim_sync_account_s record(int id, bool calendarSync) {
    vantor_pim_sync_account_s fields{};
    fields.account_id = id;
    fields.calsync = calendarSync;
    return fields;
}

int stateOf(int id, int type) {
    int state = -1;
    EXPECT_EQ(vantor_pim_sync_get_state(id, static_cast<vantor_pim_sync_type_e>(type), &state), 0);
    return state;
}

void changeStore(const char* sql) {
    sqlite3* database = nullptr;
    ASSERT_EQ(db_util_open(device().at(kAccountStore).c_str(), &database, 0), SQLITE_OK);
    EXPECT_EQ(sqlite3_exec(database, sql, nullptr, nullptr, nullptr), SQLITE_OK);
    db_util_close(database);
}

void addBook(int accountId) {
    CalListInfo entry;
    entry.id = "book-" + std::to_string(accountId);
    entry.etag = "1";
    ASSERT_EQ(CalDataManager::getInstance().insertCalendarbook(accountId, entry), 0);
}

size_t booksOf(int accountId) {
    std::list<std::string> uris;
    EXPECT_EQ(CalDataManager::getInstance().getAllCalendarbookUri(accountId, &uris), 0);
    return uris.size();
}

}  // namespace

int is_storage_full() {
    return gStorage;
}

TEST(SyncInterface, AFullStorageRefusesWhatWrites) {
    device();
    const vantor_pim_sync_account_s account = record(7, /*calendarSync=*/true);
    for (const int code : {-1, -28}) {
        gStorage = code;
        EXPECT_EQ(vantor_pim_sync_add_account(&account), -28);
        EXPECT_EQ(vantor_pim_sync_update_account(&account), -28);
        EXPECT_EQ(vantor_pim_sync_start(99, kCalendar), -28) << "before the account is looked for";
    }
    EXPECT_FALSE(SyncService::exists()) << "the service was not asked";
    EXPECT_EQ(vantor_pim_sync_stop(99, kCalendar), -1);
    EXPECT_EQ(vantor_pim_sync_remove_account(99), -1);
    EXPECT_EQ(stateOf(7, 0), SYNC_AGENT_STATE_NONE);
    gStorage = 0;
    EXPECT_EQ(vantor_pim_sync_start(99, kCalendar), -1);
    ASSERT_EQ(vantor_pim_sync_add_account(&account), 0);
    gStorage = -28;
    EXPECT_EQ(vantor_pim_sync_remove_account(7), 0) << "removing makes room";
    gStorage = 0;
}

TEST(SyncInterface, ArgumentsThatNameNothing) {
    device();
    EXPECT_EQ(vantor_pim_sync_add_account(nullptr), -1);
    EXPECT_EQ(vantor_pim_sync_update_account(nullptr), -1);
    EXPECT_EQ(vantor_pim_sync_get_account(7, nullptr), -1);
    EXPECT_EQ(vantor_pim_sync_get_sync_time(7, kCalendar, nullptr), -1);
    EXPECT_EQ(vantor_pim_sync_get_state(7, kCalendar, nullptr), 0);
    EXPECT_EQ(vantor_pim_sync_remove_state_changed_cb(kCalendar, nullptr, nullptr), 0);
}

TEST(SyncService, AnAccountThatTheStoreKeepsCanBeRemovedAgain) {
    device();
    const vantor_pim_sync_account_s account = record(8, /*calendarSync=*/true);
    ASSERT_EQ(vantor_pim_sync_add_account(&account), 0);
    changeStore("CREATE TRIGGER keep BEFORE DELETE ON account_table BEGIN SELECT RAISE(ABORT, 'kept'); END");
    EXPECT_EQ(vantor_pim_sync_remove_account(8), -1);
    int time = -1;
    EXPECT_EQ(vantor_pim_sync_get_sync_time(8, kCalendar, &time), 0)
        << "it is still there, and is said to be";
    changeStore("DROP TRIGGER keep");
    EXPECT_EQ(vantor_pim_sync_remove_account(8), 0);
    EXPECT_EQ(vantor_pim_sync_get_sync_time(8, kCalendar, &time), -1);
}

TEST(SyncService, RemovalTakesWhatWasDownloadedBeforeSyncWasSwitchedOffAndOfItsOwnAccountOnly) {
    device();
    const vantor_pim_sync_account_s account = record(9, /*calendarSync=*/false);
    ASSERT_EQ(vantor_pim_sync_add_account(&account), 0);
    EXPECT_EQ(stateOf(9, 0), SYNC_AGENT_STATE_NONE) << "no agent";
    addBook(9);
    addBook(99);
    EXPECT_EQ(vantor_pim_sync_remove_account(99), -1);
    EXPECT_EQ(vantor_pim_sync_remove_account(9), 0);
    EXPECT_EQ(booksOf(9), 0U);
    EXPECT_EQ(booksOf(99), 1U);
}

TEST(SyncService, AContactUploadThatIsQueuedIsAskedForOnce) {
    device();
    constexpr int kId = 10;
    vantor_pim_sync_account_s account = record(kId, /*calendarSync=*/false);
    account.ctsync = true;
    ASSERT_EQ(vantor_pim_sync_add_account(&account), 0);
    CtDataManager& manager = CtDataManager::getInstance();
    int book = 0;
    ASSERT_EQ(manager.getAddressBookId(kId, &book), 0);
    // The main loop does not run: the download has begun and does not end.
    ASSERT_EQ(vantor_pim_sync_start(kId, VANTOR_PIM_SYNC_TYPE_CONTACTS), 0);
    CtDataManager::changedContactCallback(_contacts_contact, &manager);
    EXPECT_FALSE(CtDataManagerProbe::isPending(manager, book)) << "nothing was changed";
    contacts_record_h raw = nullptr;
    ASSERT_EQ(contacts_record_create(_contacts_contact, &raw), 0);
    const ContactsRecord contact(raw);
    ASSERT_EQ(contacts_record_set_int(raw, CONTACTS_CONTACT_ADDRESS_BOOK_ID, book), 0);
    ASSERT_EQ(contacts_db_insert_record(raw, nullptr), 0);
    CtDataManager::changedContactCallback(_contacts_contact, &manager);
    EXPECT_TRUE(CtDataManagerProbe::isPending(manager, book));
    ASSERT_EQ(manager.setAccountChanged(kId), 0);
    EXPECT_FALSE(CtDataManagerProbe::isPending(manager, book)) << "the run has looked";
    EXPECT_FALSE(SyncService::getInstance().requestUpSync(99, VANTOR_PIM_SYNC_TYPE_CONTACTS));
}
