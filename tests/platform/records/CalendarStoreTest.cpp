// The calendar service through its public functions.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sqlite3.h>

#include <atomic>
#include <fstream>
#include <thread>

#include "../../../platform/records/CalendarViews.h"
#include "platform/calendar.h"
#include "platform/support.h"
#include "service/common/MainLoop.h"
#include "support/TestRoot.h"

using testing::ElementsAre;

namespace {

constexpr const char* kFile = "/opt/usr/data/records/calendar.db";

struct Connected {
    Connected() { EXPECT_EQ(calendar_connect_with_flags(0), 0); }
    ~Connected() { calendar_disconnect(); }
};

CalendarRecord make(const char* view) {
    calendar_record_h raw = nullptr;
    EXPECT_EQ(calendar_record_create(view, &raw), 0);
    return CalendarRecord(raw);
}

int addBook(int type = 1) {
    const CalendarRecord book = make(_calendar_book);
    EXPECT_EQ(calendar_record_set_int(book.get(), CALENDAR_BOOK_STORE_TYPE, type), 0);
    int id = 0;
    EXPECT_EQ(calendar_db_insert_record(book.get(), &id), 0);
    return id;
}

CalendarRecord event(int book, const std::string& summary) {
    CalendarRecord record = make(_calendar_event);
    EXPECT_EQ(calendar_record_set_int(record.get(), CALENDAR_EVENT_BOOK_ID, book), 0);
    EXPECT_EQ(calendar_record_set_str(record.get(), CALENDAR_EVENT_SUMMARY, summary.c_str()), 0);
    return record;
}

CalendarRecord exceptionOf(int series, const std::string& recurrenceId) {
    CalendarRecord record = make(_calendar_event);
    EXPECT_EQ(calendar_record_set_int(record.get(), CALENDAR_EVENT_ORIGINAL_EVENT_ID, series), 0);
    EXPECT_EQ(calendar_record_set_str(record.get(), CALENDAR_EVENT_RECURRENCE_ID, recurrenceId.c_str()), 0);
    return record;
}

int insert(const CalendarRecord& record, bool bySync = false) {
    int id = 0;
    EXPECT_EQ(calendar_db_insert_record(record.get(), &id, {.by_sync = bySync}), 0);
    return id;
}

CalendarRecord get(int id) {
    calendar_record_h raw = nullptr;
    EXPECT_EQ(calendar_db_get_record(_calendar_event, id, &raw), 0) << id;
    return CalendarRecord(raw);
}

int number(int id, unsigned property) {
    int value = -1;
    EXPECT_EQ(calendar_record_get_int(get(id).get(), property, &value), 0);
    return value;
}

int version() {
    int value = 0;
    EXPECT_EQ(calendar_db_get_current_version(&value), 0);
    return value;
}

// The feed as "ID change[!]", ! for the sync's own.
std::vector<std::string> feed(int book, int since) {
    calendar_list_h raw = nullptr;
    int current = 0;
    EXPECT_EQ(calendar_db_get_changes_by_version(_calendar_event, book, since, &raw, &current), 0);
    EXPECT_LE(current, version());
    const CalendarList list(raw);
    std::vector<std::string> entries;
    for (int code = calendar_list_first(raw); code == 0; code = calendar_list_next(raw)) {
        calendar_record_h record = nullptr;
        EXPECT_EQ(calendar_list_get_current_record_p(raw, &record), 0);
        int id = 0, change = 0, changed = 0, synced = 0;
        EXPECT_EQ(calendar_record_get_int(record, CALENDAR_UPDATED_INFO_ID, &id), 0);
        EXPECT_EQ(calendar_record_get_int(record, CALENDAR_UPDATED_INFO_MODIFIED_STATUS, &change), 0);
        EXPECT_EQ(calendar_record_get_int(record, CALENDAR_UPDATED_INFO_VERSION, &changed), 0);
        EXPECT_EQ(calendar_record_get_int(record, CALENDAR_UPDATED_INFO_SYNCED_VERSION, &synced), 0);
        entries.push_back(std::to_string(id) + " " + "iud"[change] + (changed == synced ? "!" : ""));
    }
    return entries;
}

void touch(int id, const char* summary, bool bySync = false) {
    const CalendarRecord record = get(id);
    EXPECT_EQ(calendar_record_set_str(record.get(), CALENDAR_EVENT_SUMMARY, summary), 0);
    EXPECT_EQ(calendar_db_update_record(record.get(), {.by_sync = bySync}), 0);
}

int remove(int id, const record_write_options_s& options = {}) {
    return calendar_db_delete_record(_calendar_event, id, options);
}

}  // namespace

