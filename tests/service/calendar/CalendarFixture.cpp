#include "service/calendar/CalendarFixture.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>

#include "calendar/CalJsonParser.h"
#include "common/SyncResult.h"
#include "platform/calendar_read.h"

using sync_result::kOk;

namespace {

std::string twoDigits(int value) {
    char text[8];
    std::snprintf(text, sizeof text, "%02d", value);
    return text;
}

std::string instant(int day, const std::string& time) {
    return "2026-03-" + twoDigits(day) + "T" + time + "Z";
}

CalListPage pageOf(const std::vector<Json>& items) {
    CalJsonParser parser;
    CalListPage page;
    EXPECT_EQ(parser.setString(Json{{"items", items}}.dump()), kOk);
    EXPECT_EQ(parser.getEventAllPage(&page), kOk);
    return page;
}

}  // namespace

Json event(const std::string& id, const std::string& etag, const Json& more) {
    Json json = {{"id", id},
                 {"etag", etag},
                 {"status", "confirmed"},
                 {"summary", id + " " + etag},
                 {"start", {{"dateTime", instant(2, "09:00:00")}}},
                 {"end", {{"dateTime", instant(2, "10:00:00")}}}};
    json.update(more);
    return json;
}

Json series(const std::string& id, const std::string& etag) {
    return event(id, etag, {{"recurrence", {"RRULE:FREQ=DAILY;COUNT=20"}}});
}

std::string recurrenceId(int day) {
    return "202603" + twoDigits(day) + "T090000Z";
}

Json instance(const std::string& seriesId, int day, const std::string& etag, const Json& more) {
    Json json = event(seriesId + "_" + recurrenceId(day), etag,
                      {{"recurringEventId", seriesId},
                       {"originalStartTime", {{"dateTime", instant(day, "09:00:00+00:00").substr(0, 25)}}},
                       {"start", {{"dateTime", instant(day, "11:00:00")}}},
                       {"end", {{"dateTime", instant(day, "12:00:00")}}}});
    json.update(more);
    return json;
}

Json cancelled(const std::string& seriesId, int day, const std::string& etag) {
    return {{"id", seriesId + "_" + recurrenceId(day)},
            {"etag", etag},
            {"status", "cancelled"},
            {"recurringEventId", seriesId},
            {"originalStartTime", {{"dateTime", instant(day, "09:00:00+00:00").substr(0, 25)}}}};
}

CalendarFixture::CalendarFixture() {
    EXPECT_EQ(manager.prepareSync(), kOk);
    CalListInfo entry;
    entry.id = kCalendarUri;
    entry.etag = "book-1";
    entry.summary = "Work";
    EXPECT_EQ(manager.insertCalendarbook(kAccount, entry), kOk);
    EXPECT_EQ(manager.metaData()->getCalendarbook(kAccount, kCalendarUri, &book), kOk);
}

void CalendarFixture::downloadPart(const std::vector<std::vector<Json>>& pages) {
    CalBookSnapshot snapshot(kEventKind);
    ASSERT_EQ(snapshot.load(*manager.metaData(), book), kOk);
    CalItemWriter writer(manager.metaData(), &snapshot);
    for (const std::vector<Json>& page : pages) EXPECT_EQ(writer.writePage(pageOf(page)), kOk);
}

CalItemWriter::Counts CalendarFixture::download(const std::vector<std::vector<Json>>& pages) {
    CalBookSnapshot snapshot(kEventKind);
    EXPECT_EQ(manager.metaData()->getCalendarbook(kAccount, kCalendarUri, &book), kOk);
    EXPECT_EQ(snapshot.load(*manager.metaData(), book), kOk);
    CalItemWriter writer(manager.metaData(), &snapshot);
    for (const std::vector<Json>& page : pages) EXPECT_EQ(writer.writePage(pageOf(page)), kOk);
    EXPECT_EQ(writer.writeWaiting(), kOk);
    if (writer.listIsProof()) {
        EXPECT_EQ(writer.deleteUnlisted(), kOk);
    }
    return writer.counts();
}

