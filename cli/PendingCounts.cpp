#include "PendingCounts.h"

#include <string>
#include <unordered_map>

#include "CalendarStore.h"
#include "ContactsStore.h"
#include "Failure.h"
#include "Names.h"
#include "ReadOnlyDatabase.h"
#include "RecordAccess.h"

namespace pending_counts {

namespace {

using record_access::intOf;

// What the change feed of a record service looks like.
struct Feed {
    int (*changes)(const char* view, int bookId, int version, calendar_list_h* out, int* current);
    int (*book)(const char* view, int id, calendar_record_h* out);
    const char* bookView;
    unsigned mode;  // of the book
    unsigned id;
    unsigned change;
    unsigned version;
    unsigned syncedVersion;
};
constexpr Feed kCalendarFeed{calendar_db_get_changes_by_version,
                             calendar_db_get_record,
                             _calendar_book,
                             CALENDAR_BOOK_MODE,
                             CALENDAR_UPDATED_INFO_ID,
                             CALENDAR_UPDATED_INFO_MODIFIED_STATUS,
                             CALENDAR_UPDATED_INFO_VERSION,
                             CALENDAR_UPDATED_INFO_SYNCED_VERSION};
constexpr Feed kContactsFeed{contacts_db_get_changes_by_version,
                             contacts_db_get_record,
                             _contacts_address_book,
                             CONTACTS_ADDRESS_BOOK_MODE,
                             CONTACTS_UPDATED_INFO_ID,
                             CONTACTS_UPDATED_INFO_TYPE,
                             CONTACTS_UPDATED_INFO_VERSION,
                             CONTACTS_UPDATED_INFO_SYNCED_VERSION};

// The metadata store of one kind of items and the view of its records.
struct Source {
    const Feed& feed;
    const char* store;
    const char* view;
    const char* books;
    const char* rows;
};
constexpr const char* kContactsStore = "/opt/usr/dbspace/.vantor_pim_sync_contacts.db";
constexpr Source kCalendarSources[] = {
    {kCalendarFeed, "/opt/usr/dbspace/.vantor_pim_sync_calendar.db", _calendar_event,
     "SELECT calendar_id, sync_version FROM calendarbooksync_table WHERE account_id=?1",
     "SELECT event_id, version, dirty, deleted FROM eventsync_table WHERE calendar_id=?1"},
    {kCalendarFeed, "/opt/usr/dbspace/.vantor_pim_sync_todo.db", _calendar_todo,
     "SELECT calendar_id, sync_version FROM todobooksync_table WHERE account_id=?1",
     "SELECT todo_id, version, dirty, deleted FROM todosync_table WHERE calendar_id=?1"},
};
constexpr Source kContactsSources[] = {
    {kContactsFeed, kContactsStore, _contacts_contact_updated_info,
     "SELECT addressbook_id, contact_last_sync_version FROM address_book WHERE account_id=?1",
     "SELECT contact_id, version, (dirty<>0 OR image_dirty<>0) AND deleted=0, deleted FROM "
     "contact_sync_table "
     "WHERE addressbook_id=?1"},
    {kContactsFeed, kContactsStore, _contacts_group_updated_info,
     "SELECT addressbook_id, group_last_sync_version FROM address_book WHERE account_id=?1",
     "SELECT group_id, version, dirty, deleted FROM group_sync_table WHERE addressbook_id=?1"},
};

struct Row {
    int version = 0;
    bool isCounted = false;  // its mark is set
};
using Rows = std::unordered_map<int, Row>;

// Adds the marks of the book's rows.
Rows readRows(const ReadOnlyDatabase& store, const Source& source, int bookId, PendingCounts& counts) {
    Rows rows;
    const SqliteStatement row = store.prepare(source.rows);
    sqlite3_bind_int(row.get(), 1, bookId);
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
void addChange(const Feed& feed, calendar_record_h change, const Rows& rows, PendingCounts& counts) {
    const int version = intOf(change, feed.version);
    if (version == intOf(change, feed.syncedVersion)) return;
    const bool isDeleted = intOf(change, feed.change) == RECORD_DELETED;
    const auto row = rows.find(intOf(change, feed.id));
    if (row == rows.end()) {
        counts.dirty += isDeleted ? 0 : 1;  // what the server never had need not be deleted there
        return;
    }
    if (row->second.isCounted || row->second.version == version) return;
    ++(isDeleted ? counts.deleted : counts.dirty);
}

void addChanges(const Source& source, int bookId, int sinceVersion, const Rows& rows, PendingCounts& counts) {
    calendar_list_h raw = nullptr;
    int current = 0;
    const int code = source.feed.changes(source.view, bookId, sinceVersion, &raw, &current);
    if (code == PLATFORM_ERROR_NOT_FOUND) return;  // the book is gone
    check(code, "reading the changes of the device");
    const CalendarList changes(raw);
    record_access::forEach(changes,
                           [&](calendar_record_h change) { addChange(source.feed, change, rows, counts); });
}

bool isReadOnly(const Feed& feed, int bookId) {
    calendar_record_h raw = nullptr;
    if (feed.book(feed.bookView, bookId, &raw) != PLATFORM_ERROR_NONE) return false;
    const CalendarRecord book(raw);
    return intOf(raw, feed.mode) == kModeReadOnly;
}

template <class RecordStore>
PendingCounts countsOf(std::span<const Source> sources, int accountId) {
    PendingCounts counts;
    for (const Source& source : sources) {
        const ReadOnlyDatabase store(source.store);
        if (!store.isOpen()) continue;
        const RecordStore records;
        const SqliteStatement book = store.prepare(source.books);
        sqlite3_bind_int(book.get(), 1, accountId);
        while (store.step(book)) {
            const int bookId = ReadOnlyDatabase::number(book, 0);
            const Rows rows = readRows(store, source, bookId, counts);
            // Nobody takes what is changed in a read-only book, so it does not wait.
            if (!isReadOnly(source.feed, bookId))
                addChanges(source, bookId, ReadOnlyDatabase::number(book, 1), rows, counts);
        }
    }
    return counts;
}

}  // namespace

PendingCounts calendarOf(int accountId) {
    return countsOf<CalendarStore>(kCalendarSources, accountId);
}

PendingCounts contactsOf(int accountId) {
    return countsOf<ContactsStore>(kContactsSources, accountId);
}

}  // namespace pending_counts