TEST(CalendarStore, EveryPropertyOfEveryViewComesBack) {
    using namespace platform::records;
    const TestRoot root;
    const Connected store;
    const int books[] = {addBook(1), addBook(2)};
    for (const char* uri : {_calendar_book, _calendar_event, _calendar_todo}) {
        const View& view = *calendarStore().viewOf(uri);
        const CalendarRecord record = make(uri);
        int next = 3;
        for (const Property& property : view.properties) {
            if (property.readOnly) {
                EXPECT_EQ(calendar_record_set_int(record.get(), property.id, 1),
                          PLATFORM_ERROR_INVALID_PARAMETER);
                continue;
            }
            const int value = property.id == view.bookProperty ? books[view.bookType - 1] : ++next;
            if (property.id == view.seriesProperty && view.hasSeries()) continue;
            const calendar_time_s date{
                .type = CALENDAR_TIME_LOCALTIME, .year = 2026, .month = 3, .mday = value};
            const calendar_time_s instant{.utime = int64_t{1} << 33};
            switch (property.type) {
                case Type::kInt:
                    EXPECT_EQ(calendar_record_set_int(record.get(), property.id, value), 0);
                    break;
                case Type::kLong:
                    EXPECT_EQ(calendar_record_set_lli(record.get(), property.id, int64_t{value} << 40), 0);
                    break;
                case Type::kText:
                    EXPECT_EQ(
                        calendar_record_set_str(record.get(), property.id, "it's \"x\"\n\xF0\x9F\x8E\x89"),
                        0);
                    EXPECT_NE(calendar_record_set_str(record.get(), property.id, "\xff"), 0);
                    break;
                case Type::kTime:
                    EXPECT_EQ(calendar_record_set_caltime(record.get(), property.id,
                                                          value % 2 == 0 ? date : instant),
                              0);
                    break;
                case Type::kChildren:
                    if (property.id == view.exceptionsProperty) break;
                    EXPECT_EQ(calendar_record_add_child_record(record.get(), property.id,
                                                               make(property.childView).release()),
                              0);
                    break;
            }
        }
        int id = 0;
        ASSERT_EQ(calendar_db_insert_record(record.get(), &id), 0) << uri;
        calendar_record_h raw = nullptr;
        ASSERT_EQ(calendar_db_get_record(uri, id, &raw), 0);
        const CalendarRecord stored(raw);
        EXPECT_TRUE(stored->hasSameContent(*record)) << uri;
    }
}

TEST(CalendarStore, ANewEventSaysNoMoreThanTheUser) {
    const TestRoot root;
    struct Row {
        unsigned property;
        int value;
    };
    const CalendarRecord record = make(_calendar_event);
    for (const Row& row :
         {Row{CALENDAR_EVENT_FREQ, 0}, Row{CALENDAR_EVENT_RANGE_TYPE, 2}, Row{CALENDAR_EVENT_INTERVAL, 1},
          Row{CALENDAR_EVENT_WKST, 2}, Row{CALENDAR_EVENT_BUSY_STATUS, 1}, Row{CALENDAR_EVENT_SENSITIVITY, 2},
          Row{CALENDAR_EVENT_STATUS, 1}}) {
        int value = -1;
        EXPECT_EQ(calendar_record_get_int(record.get(), row.property, &value), 0);
        EXPECT_EQ(value, row.value) << row.property;
    }
}

