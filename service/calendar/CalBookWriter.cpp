// The half of CalManager that keeps books.
#include <cstdio>
#include <map>

#include "calendar/CalManager.h"
#include "calendar/CalTransaction.h"
#include "common/SyncLog.h"
#include "platform/calendar_read.h"

using calendar_read::intOf;
using calendar_read::textOf;
using sync_result::kFailed;
using sync_result::kOk;

namespace {

constexpr int kWritable = 0;  // CALENDAR_BOOK_MODE
constexpr int kReadOnly = 1;

// "#0a141e" as the record's "10.20.30.255"; empty when the text is no colour.
std::string recordColor(const std::string& backgroundColor) {
    unsigned red = 0;
    unsigned green = 0;
    unsigned blue = 0;
    if (std::sscanf(backgroundColor.c_str(), "#%02x%02x%02x", &red, &green, &blue) != 3) return {};
    return std::to_string(red) + "." + std::to_string(green) + "." + std::to_string(blue) + ".255";
}

bool fillBook(calendar_record_h record, const CalListInfo& entry) {
    const int mode = entry.accessRole == "reader" ? kReadOnly : kWritable;
    if (calendar_record_set_str(record, CALENDAR_BOOK_NAME, entry.summary.c_str()) != PLATFORM_ERROR_NONE)
        return false;
    if (calendar_record_set_int(record, CALENDAR_BOOK_MODE, mode) != PLATFORM_ERROR_NONE) return false;
    const std::string color = recordColor(entry.backgroundColor);
    return color.empty() ||
           calendar_record_set_str(record, CALENDAR_BOOK_COLOR, color.c_str()) == PLATFORM_ERROR_NONE;
}

int makeBookRecord(const CalItemKind& kind, int accountId, const CalListInfo& entry, CalendarRecord* out) {
    calendar_record_h raw = nullptr;
    if (calendar_record_create(_calendar_book, &raw) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("record create fail");
        return kFailed;
    }
    CalendarRecord record(raw);
    if (calendar_record_set_int(raw, CALENDAR_BOOK_ACCOUNT_ID, accountId) != PLATFORM_ERROR_NONE ||
        calendar_record_set_int(raw, CALENDAR_BOOK_STORE_TYPE, kind.storeType) != PLATFORM_ERROR_NONE ||
        calendar_record_set_str(raw, CALENDAR_BOOK_SYNC_DATA1, entry.id.c_str()) != PLATFORM_ERROR_NONE ||
        !fillBook(raw, entry)) {
        SYNC_ERR("record set fail");
        return kFailed;
    }
    *out = std::move(record);
    return kOk;
}

// The account's books in the calendar service: id -> server id.
int readBooks(const CalItemKind& kind, int accountId, std::map<int, std::string>* books) {
    calendar_query_h rawQuery = nullptr;
    if (calendar_query_create(_calendar_book, &rawQuery) != PLATFORM_ERROR_NONE) return kFailed;
    const CalendarQuery query(rawQuery);
    calendar_list_h rawList = nullptr;
    if (calendar_query_add_filter_int(rawQuery, CALENDAR_BOOK_ACCOUNT_ID, accountId) != PLATFORM_ERROR_NONE ||
        calendar_query_add_filter_int(rawQuery, CALENDAR_BOOK_STORE_TYPE, kind.storeType) !=
            PLATFORM_ERROR_NONE ||
        calendar_db_get_records_with_query(rawQuery, 0, 0, &rawList) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("get_records_with_query fail");
        return kFailed;
    }
    const CalendarList list(rawList);
    calendar_read::forEach(rawList, [books](calendar_record_h record) {
        books->emplace(intOf(record, CALENDAR_BOOK_ID), textOf(record, CALENDAR_BOOK_SYNC_DATA1));
    });
    return kOk;
}

int deleteBookRecords(const std::vector<int>& ids) {
    if (ids.empty()) return kOk;
    if (calendar_db_delete_records(_calendar_book, ids.data(), ids.size(), {.by_sync = true}) !=
        PLATFORM_ERROR_NONE) {
        SYNC_ERR("db_delete_records fail");
        return kFailed;
    }
    return kOk;
}

}  // namespace

CalItemStore* CalManager::prepared() {
    CalItemStore* store = prepareStore();
    if (store == nullptr) SYNC_ERR("not prepare sync");
    return store;
}

int CalManager::insertBook(int accountId, const CalListInfo& entry) {
    CalItemStore* store = prepared();
    CalendarRecord record;
    if (store == nullptr || makeBookRecord(mKind, accountId, entry, &record) != kOk) return kFailed;
    CalBookMetaData row;
    if (calendar_db_insert_record(record.get(), &row.calendar_id, {.by_sync = true}) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("%s", mKind.texts.insertBookRecord);
        return kFailed;
    }
    row.account_id = accountId;
    row.uri = entry.id;
    row.etag = entry.etag;
    if (calendar_db_get_last_change_version(&row.sync_version) != PLATFORM_ERROR_NONE ||
        store->books().insert(row) != kOk) {
        SYNC_ERR("metaDB insertcalendarbook fail");
        return kFailed;
    }
    return kOk;
}

