// calendar.h: the device's calendar service: calendar books, events with attendees, alarms and exceptions,
// and to-dos, in one SQLite file that all processes share.
//
// Records: a record belongs to a view and has the properties listed below; a new record has defaults that
// never say more than the user did. Child records are owned by their parent. Handles are not shared
// between threads; everything named calendar_db_* may be called from any thread.
//
// Series and exceptions: an exception is an event whose ORIGINAL_EVENT_ID is the series and whose RECURRENCE_ID
// names the instance; it is reached as a child (CALENDAR_EVENT_EXCEPTIONS) and as an event of its own. A series'
// EXDATE lists cancelled instances, joined with ", ". There is one exception per (series, recurrence id).
//
// Versions: the store has one version number, raised by one for each writing call that writes anything; all
// records of that call carry it. A child's write (exception, attendee, alarm) is an update of its parent; an
// exception also carries the version of its own last write. Deleting a book deletes its records without
// listing them in the change feed.
//
// Callbacks: tell a process of the writes of others, soon; a process' own writes do not call its own.
#pragma once

#include "platform/error.h"
#include "platform/record_types.h"

using calendar_record_h = platform::records::Record*;
using calendar_list_h = platform::records::RecordList*;
using calendar_query_h = platform::records::Query*;

// Views.
inline constexpr const char* _calendar_book = "calendar.book";
inline constexpr const char* _calendar_event = "calendar.event";
inline constexpr const char* _calendar_todo = "calendar.todo";
inline constexpr const char* _calendar_attendee = "calendar.attendee";
inline constexpr const char* _calendar_alarm = "calendar.alarm";
inline constexpr const char* _calendar_updated_info = "calendar.updated_info";

// Properties: the comment gives the type, the default when it is not 0 or "", and ro for what only the store sets.
enum calendar_property_e : unsigned {
    CALENDAR_BOOK_ID = 0x0100,     // int, ro
    CALENDAR_BOOK_ACCOUNT_ID,      // int; 0: a book of the device alone
    CALENDAR_BOOK_STORE_TYPE,      // int: 1 events (default), 2 to-dos
    CALENDAR_BOOK_NAME,            // str
    CALENDAR_BOOK_COLOR,           // str "r.g.b.a"
    CALENDAR_BOOK_MODE,            // int: 0 writable, 1 read-only
    CALENDAR_BOOK_SYNC_DATA1,      // str: the server's id of the book
    CALENDAR_BOOK_VERSION,         // int, ro: version of its last write
    CALENDAR_BOOK_SYNCED_VERSION,  // int, ro: version of the sync engine's last write, 0 when none

    CALENDAR_EVENT_ID = 0x0200,  // int, ro
    CALENDAR_EVENT_BOOK_ID,      // int, must name a book of store type 1
    CALENDAR_EVENT_UID,          // str: the server's id
    CALENDAR_EVENT_SUMMARY,      // str
    CALENDAR_EVENT_DESCRIPTION,  // str
    CALENDAR_EVENT_LOCATION,     // str
    CALENDAR_EVENT_STATUS,       // int: 1 none (default), 2 tentative, 4 confirmed, 8 cancelled
    CALENDAR_EVENT_START,        // caltime
    CALENDAR_EVENT_END,          // caltime
    CALENDAR_EVENT_START_TZID,   // str
    CALENDAR_EVENT_END_TZID,     // str
    CALENDAR_EVENT_SENSITIVITY,  // int: 0 public, 1 private, 2 confidential (default: goes out as "default")
    CALENDAR_EVENT_BUSY_STATUS,  // int: 0 free, 1 busy (default)
    CALENDAR_EVENT_ORGANIZER_NAME,     // str
    CALENDAR_EVENT_ORGANIZER_EMAIL,    // str
    CALENDAR_EVENT_MEETING_STATUS,     // int: 0 none, 1 organised by the user, 2 by somebody else
    CALENDAR_EVENT_FREQ,               // int: 0 none, 1 daily, 2 weekly, 3 monthly, 4 yearly
    CALENDAR_EVENT_RANGE_TYPE,         // int: 0 until, 1 count, 2 none (default)
    CALENDAR_EVENT_COUNT,              // int
    CALENDAR_EVENT_UNTIL,              // caltime
    CALENDAR_EVENT_INTERVAL,           // int, default 1
    CALENDAR_EVENT_BYDAY,              // str "MO,WE"
    CALENDAR_EVENT_BYMONTHDAY,         // str
    CALENDAR_EVENT_BYYEARDAY,          // str
    CALENDAR_EVENT_BYWEEKNO,           // str
    CALENDAR_EVENT_BYMONTH,            // str
    CALENDAR_EVENT_BYSETPOS,           // str
    CALENDAR_EVENT_WKST,               // int: 1 Sunday, 2 Monday (default) ... 7 Saturday
    CALENDAR_EVENT_EXDATE,             // str: recurrence ids of cancelled instances, joined with ", "
    CALENDAR_EVENT_RECURRENCE_ID,      // str, exceptions only: "20140501" or "20140501T100000Z"
    CALENDAR_EVENT_ORIGINAL_EVENT_ID,  // int, exceptions only: the series
    CALENDAR_EVENT_SYNC_DATA1,         // str: for the sync engine ("declined" or "not_declined")
    CALENDAR_EVENT_SYNC_DATA2,      // str: for the sync engine (the server's etag of the engine's last write)
    CALENDAR_EVENT_VERSION,         // int, ro: version of the last write of the event or one of its children
    CALENDAR_EVENT_SYNCED_VERSION,  // int, ro: version of the sync engine's last write, 0 when none
    CALENDAR_EVENT_OWN_VERSION,     // int, ro: version of the last write of the event itself
    CALENDAR_EVENT_ATTENDEES,       // children of _calendar_attendee
    CALENDAR_EVENT_ALARMS,          // children of _calendar_alarm
    CALENDAR_EVENT_EXCEPTIONS,      // children of _calendar_event