TEST(CalendarStore, TheFeedTellsEachRecordsLatestChange) {
    const TestRoot root;
    const Connected store;
    const int book = addBook();
    const int old = insert(event(book, "old"));
    const int gone = insert(event(book, "gone"));
    const int series = insert(event(book, "series"));
    const int synced = insert(event(book, "synced"), true);
    const int since = version();
    EXPECT_THAT(feed(book, since), testing::IsEmpty());

    const int added = insert(event(book, "added"));
    touch(added, "added and updated");
    const int passing = insert(event(book, "inserted and deleted"));
    EXPECT_EQ(remove(passing), 0);
    touch(old, "updated");
    EXPECT_EQ(remove(gone), 0);
    const int child = insert(exceptionOf(series, "20260301"));
    touch(synced, "by the sync", true);
    const auto text = [](int id, const char* change) { return std::to_string(id) + " " + change; };
    EXPECT_THAT(feed(book, since), ElementsAre(text(added, "i"), text(old, "u"), text(gone, "d"),
                                               text(series, "u"), text(synced, "u!")));
    EXPECT_EQ(number(child, CALENDAR_EVENT_VERSION), number(series, CALENDAR_EVENT_VERSION));
    EXPECT_EQ(number(child, CALENDAR_EVENT_BOOK_ID), book);

    // The sync learns of the deletion of what it wrote, also when it never looked in between.
    const int looked = version();
    const int own = insert(event(book, "own"), true);
    EXPECT_EQ(remove(own), 0);
    EXPECT_THAT(feed(book, looked), ElementsAre(text(own, "d")));

    // A book takes its records along, unlisted.
    ASSERT_EQ(calendar_db_delete_record(_calendar_book, book), 0);
    EXPECT_THAT(feed(book, 0), testing::IsEmpty());
    calendar_list_h raw = nullptr;
    ASSERT_EQ(calendar_db_get_all_records(_calendar_event, 0, 0, &raw), 0);
    const CalendarList list(raw);
    EXPECT_EQ(calendar_list_first(raw), PLATFORM_ERROR_NOT_FOUND);
}

TEST(CalendarStore, RecordsThatMovedOnAreSkippedAndReported) {
    const TestRoot root;
    const Connected store;
    const int book = addBook();
    const int a = insert(event(book, "a"));
    const int b = insert(event(book, "b"));
    const int c = insert(event(book, "c"));
    const int expected[] = {number(a, CALENDAR_EVENT_VERSION), number(b, CALENDAR_EVENT_VERSION),
                            number(c, CALENDAR_EVENT_VERSION)};
    touch(b, "user");
    ASSERT_EQ(remove(c), 0);
    calendar_list_h raw = nullptr;
    ASSERT_EQ(calendar_list_create(&raw), 0);
    const CalendarList list(raw);
    for (int i = 0; i < 3; ++i) ASSERT_EQ(calendar_list_add(raw, event(book, "new").release()), 0);
    const int ids[] = {a, b, c};
    std::vector<size_t> skipped;
    ASSERT_EQ(calendar_db_replace_records(
                  raw, ids, 3, {.by_sync = true, .expected_versions = expected, .skipped = &skipped}),
              0);
    EXPECT_THAT(skipped, ElementsAre(1, 2));
    EXPECT_EQ(number(a, CALENDAR_EVENT_SYNCED_VERSION), number(a, CALENDAR_EVENT_VERSION));
    EXPECT_EQ(number(b, CALENDAR_EVENT_SYNCED_VERSION), 0);
    EXPECT_EQ(remove(b, {.expected_versions = std::span(expected + 1, 1)}), PLATFORM_ERROR_CONFLICT);
    EXPECT_EQ(remove(c), PLATFORM_ERROR_NOT_FOUND);
}

TEST(CalendarStore, AnExceptionIsAsOldAsItsSeries) {
    const TestRoot root;
    const Connected store;
    const int book = addBook();
    const int series = insert(event(book, "series"), true);
    const int seen = number(series, CALENDAR_EVENT_VERSION);
    const std::span expected(&seen, 1);

    // A version that an earlier call of the same transaction gave passes.
    ASSERT_EQ(calendar_db_begin_transaction(), 0);
    int first = 0;
    ASSERT_EQ(calendar_db_insert_record(exceptionOf(series, "20260301").get(), &first,
                                        {.by_sync = true, .expected_versions = expected}),
              0);
    ASSERT_EQ(calendar_db_insert_record(exceptionOf(series, "20260302").get(), nullptr,
                                        {.by_sync = true, .expected_versions = expected}),
              0);
    ASSERT_EQ(calendar_db_end_transaction(true), 0);
    EXPECT_EQ(number(series, CALENDAR_EVENT_SYNCED_VERSION), number(series, CALENDAR_EVENT_VERSION));
    EXPECT_EQ(calendar_db_insert_record(exceptionOf(series, "20260303").get(), nullptr,
                                        {.by_sync = true, .expected_versions = expected}),
              PLATFORM_ERROR_CONFLICT);

    EXPECT_EQ(number(series, CALENDAR_EVENT_OWN_VERSION), seen) << "only its exceptions were written";

    // A user's edit of the series that nobody has seen stays a user's edit, whatever the sync does to the exceptions.
    touch(series, "user");
    touch(first, "sync", true);
    EXPECT_NE(number(series, CALENDAR_EVENT_SYNCED_VERSION), number(series, CALENDAR_EVENT_VERSION));

    // One exception an instance; the whole call is undone.
    const int before = version();
    EXPECT_EQ(calendar_db_insert_record(exceptionOf(series, "20260301").get(), nullptr),
              PLATFORM_ERROR_INVALID_PARAMETER);
    EXPECT_EQ(version(), before);
}