int CalManager::updateBooks(int accountId, const CalList& entries) {
    CalItemStore* store = prepared();
    if (store == nullptr) return kFailed;
    calendar_list_h rawList = nullptr;
    if (calendar_list_create(&rawList) != PLATFORM_ERROR_NONE) return kFailed;
    const CalendarList list(rawList);
    std::vector<CalBookMetaData> rows;
    for (const CalListInfoPtr& entry : entries) {
        CalBookMetaData row;
        if (store->books().get(accountId, entry->id, &row) != kOk) continue;
        calendar_record_h raw = nullptr;
        if (calendar_db_get_record(_calendar_book, row.calendar_id, &raw) != PLATFORM_ERROR_NONE) {
            SYNC_ERR("db_get_record fail");
            continue;
        }
        CalendarRecord record(raw);
        if (!fillBook(raw, *entry) || calendar_list_add(rawList, raw) != PLATFORM_ERROR_NONE) {
            SYNC_ERR("set fail");
            continue;
        }
        (void)record.release();  // the list owns it now
        row.etag = entry->etag;
        rows.push_back(row);
    }
    if (rows.empty()) return kOk;
    if (calendar_db_update_records(rawList, {.by_sync = true}) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("update fail");
        return kFailed;
    }
    int result = kOk;
    for (const CalBookMetaData& row : rows) {
        if (store->books().update(row) != kOk) {
            SYNC_ERR("metaDB updatecalendarbook fail");
            result = kFailed;
        }
    }
    return result;
}

int CalManager::deleteBook(int accountId, const std::string& uri) {
    CalItemStore* store = prepared();
    CalBookMetaData row;
    if (store == nullptr || store->books().get(accountId, uri, &row) != kOk) return kFailed;
    std::vector<CalEventMetaData> items;
    if (store->getAllItems(row.calendar_id, &items) != kOk) return kFailed;
    for (const CalEventMetaData& item : items) {
        if (item.dirty == 0) continue;
        SYNC_ERR("%s(%s) is no longer on the server, %s(%d, %s) goes with its change that was not sent",
                 mKind.bookName, uri.c_str(), mKind.itemName, item.event_id, item.uri.c_str());
    }
    const int code = calendar_db_delete_record(_calendar_book, row.calendar_id, {.by_sync = true});
    if (code != PLATFORM_ERROR_NONE && code != PLATFORM_ERROR_NOT_FOUND) {
        SYNC_ERR("db_delete_records fail");
        return kFailed;
    }
    return store->books().remove(accountId, uri);
}

bool CalManager::isReadOnly(int calendarId) {
    calendar_record_h raw = nullptr;
    if (calendar_db_get_record(_calendar_book, calendarId, &raw) != PLATFORM_ERROR_NONE) return false;
    const CalendarRecord record(raw);
    return intOf(raw, CALENDAR_BOOK_MODE) == kReadOnly;
}

int CalManager::reconcileBooks(int accountId) {
    CalItemStore* store = prepared();
    std::map<int, std::string> books;
    std::list<int> known;
    if (store == nullptr || readBooks(mKind, accountId, &books) != kOk ||
        store->books().getIds(accountId, &known) != kOk) {
        return kFailed;
    }
    for (const int calendarId : known) {
        if (books.erase(calendarId) != 0) continue;
        std::string uri;
        if (store->books().getUri(calendarId, &uri) != kOk) return kFailed;
        SYNC_ERR("%s(%s) was deleted on the device, the download makes it again", mKind.bookName,
                 uri.c_str());
        if (store->books().remove(calendarId) != kOk) return kFailed;
    }
    for (const auto& [calendarId, uri] : books) {
        if (uri.empty()) continue;
        CalBookMetaData row;
        if (store->books().get(accountId, uri, &row) == kOk) continue;
        SYNC_ERR("%s(%s) is taken over from an interrupted sync", mKind.bookName, uri.c_str());
        // Version 0: every change of the book is still to be examined. No etag: the book is compared as changed.
        row = CalBookMetaData{};
        row.calendar_id = calendarId;
        row.account_id = accountId;
        row.uri = uri;
        if (store->books().insert(row) != kOk) {
            SYNC_ERR("metaDB insertcalendarbook fail");
            return kFailed;
        }
    }
    return kOk;
}

int CalManager::deleteAccount(int accountId) {
    CalItemStore* store = prepared();
    if (store == nullptr) return kFailed;
    std::list<int> known;
    if (store->books().getIds(accountId, &known) != kOk) {
        SYNC_ERR("%s", mKind.texts.bookIds);
        return kFailed;
    }
    // Books of an interrupted download have no row yet.
    std::map<int, std::string> books;
    if (readBooks(mKind, accountId, &books) != kOk) return kFailed;
    for (const int calendarId : known) books.emplace(calendarId, std::string());
    std::vector<int> ids;
    ids.reserve(books.size());
    for (const auto& [calendarId, uri] : books) ids.push_back(calendarId);
    if (deleteBookRecords(ids) != kOk) return kFailed;
    return deleteBookRows(*store, accountId, ids);
}

int CalManager::getRecord(int itemId, CalendarRecord* record) {
    if (prepared() == nullptr) return kFailed;
    calendar_record_h raw = nullptr;
    if (calendar_db_get_record(mKind.view, itemId, &raw) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("db_get_record fail");
        return kFailed;
    }
    record->reset(raw);
    return kOk;
}
