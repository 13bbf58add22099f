// The calendar sync metadata store on real files.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <sys/stat.h>

#include <atomic>
#include <fstream>
#include <nlohmann/json.hpp>
#include <thread>

#include "calendar/CalMetaDataDBHelper.h"
#include "common/SyncResult.h"
#include "support/TestRoot.h"

using sync_result::kFailed;
using sync_result::kOk;
using testing::ElementsAre;

namespace {

constexpr const char* kFile = "/opt/usr/dbspace/.vantor_pim_sync_calendar.db";

CalBookMetaData bookRow(int calendarId, int accountId, const std::string& uri) {
    CalBookMetaData row;
    row.calendar_id = calendarId;
    row.account_id = accountId;
    row.uri = uri;
    row.etag = "book-etag";
    return row;
}

CalEventMetaData eventRow(int eventId, int calendarId, const std::string& uri) {
    CalEventMetaData row;
    row.event_id = eventId;
    row.calendar_id = calendarId;
    row.sequence = 5;
    row.uri = uri;
    row.etag = "etag of " + uri;
    return row;
}

CalEventMetaData instanceRow(int eventId, int seriesId, const std::string& recurrenceId,
                             const std::string& uri) {
    CalEventMetaData row = eventRow(eventId, 1, uri);
    row.original_event_id = seriesId;
    row.recurrence_id = recurrenceId;
    return row;
}

}  // namespace

TEST(CalMetaDataDBHelper, TheFirstReadMakesTheFilesAndFindsNothing) {
    const TestRoot root;
    CalMetaDataDBHelper store;
    std::string uri = "before";
    EXPECT_EQ(store.getEventUri(1, &uri), kFailed);
    EXPECT_EQ(uri, "before");
    for (const char* suffix : {"", "-journal"}) {
        struct stat info {};
        ASSERT_EQ(stat((root.at(kFile).string() + suffix).c_str(), &info), 0) << suffix;
        EXPECT_EQ(info.st_mode & 0777, 0660U) << suffix;
    }
    std::list<std::string> uris;
    EXPECT_EQ(store.getAllCalendarbookUri(1, &uris), kOk);
}

TEST(CalMetaDataDBHelper, AStoreThatNobodyFinishedMakingIsMadeAgain) {
    const TestRoot root;
    std::filesystem::create_directories(root.at(kFile).parent_path());
    std::ofstream(root.at(kFile)).close();
    CalMetaDataDBHelper store;
    EXPECT_EQ(store.insertEvent(eventRow(1, 1, "a")), kOk);
    CalMetaDataDBHelper again;
    std::string uri;
    EXPECT_EQ(again.getEventUri(1, &uri), kOk);
    EXPECT_EQ(uri, "a");
}

TEST(CalMetaDataDBHelper, AnUnfinishedStoreThatCannotBeReadIsMadeOnceItCan) {
    const TestRoot root;
    sqlite3* unfinished = nullptr;
    ASSERT_EQ(sqlite3_open(root.at(kFile).c_str(), &unfinished), SQLITE_OK);
    ASSERT_EQ(sqlite3_exec(unfinished, "PRAGMA user_version = 1", nullptr, nullptr, nullptr), SQLITE_OK);
    sqlite3_close(unfinished);
    const std::string journal = root.at(kFile).string() + "-journal";
    std::filesystem::remove(journal);
    std::filesystem::create_directory(journal);
    CalMetaDataDBHelper store;
    EXPECT_NE(store.insertEvent(eventRow(1, 1, "a")), kOk);

    std::filesystem::remove(journal);

    EXPECT_EQ(store.insertEvent(eventRow(1, 1, "a")), kOk);
}

TEST(CalMetaDataDBHelper, DeletionsCascade) {
    const TestRoot root;
    CalMetaDataDBHelper store;
    ASSERT_EQ(store.insertCalendarbook(bookRow(1, 7, "c1")), kOk);
    ASSERT_EQ(store.insertCalendarbook(bookRow(2, 8, "c1")), kOk);
    for (const CalEventMetaData& row :
         {eventRow(10, 1, "a"), eventRow(11, 1, "s"), eventRow(12, 2, "a"),
          instanceRow(13, 11, "20260301", "s_1"), instanceRow(-11, 11, "20260302", "s_2")}) {
        ASSERT_EQ(store.insertEvent(row), kOk);
    }
    EXPECT_EQ(store.hasExceptionEvent(11), 2);
    EXPECT_EQ(store.hasExceptionEvent(10), 0);

    ASSERT_EQ(store.deleteEvent(1, "s"), kOk);
    std::vector<CalEventMetaData> rows;
    ASSERT_EQ(store.getAllItems(1, &rows), kOk);
    ASSERT_EQ(rows.size(), 1U);
    EXPECT_EQ(rows[0].event_id, 10);

    ASSERT_EQ(store.deleteAccount(8), kOk);
    rows.clear();
    ASSERT_EQ(store.getAllItems(2, &rows), kOk);
    EXPECT_TRUE(rows.empty());
    std::list<int> accounts;
    ASSERT_EQ(store.getAllAccountIds(&accounts), kOk);
    EXPECT_THAT(accounts, ElementsAre(7));
}

