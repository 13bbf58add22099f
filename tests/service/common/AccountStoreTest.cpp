// Accounts in memory and in the store.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <fstream>

#include "common/AccountDBHelper.h"
#include "support/FullDisk.h"
#include "support/TestRoot.h"

namespace {

vantor_pim_sync_account_s fields(int id) {
    vantor_pim_sync_account_s record{};
    record.account_id = id;
    return record;
}

void writeToken(const TestRoot& root, int id, const std::string& text) {
    std::ofstream(root.at("/opt/usr/apps/com.morvane.vantor-service-account-lite/shared/trusted/") /
                  (std::to_string(id) + "_file"))
        << text;
}

}  // namespace

TEST(Account, AnUpdateKeepsWhatItDoesNotName) {
    std::string email = "me@x";
    std::string server = "host";
    vantor_pim_sync_account_s record = fields(7);
    record.email = email.data();
    record.calserver = server.data();
    record.calserverport = 443;
    record.calperiod = 15;
    Account account(record);
    vantor_pim_sync_account_s change = fields(7);
    change.calserverport = -1;
    change.calsync = true;
    account.update(&change);
    EXPECT_EQ(account.getEmail(), "me@x");
    EXPECT_EQ(account.getCalendarServerPort(), 443);
    EXPECT_EQ(account.getCalendarPeriod(), 0) << "periods are always taken";
    EXPECT_TRUE(account.getCalendarSync());
    EXPECT_DEATH(account.update(nullptr), "pAccountInfo");
}

