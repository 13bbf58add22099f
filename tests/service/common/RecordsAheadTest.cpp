// Whoever takes records that were read ahead gets what the store holds now, whoever wrote it.
#include <gtest/gtest.h>
#include <sqlite3.h>

#include <string>
#include <vector>

#include "common/RecordsAhead.h"
#include "platform/calendar_read.h"
#include "support/TestRoot.h"

namespace {

constexpr const char* kFile = "/opt/usr/data/records/calendar.db";

int inserted(const char* view, unsigned text, const std::string& value, unsigned bookProperty = 0,
             int book = 0) {
    calendar_record_h raw = nullptr;
    EXPECT_EQ(calendar_record_create(view, &raw), 0);
    const CalendarRecord record(raw);
    if (bookProperty != 0) {
        EXPECT_EQ(calendar_record_set_int(raw, bookProperty, book), 0);
    }
    EXPECT_EQ(calendar_record_set_str(raw, text, value.c_str()), 0);
    int id = 0;
    EXPECT_EQ(calendar_db_insert_record(raw, &id), 0);
    return id;
}

void rename(int id, const char* summary) {
    calendar_record_h raw = nullptr;
    ASSERT_EQ(calendar_db_get_record(_calendar_event, id, &raw), 0);
    const CalendarRecord record(raw);
    ASSERT_EQ(calendar_record_set_str(raw, CALENDAR_EVENT_SUMMARY, summary), 0);
    ASSERT_EQ(calendar_db_update_record(raw), 0);
}

void renameFromOutside(const TestRoot& root, int id) {
    sqlite3* other = nullptr;
    ASSERT_EQ(sqlite3_open(root.at(kFile).c_str(), &other), SQLITE_OK);
    const std::string sql =
        "UPDATE events SET summary='from outside', version=version WHERE id=" + std::to_string(id);
    EXPECT_EQ(sqlite3_exec(other, sql.c_str(), nullptr, nullptr, nullptr), SQLITE_OK)
        << sqlite3_errmsg(other);
    sqlite3_close(other);
}

// "(none)": there is no such record.
std::string taken(CalendarRecordsAhead* records, int id) {
    CalendarRecord record;
    const int code = records->take(id, &record);
    if (code == PLATFORM_ERROR_NOT_FOUND) return "(none)";
    EXPECT_EQ(code, 0);
    EXPECT_EQ(calendar_read::intOf(record.get(), CALENDAR_EVENT_ID), id);
    return calendar_read::textOf(record.get(), CALENDAR_EVENT_SUMMARY);
}

}  // namespace

TEST(RecordsAhead, EachIsTakenAsTheStoreHasItNow) {
    const TestRoot root;
    ASSERT_EQ(calendar_connect_with_flags(0), 0);
    const int book = inserted(_calendar_book, CALENDAR_BOOK_NAME, "Book");
    std::vector<int> ids;
    constexpr int kSeveralReadings = 100;
    for (int i = 0; i < kSeveralReadings; ++i)
        ids.push_back(inserted(_calendar_event, CALENDAR_EVENT_SUMMARY, "e" + std::to_string(i),
                               CALENDAR_EVENT_BOOK_ID, book));
    CalendarRecordsAhead records(_calendar_event);
    records.expect(ids);
    for (int i = 0; i < kSeveralReadings; ++i) {
        const auto at = static_cast<size_t>(i);
        std::string expected = "e" + std::to_string(i);
        switch (i) {
            case 40:  // in the middle of what was read ahead
                rename(ids[at], "renamed");
                expected = "renamed";
                break;
            case 70:
                renameFromOutside(root, ids[at]);
                expected = "from outside";
                break;
            case 80:
                ASSERT_EQ(calendar_db_delete_record(_calendar_event, ids[at]), 0);
                expected = "(none)";
                break;
            default:
                break;
        }
        EXPECT_EQ(taken(&records, ids[at]), expected);
    }
    EXPECT_EQ(taken(&records, ids[3]), "e3") << "again, and not in order";
    calendar_disconnect();
}