TEST(CalMetaDataDBHelper, MarksAndLookUps) {
    const TestRoot root;
    CalMetaDataDBHelper store;
    ASSERT_EQ(store.insertCalendarbook(bookRow(1, 7, "c1")), kOk);
    // An instance that was found locally carries its series' uri; the series owns it.
    ASSERT_EQ(store.insertEvent(instanceRow(20, 11, "20260301", "s")), kOk);
    ASSERT_EQ(store.insertEvent(eventRow(11, 1, "s")), kOk);
    int id = 0;
    ASSERT_EQ(store.getEventId(1, "s", &id), kOk);
    EXPECT_EQ(id, 11);

    EXPECT_EQ(store.updateEventDirty(11, 1), kOk);
    EXPECT_NE(store.updateEventDirty(99, 1), kOk);
    ASSERT_EQ(store.updateEventDeleted(20, 1), kOk);
    CalEventMetaData row;
    ASSERT_EQ(store.getEvent(11, &row), kOk);
    EXPECT_EQ(row.dirty, 1);
    EXPECT_EQ(row.sequence, 5);
    int dirty = 0;
    int deleted = 0;
    ASSERT_EQ(store.countPending(7, &dirty, &deleted), kOk);
    EXPECT_EQ(dirty, 1);
    EXPECT_EQ(deleted, 1);
    std::list<int> ids;
    ASSERT_EQ(store.getAllDirtyEventIds("c1", &ids), kOk);
    EXPECT_THAT(ids, ElementsAre(11));

    row = instanceRow(21, 11, "20260301", "own");
    ASSERT_EQ(store.updateExceptionEvent(row), kOk);
    ASSERT_EQ(store.getEvent(CalInstanceKey{11, "20260301"}, &row), kOk);
    EXPECT_EQ(row.event_id, 21);
    EXPECT_EQ(row.uri, "own");
}

TEST(CalMetaDataDBHelper, KeepsTextAsItIs) {
    const TestRoot root;
    CalMetaDataDBHelper store;
    ASSERT_EQ(store.insertCalendarbook(bookRow(1, 7, "it's")), kOk);
    std::ifstream file(VPS_CORPUS_DIR "/strings/naughty-strings.json");
    const nlohmann::json strings = nlohmann::json::parse(file);
    ASSERT_EQ(strings.size(), 515U);
    SyncTransaction transaction(store.database());
    ASSERT_TRUE(transaction.begun());
    int id = 100;
    for (const std::string text : strings) {
        ASSERT_EQ(store.insertEvent(eventRow(++id, 1, text)), kOk);
        std::string etag;
        ASSERT_EQ(store.getEventEtag(id, &etag), kOk);
        EXPECT_EQ(etag, "etag of " + text);
        EXPECT_EQ(store.getEventEtag(1, text, &etag), kOk) << text;
    }
    EXPECT_EQ(transaction.commit(), kOk);
}

TEST(CalMetaDataDBHelper, ATransactionIsWholeAndShutsOthersOut) {
    const TestRoot root;
    CalMetaDataDBHelper store;
    std::thread other;
    std::atomic<bool> isThere = false;
    std::atomic<bool> isDone = false;
    {
        SyncTransaction transaction(store.database());
        ASSERT_TRUE(transaction.begun());
        ASSERT_EQ(store.insertEvent(eventRow(1, 1, "a")), kOk);
        other = std::thread([&] {
            isThere = true;
            isThere.notify_one();
            EXPECT_EQ(store.insertEvent(eventRow(2, 1, "b")), kOk);
            isDone = true;
        });
        isThere.wait(false);
        std::this_thread::sleep_for(
            std::chrono::milliseconds(30));  // without the lock it would be done by now
        ASSERT_EQ(store.insertEvent(eventRow(3, 1, "c")), kOk);
        EXPECT_FALSE(isDone);
    }  // undone
    other.join();
    std::vector<CalEventMetaData> rows;
    ASSERT_EQ(store.getAllItems(1, &rows), kOk);
    ASSERT_EQ(rows.size(), 1U);
    EXPECT_EQ(rows[0].uri, "b");
}

TEST(CalMetaDataDBHelper, AFileThatIsNoStoreIsLeftAlone) {
    const TestRoot root;
    std::ofstream(root.at(kFile)) << std::string(4096, 'x');
    CalMetaDataDBHelper store;
    EXPECT_NE(store.insertEvent(eventRow(1, 1, "a")), kOk);
    std::list<int> ids;
    EXPECT_NE(store.getAllAccountIds(&ids), kOk);
    EXPECT_EQ(std::filesystem::file_size(root.at(kFile)), 4096U);
}