TEST(AccountDBHelper, KeepsAccountsAndSyncTimes) {
    const TestRoot root;
    AccountDBHelper store;
    EXPECT_FALSE(store.hasAccount(7));
    for (const char* suffix : {"", "-journal"}) {
        struct stat info {};
        const std::string path = root.at("/opt/usr/dbspace/.vantor_pim_sync_account.db").string() + suffix;
        ASSERT_EQ(stat(path.c_str(), &info), 0);
        EXPECT_EQ(info.st_mode & 0777, 0660U);
    }
    std::string email = "it's me\n\"x\"";
    std::string server(10'000, 's');
    vantor_pim_sync_account_s record = fields(7);
    record.email = email.data();
    record.calserver = server.data();
    record.calserverport = 8443;
    record.ssl = true;
    record.roaming = 1;
    ASSERT_EQ(store.insertAccount(Account(record)), 0);
    EXPECT_EQ(store.insertAccount(Account(record)), -1);

    vantor_pim_sync_account_s change = fields(7);
    change.calperiod = 30;
    ASSERT_EQ(store.updateAccount(change), 0);
    EXPECT_NE(store.updateAccount(fields(8)), 0);

    vantor_pim_sync_account_s got{};
    EXPECT_EQ(store.getAccount(7, &got), -1) << "no token file";
    EXPECT_STREQ(got.email, email.c_str());
    EXPECT_STREQ(got.calserver, server.c_str());
    EXPECT_EQ(got.calserverport, 8443);
    EXPECT_EQ(got.calperiod, 30);
    EXPECT_STREQ(got.refresh_token, "");
    for (char* text : {got.email, got.calserver, got.ctserver, got.refresh_token}) free(text);

    int time = -1;
    ASSERT_EQ(store.updateSyncTime(7, 0, 111), 0);
    ASSERT_EQ(store.updateSyncTime(7, 1, 222), 0);
    ASSERT_EQ(store.getSyncTime(7, 0, &time), 0);
    EXPECT_EQ(time, 111);
    ASSERT_EQ(store.getSyncTime(7, 5, &time), 0);
    EXPECT_EQ(time, 222) << "any other type is the contacts";
    EXPECT_EQ(store.getSyncTime(8, 0, &time), -1);
    ASSERT_EQ(store.deleteAccount(7), 0);
    EXPECT_FALSE(store.hasAccount(7));
}

TEST(AccountDBHelper, AFullDiskIsToldAndLeavesWhatWasThere) {
    const TestRoot root;
    ASSERT_EQ(AccountDBHelper().insertAccount(Account(fields(7))), 0);
    auto disk = std::make_unique<FullDisk>();
    AccountDBHelper store;
    std::string large(10'000, 'e');
    for (const int id : {7, 8}) {
        vantor_pim_sync_account_s record = fields(id);
        record.email = large.data();
        EXPECT_EQ(id == 7 ? store.updateAccount(record) : store.insertAccount(Account(record)), -28) << id;
    }
    disk.reset();
    std::list<int> ids;
    ASSERT_EQ(AccountDBHelper().getAllAccountIds(&ids), 0);
    EXPECT_EQ(ids, std::list<int>{7});
    EXPECT_EQ(store.updateSyncTime(7, 0, 111), 0) << "what needs no room goes on";
}

TEST(AccountDBHelper, TokensComeFromTheirFiles) {
    const TestRoot root;
    AccountDBHelper store;
    struct Row {
        const char* content;
        int result;
        const char* token;
    };
    for (const Row& row : {Row{"", -1, "before"}, Row{"abc\n", 0, "abc"}, Row{"abc\r\n", 0, "abc"},
                           Row{"a b\n\n", 0, "a b\n"}, Row{"abc", 0, "abc"}}) {
        writeToken(root, 7, row.content);
        std::string token = "before";
        EXPECT_EQ(store.getSecureKey(7, &token), row.result) << row.content;
        EXPECT_EQ(token, row.token);
    }
    const auto trusted = root.at("/opt/usr/apps/com.morvane.vantor-service-account-lite/shared/trusted");
    std::filesystem::create_directory(trusted / "8_file");
    std::filesystem::create_symlink(trusted / "7_file", trusted / "9_file");
    ASSERT_EQ(mkfifo((trusted / "10_file").c_str(), 0600), 0);
    for (const int id : {8, 9, 10}) {
        std::string untouched = "before";
        EXPECT_EQ(store.getSecureKey(id, &untouched), -1) << "a folder, a link or a FIFO is no token";
        EXPECT_EQ(untouched, "before");
    }
    writeToken(root, 7, "");
    ASSERT_EQ(store.insertAccount(Account(fields(7))), 0);
    std::list<std::unique_ptr<Account>> accounts;
    EXPECT_DEATH((void)store.getAllAccounts(&accounts), "get token fail");
    writeToken(root, 7, "abc");
    ASSERT_EQ(store.getAllAccounts(&accounts), 0);
    EXPECT_EQ(accounts.front()->getRefreshToken(), "abc");
}

TEST(SyncDatabase, WhatFollowsInATransactionThatSqliteUndidIsNotWritten) {
    const TestRoot root;
    const char* const schema[] = {"CREATE TABLE t(v TEXT)"};
    const char* const insert = "INSERT INTO t(v) VALUES(?)";
    const auto rows = [](SyncDatabase& database) {
        int count = 0;
        EXPECT_EQ(database.readAll("SELECT v FROM t", {}, [&count](const SyncDatabase::Row&) { ++count; }),
                  0);
        return count;
    };
    ASSERT_EQ(SyncDatabase("/opt/usr/dbspace/t.db", schema).openDb(), 0);
    const FullDisk disk;
    SyncDatabase database("/opt/usr/dbspace/t.db", schema);
    {
        SyncTransaction transaction(database);
        ASSERT_TRUE(transaction.begun());
        EXPECT_EQ(database.write(insert, {std::string("before")}), 0);
        EXPECT_EQ(database.write(insert, {std::string(10'000, 'x')}), -1);
        EXPECT_EQ(database.write(insert, {std::string("after")}), -1);
        EXPECT_EQ(transaction.commit(), -1);
    }
    EXPECT_EQ(rows(database), 0);
    EXPECT_EQ(database.write(insert, {std::string("next")}), 0) << "the next transaction is one again";
    EXPECT_EQ(rows(database), 1);
}