    CALENDAR_TODO_ID = 0x0300,     // int, ro
    CALENDAR_TODO_BOOK_ID,         // int, must name a book of store type 2
    CALENDAR_TODO_UID,             // str: the server's id
    CALENDAR_TODO_SUMMARY,         // str
    CALENDAR_TODO_NOTE,            // str
    CALENDAR_TODO_HAS_DUE,         // int: 1 when DUE is set
    CALENDAR_TODO_DUE,             // caltime
    CALENDAR_TODO_STATUS,          // int: 0 none, 1 needs action (default), 2 completed
    CALENDAR_TODO_COMPLETED_TIME,  // lli: seconds since 1970 UTC, 0 when not completed
    CALENDAR_TODO_SYNC_DATA1,      // str: for the sync engine ("due" when the server's copy has a due time)
    CALENDAR_TODO_SYNC_DATA2,      // str: as of the event
    CALENDAR_TODO_VERSION,         // int, ro
    CALENDAR_TODO_SYNCED_VERSION,  // int, ro

    CALENDAR_ATTENDEE_NAME = 0x0400,  // str
    CALENDAR_ATTENDEE_EMAIL,          // str
    CALENDAR_ATTENDEE_ROLE,           // int: 0 none, 3 organizer
    CALENDAR_ATTENDEE_STATUS,         // int: 0 needs action, 1 accepted, 2 declined, 3 tentative

    CALENDAR_ALARM_TICK = 0x0500,  // int: how many units before the start
    CALENDAR_ALARM_TICK_UNIT,      // int: seconds a unit (60: minutes, default; 3600: hours; 86400; 604800)

    CALENDAR_UPDATED_INFO_ID = 0x0600,      // int: the changed record
    CALENDAR_UPDATED_INFO_BOOK_ID,          // int
    CALENDAR_UPDATED_INFO_MODIFIED_STATUS,  // int: record_change_e
    CALENDAR_UPDATED_INFO_VERSION,          // int
    CALENDAR_UPDATED_INFO_SYNCED_VERSION,   // int: the record's synced version; equal to VERSION for the
                                            // engine's own last write (also of a deletion)
};

// --- the service ---------------------------------------------------------------------------------
// Opens the store (counted: each connect has its disconnect). `flags` is reserved, pass 0.
[[nodiscard]] int calendar_connect_with_flags(unsigned flags);
int calendar_disconnect();

// --- records -------------------------------------------------------------------------------------
// PLATFORM_ERROR_INVALID_PARAMETER for NULL handles, a property of another view, a wrong type, or text that is not
// UTF-8. Strings read with ..._str_p are borrowed until the next write of the record.
[[nodiscard]] int calendar_record_create(const char* view, calendar_record_h* out);
int calendar_record_destroy(calendar_record_h record, bool with_children);  // NULL is success
[[nodiscard]] int calendar_record_clone(calendar_record_h record, calendar_record_h* out);
[[nodiscard]] int calendar_record_get_view(calendar_record_h record, const char** view);
[[nodiscard]] int calendar_record_get_int(calendar_record_h record, unsigned property, int* out);
[[nodiscard]] int calendar_record_get_lli(calendar_record_h record, unsigned property, int64_t* out);
[[nodiscard]] int calendar_record_get_str_p(calendar_record_h record, unsigned property, const char** out);
[[nodiscard]] int calendar_record_get_caltime(calendar_record_h record, unsigned property,
                                              calendar_time_s* out);
