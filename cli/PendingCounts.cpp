#include "PendingCounts.h"

#include <string>
#include <unordered_map>

#include "CalendarStore.h"
#include "Failure.h"
#include "Names.h"
#include "ReadOnlyDatabase.h"
#include "RecordAccess.h"

namespace pending_counts {

namespace {

using record_access::intOf;

// The metadata store of one kind of items and the view of its records.
struct Source {
    const char* store;
    const char* view;
    const char* books;
    const char* rows;
};
constexpr Source kSources[] = {
    {"/opt/usr/dbspace/.vantor_pim_sync_calendar.db", _calendar_event,
     "SELECT calendar_id, sync_version FROM calendarbooksync_table WHERE account_id=?1",
     "SELECT event_id, version, dirty, deleted FROM eventsync_table WHERE calendar_id=?1"},
    {"/opt/usr/dbspace/.vantor_pim_sync_todo.db", _calendar_todo,
     "SELECT calendar_id, sync_version FROM todobooksync_table WHERE account_id=?1",
     "SELECT todo_id, version, dirty, deleted FROM todosync_table WHERE calendar_id=?1"},
};

struct Row {
    int version = 0;
    bool isCounted = false;  // its mark is set
};
using Rows = std::unordered_map<int, Row>;

// Adds the marks of the book's rows.
Rows readRows(const ReadOnlyDatabase& store, const Source& source, int calendarId, PendingCounts& counts) {
    Rows rows;
    const SqliteStatement row = store.prepare(source.rows);
    sqlite3_bind_int(row.get(), 1, calendarId);
    while (store.step(row)) {
        const bool isDirty = ReadOnlyDatabase::number(row, 2) != 0;
        const bool isDeleted = ReadOnlyDatabase::number(row, 3) != 0;
        counts.dirty += isDirty ? 1 : 0;
        counts.deleted += isDeleted ? 1 : 0;
        rows[ReadOnlyDatabase::number(row, 0)] = {ReadOnlyDatabase::number(row, 1), isDirty || isDeleted};
    }
    return rows;
}

// A change that the daemon has not looked at yet, unless it is the engine's own write or its row is counted.
void addChange(calendar_record_h change, const Rows& rows, PendingCounts& counts) {
    const int version = intOf(change, CALENDAR_UPDATED_INFO_VERSION);
    if (version == intOf(change, CALENDAR_UPDATED_INFO_SYNCED_VERSION)) return;
    const bool isDeleted = intOf(change, CALENDAR_UPDATED_INFO_MODIFIED_STATUS) == RECORD_DELETED;
    const auto row = rows.find(intOf(change, CALENDAR_UPDATED_INFO_ID));
    if (row == rows.end()) {
        counts.dirty += isDeleted ? 0 : 1;  // what the server never had need not be deleted there
        return;
    }
    if (row->second.isCounted || row->second.version == version) return;
    ++(isDeleted ? counts.deleted : counts.dirty);
}

void addChanges(const Source& source, int calendarId, int sinceVersion, const Rows& rows,
                PendingCounts& counts) {
    calendar_list_h raw = nullptr;
    int current = 0;
    const int code =
        calendar_db_get_changes_by_version(source.view, calendarId, sinceVersion, &raw, &current);
    if (code == PLATFORM_ERROR_NOT_FOUND) return;  // the calendar is gone
    check(code, "reading the changes of the calendar " + std::to_string(calendarId));
    const CalendarList changes(raw);
    record_access::forEach(changes, [&](calendar_record_h change) { addChange(change, rows, counts); });
}

bool isReadOnly(int calendarId) {
    calendar_record_h raw = nullptr;
    if (calendar_db_get_record(_calendar_book, calendarId, &raw) != PLATFORM_ERROR_NONE) return false;
    const CalendarRecord book(raw);
    return intOf(raw, CALENDAR_BOOK_MODE) == kModeReadOnly;
}

}  // namespace

PendingCounts calendarOf(int accountId) {
    PendingCounts counts;
    for (const Source& source : kSources) {
        const ReadOnlyDatabase store(source.store);
        if (!store.isOpen()) continue;
        const CalendarStore calendars;
        const SqliteStatement book = store.prepare(source.books);
        sqlite3_bind_int(book.get(), 1, accountId);
        while (store.step(book)) {
            const int calendarId = ReadOnlyDatabase::number(book, 0);
            const Rows rows = readRows(store, source, calendarId, counts);
            // Nobody takes what is changed in a read-only calendar, so it does not wait.
            if (!isReadOnly(calendarId))
                addChanges(source, calendarId, ReadOnlyDatabase::number(book, 1), rows, counts);
        }
    }
    return counts;
}

}  // namespace pending_counts