TEST(CalendarStore, ReplacingASeriesKeepsItsExceptionsAndDates) {
    const TestRoot root;
    const Connected store;
    const int book = addBook();
    const CalendarRecord record = event(book, "series");
    ASSERT_EQ(calendar_record_set_str(record.get(), CALENDAR_EVENT_EXDATE, "20260305"), 0);
    ASSERT_EQ(calendar_record_set_str(record.get(), CALENDAR_EVENT_LOCATION, "room"), 0);
    const int series = insert(record);
    const int child = insert(exceptionOf(series, "20260301"));
    const CalendarRecord replacement = event(addBook(), "new");
    ASSERT_EQ(calendar_db_replace_record(replacement.get(), series), 0);
    const CalendarRecord now = get(series);
    const char* text = nullptr;
    EXPECT_EQ(calendar_record_get_str_p(now.get(), CALENDAR_EVENT_EXDATE, &text), 0);
    EXPECT_STREQ(text, "20260305");
    EXPECT_EQ(calendar_record_get_str_p(now.get(), CALENDAR_EVENT_LOCATION, &text), 0);
    EXPECT_STREQ(text, "");
    EXPECT_EQ(number(series, CALENDAR_EVENT_BOOK_ID), book);
    unsigned count = 0;
    EXPECT_EQ(calendar_record_get_child_record_count(now.get(), CALENDAR_EVENT_EXCEPTIONS, &count), 0);
    EXPECT_EQ(count, 1U);
    ASSERT_EQ(calendar_db_replace_record(event(book, "changed").get(), child), 0);
    EXPECT_EQ(number(child, CALENDAR_EVENT_ORIGINAL_EVENT_ID), series);

    // An update writes the exceptions that the record has.
    calendar_record_h kept = nullptr;
    ASSERT_EQ(calendar_record_get_child_record_at_p(now.get(), CALENDAR_EVENT_EXCEPTIONS, 0, &kept), 0);
    ASSERT_EQ(calendar_record_remove_child_record(now.get(), CALENDAR_EVENT_EXCEPTIONS, kept), 0);
    calendar_record_destroy(kept, true);
    CalendarRecord added = make(_calendar_event);
    ASSERT_EQ(calendar_record_set_str(added.get(), CALENDAR_EVENT_RECURRENCE_ID, "20260309"), 0);
    ASSERT_EQ(calendar_record_add_child_record(now.get(), CALENDAR_EVENT_EXCEPTIONS, added.release()), 0);
    const int others = insert(exceptionOf(series, "20260310"));
    ASSERT_EQ(calendar_db_update_record(now.get()), 0);
    EXPECT_EQ(number(others, CALENDAR_EVENT_ORIGINAL_EVENT_ID), series) << "added since the record was read";
    calendar_record_h raw = nullptr;
    EXPECT_EQ(calendar_db_get_record(_calendar_event, child, &raw), PLATFORM_ERROR_NOT_FOUND);
    ASSERT_EQ(remove(series), 0);
    EXPECT_EQ(calendar_db_get_record(_calendar_event, others, &raw), PLATFORM_ERROR_NOT_FOUND);
    EXPECT_EQ(calendar_db_get_record(_calendar_event, others + 1, &raw), PLATFORM_ERROR_NOT_FOUND);
    EXPECT_GT(insert(event(book, "later")), others + 1) << "ids are not used again";
}