[[nodiscard]] int calendar_record_set_int(calendar_record_h record, unsigned property, int value);
[[nodiscard]] int calendar_record_set_lli(calendar_record_h record, unsigned property, int64_t value);
[[nodiscard]] int calendar_record_set_str(calendar_record_h record, unsigned property, const char* value);
[[nodiscard]] int calendar_record_set_caltime(calendar_record_h record, unsigned property,
                                              const calendar_time_s& value);
// The parent takes the child over on success.
[[nodiscard]] int calendar_record_add_child_record(calendar_record_h record, unsigned property,
                                                   calendar_record_h child);
// Hands the child back to the caller.
[[nodiscard]] int calendar_record_remove_child_record(calendar_record_h record, unsigned property,
                                                      calendar_record_h child);
[[nodiscard]] int calendar_record_get_child_record_count(calendar_record_h record, unsigned property,
                                                         unsigned* count);
// Borrowed from the parent.
[[nodiscard]] int calendar_record_get_child_record_at_p(calendar_record_h record, unsigned property,
                                                        unsigned index, calendar_record_h* child);

// --- lists: own their records; a list has one cursor -----------------------------------------------
[[nodiscard]] int calendar_list_create(calendar_list_h* out);
int calendar_list_destroy(calendar_list_h list, bool with_records);
[[nodiscard]] int calendar_list_add(calendar_list_h list, calendar_record_h record);
[[nodiscard]] int calendar_list_get_count(calendar_list_h list, int* count);
// first: moves to the first record; next: moves on. PLATFORM_ERROR_NOT_FOUND when there is none.
[[nodiscard]] int calendar_list_first(calendar_list_h list);
[[nodiscard]] int calendar_list_next(calendar_list_h list);
[[nodiscard]] int calendar_list_get_current_record_p(calendar_list_h list, calendar_record_h* record);

// --- queries: conditions are joined with AND ----------------------------------------------------------
[[nodiscard]] int calendar_query_create(const char* view, calendar_query_h* out);
int calendar_query_destroy(calendar_query_h query);
[[nodiscard]] int calendar_query_add_filter_int(calendar_query_h query, unsigned property, int value);
[[nodiscard]] int calendar_query_add_filter_str(calendar_query_h query, unsigned property, const char* value);
// Only these properties are read, the others keep their defaults; children are read only when their property
// is named. Without a projection everything is read.
[[nodiscard]] int calendar_query_set_projection(calendar_query_h query, const unsigned* properties,
                                                size_t count);
[[nodiscard]] int calendar_query_set_sort(calendar_query_h query, unsigned property, bool ascending);

// --- database: reads ---------------------------------------------------------------------------------
[[nodiscard]] int calendar_db_get_record(const char* view, int id, calendar_record_h* out);
// out[i] is the record with ids[i], NULL when there is none; all of one state of the store. On an error nothing is handed out.
[[nodiscard]] int calendar_db_get_records_by_id(const char* view, const int* ids, size_t count,
                                                calendar_record_h* out);
[[nodiscard]] int calendar_db_get_all_records(const char* view, int offset, int limit, calendar_list_h* out);
[[nodiscard]] int calendar_db_get_records_with_query(calendar_query_h query, int offset, int limit,
                                                     calendar_list_h* out);  // limit 0: all
// Calls `use` for each record that the query finds, in no particular order (a sort is refused with
// PLATFORM_ERROR_INVALID_PARAMETER), all of one state of the store. A record is borrowed for its call. The store is locked
// meanwhile, `use` must not call the service. Takes little memory, however many records there are.
using calendar_record_cb = void (*)(calendar_record_h record, void* user_data);
[[nodiscard]] int calendar_db_for_each_record(calendar_query_h query, calendar_record_cb use,
                                              void* user_data);