std::vector<std::string> CalendarFixture::summaries() {
    calendar_list_h raw = nullptr;
    EXPECT_EQ(calendar_db_get_all_records(_calendar_event, 0, 0, &raw), PLATFORM_ERROR_NONE);
    const CalendarList list(raw);
    std::vector<std::string> texts;
    calendar_read::forEach(raw, [&texts](calendar_record_h record) {
        texts.push_back(calendar_read::textOf(record, CALENDAR_EVENT_SUMMARY));
    });
    std::sort(texts.begin(), texts.end());
    return texts;
}

CalendarRecord CalendarFixture::record(const std::string& uid) {
    calendar_query_h rawQuery = nullptr;
    EXPECT_EQ(calendar_query_create(_calendar_event, &rawQuery), PLATFORM_ERROR_NONE);
    const CalendarQuery query(rawQuery);
    EXPECT_EQ(calendar_query_add_filter_str(rawQuery, CALENDAR_EVENT_UID, uid.c_str()), PLATFORM_ERROR_NONE);
    calendar_list_h rawList = nullptr;
    EXPECT_EQ(calendar_db_get_records_with_query(rawQuery, 0, 0, &rawList), PLATFORM_ERROR_NONE);
    const CalendarList list(rawList);
    int id = 0;
    int count = 0;
    calendar_read::forEach(rawList, [&](calendar_record_h found) {
        id = calendar_read::intOf(found, CALENDAR_EVENT_ID);
        ++count;
    });
    EXPECT_LE(count, 1) << uid << " is there more than once";
    calendar_record_h raw = nullptr;
    if (count == 0 || calendar_db_get_record(_calendar_event, id, &raw) != PLATFORM_ERROR_NONE)
        return nullptr;
    return CalendarRecord(raw);
}

std::string CalendarFixture::text(const std::string& uid, unsigned property) {
    const CalendarRecord found = record(uid);
    return found ? calendar_read::textOf(found.get(), property) : "(no record)";
}

int CalendarFixture::number(const std::string& uid, unsigned property) {
    const CalendarRecord found = record(uid);
    return found ? calendar_read::intOf(found.get(), property) : -1;
}

CalEventMetaData CalendarFixture::row(const std::string& uri) {
    CalEventMetaData found;
    EXPECT_EQ(manager.metaData()->getEvent(book.calendar_id, uri, &found), kOk) << uri;
    return found;
}

size_t CalendarFixture::rowCount() {
    std::vector<CalEventMetaData> rows;
    EXPECT_EQ(manager.metaData()->getAllItems(book.calendar_id, &rows), kOk);
    return rows.size();
}

int CalendarFixture::storeVersion() {
    int version = 0;
    EXPECT_EQ(calendar_db_get_current_version(&version), PLATFORM_ERROR_NONE);
    return version;
}

void CalendarFixture::userSets(const std::string& uid, unsigned property, const std::string& value) {
    const CalendarRecord found = record(uid);
    ASSERT_TRUE(found) << uid;
    ASSERT_EQ(calendar_record_set_str(found.get(), property, value.c_str()), PLATFORM_ERROR_NONE);
    ASSERT_EQ(calendar_db_update_record(found.get()), PLATFORM_ERROR_NONE);
}

void CalendarFixture::userDeletes(const std::string& uid) {
    ASSERT_EQ(calendar_db_delete_record(_calendar_event, number(uid, CALENDAR_EVENT_ID)),
              PLATFORM_ERROR_NONE);
}

int CalendarFixture::userAdds(const std::string& summary) {
    calendar_record_h raw = nullptr;
    EXPECT_EQ(calendar_record_create(_calendar_event, &raw), PLATFORM_ERROR_NONE);
    const CalendarRecord record(raw);
    EXPECT_EQ(calendar_record_set_int(raw, CALENDAR_EVENT_BOOK_ID, book.calendar_id), PLATFORM_ERROR_NONE);
    EXPECT_EQ(calendar_record_set_str(raw, CALENDAR_EVENT_SUMMARY, summary.c_str()), PLATFORM_ERROR_NONE);
    int id = 0;
    EXPECT_EQ(calendar_db_insert_record(raw, &id), PLATFORM_ERROR_NONE);
    return id;
}