TEST(CalendarStore, WhatIsRefusedLeavesNothing) {
    const TestRoot root;
    const Connected store;
    const int book = addBook();
    const int todos = addBook(2);
    const int before = version();
    EXPECT_EQ(calendar_db_insert_record(event(99, "no book").get(), nullptr),
              PLATFORM_ERROR_INVALID_PARAMETER);
    EXPECT_EQ(calendar_db_insert_record(event(todos, "wrong book").get(), nullptr),
              PLATFORM_ERROR_INVALID_PARAMETER);
    calendar_list_h raw = nullptr;
    ASSERT_EQ(calendar_list_create(&raw), 0);
    const CalendarList list(raw);
    ASSERT_EQ(calendar_list_add(raw, event(book, "good").release()), 0);
    ASSERT_EQ(calendar_list_add(raw, event(99, "bad").release()), 0);
    EXPECT_NE(calendar_db_insert_records(raw), 0);
    EXPECT_EQ(version(), before);
    EXPECT_THAT(feed(book, 0), testing::IsEmpty());

    ASSERT_EQ(calendar_db_begin_transaction(), 0);
    insert(event(book, "undone"));
    EXPECT_EQ(calendar_db_insert_record(event(99, "refused").get(), nullptr),
              PLATFORM_ERROR_INVALID_PARAMETER);
    ASSERT_EQ(calendar_db_end_transaction(false), 0);
    EXPECT_EQ(version(), before);
    int own = 0;
    ASSERT_EQ(calendar_db_get_last_change_version(&own), 0);
    EXPECT_EQ(own, before) << "what was undone is no change";
    EXPECT_EQ(calendar_db_end_transaction(true), PLATFORM_ERROR_INVALID_PARAMETER);
}

TEST(CalendarStore, WhatFollowsATransactionThatSqliteUndidIsNotKept) {
    const TestRoot root;
    const Connected store;
    const int book = addBook();
    sqlite3* other = nullptr;
    ASSERT_EQ(sqlite3_open(root.at(kFile).c_str(), &other), SQLITE_OK);
    ASSERT_EQ(sqlite3_exec(other,
                           "CREATE TRIGGER full BEFORE INSERT ON events WHEN new.summary = 'too much' "
                           "BEGIN SELECT RAISE(ROLLBACK, 'full'); END",
                           nullptr, nullptr, nullptr),
              SQLITE_OK);
    sqlite3_close(other);
    ASSERT_EQ(calendar_db_begin_transaction(), 0);
    insert(event(book, "before"));
    EXPECT_NE(calendar_db_insert_record(event(book, "too much").get(), nullptr), 0);
    EXPECT_NE(calendar_db_insert_record(event(book, "after").get(), nullptr), 0);
    EXPECT_NE(calendar_db_end_transaction(true), 0);
    EXPECT_THAT(feed(book, 0), testing::IsEmpty());
    insert(event(book, "again"));
    EXPECT_EQ(feed(book, 0).size(), 1U);
}

TEST(CalendarStore, ProcessesWriteAtOnceAndEachKnowsItsOwnVersion) {
    const TestRoot root;
    int book = 0;
    {
        const Connected store;
        book = addBook();
    }
    constexpr int kWriters = 3;
    constexpr int kWrites = 40;
    std::vector<pid_t> writers;
    for (int writer = 0; writer < kWriters; ++writer) {
        writers.push_back(inOtherProcess([&] {
            const Connected store;
            int last = 0;
            for (int i = 0; i < kWrites; ++i) {
                int id = 0;
                int own = 0;
                if (calendar_db_insert_record(event(book, "x").get(), &id) != 0) return 1;
                if (calendar_db_get_last_change_version(&own) != 0 || own <= last) return 2;
                if (number(id, CALENDAR_EVENT_VERSION) != own) return 3;
                last = own;
            }
            return 0;
        }));
    }
    for (const pid_t writer : writers) EXPECT_EQ(statusOf(writer), 0);
    const Connected store;
    EXPECT_EQ(feed(book, 0).size(), static_cast<size_t>(kWriters * kWrites));
    EXPECT_EQ(version(), kWriters * kWrites + 1);
    int thread = 0;
    insert(event(book, "mine"));
    std::thread([&] { EXPECT_EQ(calendar_db_get_last_change_version(&thread), 0); }).join();
    EXPECT_EQ(thread, version()) << "a thread that wrote nothing sees the store's";
}