// Per record of `view` in `book_id` its latest change after `version`, as _calendar_updated_info records in
// version order; a record inserted and later updated is still "inserted", inserted and deleted in between is
// nothing, unless the sync engine wrote it (it has seen what it wrote, and must learn of the deletion).
// Exceptions are never listed, and of the store's deletions the last 262,144. `current_version` is the store's version of the same snapshot.
[[nodiscard]] int calendar_db_get_changes_by_version(const char* view, int book_id, int version,
                                                     calendar_list_h* out, int* current_version);
// The same changes in the same order, one record at a time, as calendar_db_for_each_record does.
[[nodiscard]] int calendar_db_for_each_change(const char* view, int book_id, int version,
                                              calendar_record_cb use, void* user_data, int* current_version);
[[nodiscard]] int calendar_db_get_current_version(int* version);
// Two equal marks: nobody wrote in between, and what was read after the first is what the store holds. Takes no lock of the file,
// so it costs a fraction of a read.
[[nodiscard]] int calendar_db_get_write_mark(uint64_t* mark);
// The version of the calling thread's own last write; the store's current version when it has made none.
[[nodiscard]] int calendar_db_get_last_change_version(int* version);

// --- database: writes ----------------------------------------------------------------------------------
// Every call is one durable transaction, or part of the thread's open one. Single-record calls return
// PLATFORM_ERROR_CONFLICT when the expected version does not match, PLATFORM_ERROR_NOT_FOUND when the record is gone.
// Bulk calls skip such records (see record_write_options_s) and fail as a whole only for other reasons.
//
// insert: the new id is stored into the record (and *id). An exception is inserted with its ORIGINAL_EVENT_ID set
// (its book is the series'); exceptions among a new series' children are inserted with it.
[[nodiscard]] int calendar_db_insert_record(calendar_record_h record, int* id,
                                            const record_write_options_s& options = {});
[[nodiscard]] int calendar_db_insert_records(calendar_list_h list,
                                             const record_write_options_s& options = {});
// update: writes the record (found by its own id) as it stands. Attendees and alarms become those of the record.
// Exceptions among the children: one without an id is inserted, the others are updated where they differ, and
// those taken out of the record are deleted. A record read through a projection writes only what was read or set.
[[nodiscard]] int calendar_db_update_record(calendar_record_h record,
                                            const record_write_options_s& options = {});
[[nodiscard]] int calendar_db_update_records(calendar_list_h list,
                                             const record_write_options_s& options = {});
// replace: makes the record `id` equal to `record` (defaults included); a series keeps its exceptions and its
// exception dates, every record its id and its book.
[[nodiscard]] int calendar_db_replace_record(calendar_record_h record, int id,
                                             const record_write_options_s& options = {});
[[nodiscard]] int calendar_db_replace_records(calendar_list_h list, const int* ids, size_t count,
                                              const record_write_options_s& options = {});
// delete: a series goes with its exceptions, a book with all its records. A single exception may be deleted too.
[[nodiscard]] int calendar_db_delete_record(const char* view, int id,
                                            const record_write_options_s& options = {});
[[nodiscard]] int calendar_db_delete_records(const char* view, const int* ids, size_t count,
                                             const record_write_options_s& options = {});

// A transaction of the calling thread over several calls (each still raises the version); nests by count. Between
// begin and end the thread holds the store's lock. end(false) undoes everything since the outermost begin.
[[nodiscard]] int calendar_db_begin_transaction();
[[nodiscard]] int calendar_db_end_transaction(bool commit);

// --- change callbacks --------------------------------------------------------------------------------------
// Called by the default main context after another process wrote records of `view` (an exception's write counts as
// an event's). Several writes may be told once. Main thread only.
using calendar_db_changed_cb = void (*)(const char* view, void* user_data);
[[nodiscard]] int calendar_db_add_changed_cb(const char* view, calendar_db_changed_cb callback,
                                             void* user_data);
int calendar_db_remove_changed_cb(const char* view, calendar_db_changed_cb callback, void* user_data);

// --- RAII -----------------------------------------------------------------------------------------------------
struct calendar_handle_deleter {
    void operator()(calendar_record_h record) const noexcept { calendar_record_destroy(record, true); }
    void operator()(calendar_list_h list) const noexcept { calendar_list_destroy(list, true); }
    void operator()(calendar_query_h query) const noexcept { calendar_query_destroy(query); }
};
using CalendarRecord = std::unique_ptr<platform::records::Record, calendar_handle_deleter>;
using CalendarList = std::unique_ptr<platform::records::RecordList, calendar_handle_deleter>;
using CalendarQuery = std::unique_ptr<platform::records::Query, calendar_handle_deleter>;