TEST(CalendarStore, ReadersSeeWholeWritesAndKilledWritersLeaveNone) {
    const TestRoot root;
    int book = 0;
    {
        const Connected store;
        book = addBook();
    }
    constexpr size_t kBulk = 50;
    for (int round = 0; round < 8; ++round) {
        const pid_t writer = inOtherProcess([&] {
            const Connected store;
            for (;;) {
                calendar_list_h raw = nullptr;
                if (calendar_list_create(&raw) != 0) return 1;
                const CalendarList list(raw);
                for (size_t i = 0; i < kBulk; ++i) {
                    if (calendar_list_add(raw, event(book, "x").release()) != 0) return 1;
                }
                if (calendar_db_insert_records(raw) != 0) return 2;
            }
        });
        {
            const Connected store;
            for (int look = 0; look < 5 + round; ++look) EXPECT_EQ(feed(book, 0).size() % kBulk, 0U);
            kill(writer, SIGKILL);
            EXPECT_EQ(statusOf(writer), 128 + SIGKILL);
            EXPECT_EQ(feed(book, 0).size() % kBulk, 0U);
            insert(event(book, "still usable"));
        }
        const Connected store;
        ASSERT_EQ(calendar_db_delete_record(_calendar_book, book), 0);
        book = addBook();
    }
}

TEST(CalendarStore, CallbacksTellOfOthersWritesOnly) {
    const TestRoot root;
    const Connected store;
    const int book = addBook();
    int events = 0;
    int books = 0;
    const auto count = [](const char*, void* counter) { ++*static_cast<int*>(counter); };
    ASSERT_EQ(calendar_db_add_changed_cb(_calendar_event, count, &events), 0);
    ASSERT_EQ(calendar_db_add_changed_cb(_calendar_book, count, &books), 0);
    insert(event(book, "mine"));
    EXPECT_FALSE(iterateUntil([&] { return events > 0; }, std::chrono::milliseconds(200)));

    // fork() would share this process' connection, so the other writer is a program of its own.
    const std::string tool = std::string(VPS_BIN_DIR) + "/vantor-pim-syncctl event add - --calendar " +
                             std::to_string(book) + " >/dev/null 2>&1";
    const std::string json =
        R"({"summary":"theirs","start":"2026-03-01T10:00:00Z","end":"2026-03-01T11:00:00Z"})";
    ASSERT_EQ(system(("echo '" + json + "' | " + tool).c_str()), 0);
    EXPECT_TRUE(iterateUntil([&] { return events == 1; }, std::chrono::seconds(2)));
    std::atomic<bool> isEnough = false;
    std::thread busy([&] {
        for (; !isEnough; std::this_thread::sleep_for(std::chrono::milliseconds(1)))
            insert(event(book, "mine"));
    });
    EXPECT_EQ(system(("echo '" + json + "' | " + tool).c_str()), 0);
    EXPECT_TRUE(iterateUntil([&] { return events == 2; }, std::chrono::seconds(2))) << "among own writes";
    isEnough = true;
    busy.join();
    EXPECT_EQ(books, 0);
    EXPECT_EQ(calendar_db_remove_changed_cb(_calendar_event, count, &events), 0);
    EXPECT_EQ(calendar_db_remove_changed_cb(_calendar_book, count, &books), 0);
}

TEST(CalendarStore, FilesThatAreNotItsOwnAreLeftAlone) {
    const TestRoot root;
    std::filesystem::create_directories(root.at(kFile).parent_path());
    std::ofstream(root.at(kFile)) << std::string(8192, 'x');
    EXPECT_EQ(calendar_connect_with_flags(0), PLATFORM_ERROR_DATABASE);
    EXPECT_EQ(std::filesystem::file_size(root.at(kFile)), 8192U);
    std::filesystem::remove(root.at(kFile));
    sqlite3* newer = nullptr;
    ASSERT_EQ(sqlite3_open(root.at(kFile).c_str(), &newer), SQLITE_OK);
    ASSERT_EQ(
        sqlite3_exec(newer, "CREATE TABLE future(x); PRAGMA user_version=99", nullptr, nullptr, nullptr),
        SQLITE_OK);
    sqlite3_close(newer);
    EXPECT_EQ(calendar_connect_with_flags(0), PLATFORM_ERROR_NEWER);
}
