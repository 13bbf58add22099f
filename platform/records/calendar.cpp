// The calendar service's functions: thin, over the record engine.
#include "platform/calendar.h"

#include "CalendarViews.h"
#include "RecordCalls.h"

namespace calls = platform::records::calls;
using platform::records::calendarStore;
using platform::records::Query;
using platform::records::Record;
using platform::records::RecordList;
using platform::records::Type;
using platform::records::Value;
using platform::records::View;

namespace {

constexpr int kInvalid = PLATFORM_ERROR_INVALID_PARAMETER;

// Hands a filled list out.
template <class Fill>
int makeList(calendar_list_h* out, Fill fill) {
    if (out == nullptr) return kInvalid;
    auto list = std::make_unique<RecordList>();
    if (const int code = fill(list.get()); code != PLATFORM_ERROR_NONE) return code;
    *out = list.release();
    return PLATFORM_ERROR_NONE;
}

template <class Handle>
int destroy(Handle* handle) {
    delete handle;
    return PLATFORM_ERROR_NONE;
}

}  // namespace

int calendar_connect_with_flags(unsigned flags) {
    return flags == 0 ? calendarStore().connect() : kInvalid;
}
int calendar_disconnect() {
    return calendarStore().disconnect();
}

// --- records

int calendar_record_create(const char* view, calendar_record_h* out) {
    return calls::create(calendarStore(), view, out);
}
int calendar_record_destroy(calendar_record_h record, bool with_children) {
    if (record != nullptr && !with_children) {
        // The children belong to somebody else from here on.
        for (size_t i = 0; i < record->view().properties.size(); ++i) {
            for (auto& child : record->children(i)) (void)child.release();
        }
    }
    return destroy(record);
}
int calendar_record_clone(calendar_record_h record, calendar_record_h* out) {
    return calls::clone(record, out);
}
int calendar_record_get_view(calendar_record_h record, const char** view) {
    if (record == nullptr || view == nullptr) return kInvalid;
    *view = record->view().uri;
    return PLATFORM_ERROR_NONE;
}
int calendar_record_get_int(calendar_record_h record, unsigned property, int* out) {
    return calls::getInt(record, property, out);
}
int calendar_record_get_lli(calendar_record_h record, unsigned property, int64_t* out) {
    return calls::getLong(record, property, out);
}
int calendar_record_get_str_p(calendar_record_h record, unsigned property, const char** out) {
    return calls::getText(record, property, out);
}
int calendar_record_get_caltime(calendar_record_h record, unsigned property, calendar_time_s* out) {
    return calls::getTime(record, property, out);
}
int calendar_record_set_int(calendar_record_h record, unsigned property, int value) {
    return calls::setNumber(record, property, Type::kInt, value);
}
int calendar_record_set_lli(calendar_record_h record, unsigned property, int64_t value) {
    return calls::setNumber(record, property, Type::kLong, value);
}
int calendar_record_set_str(calendar_record_h record, unsigned property, const char* value) {
    return calls::setText(record, property, value);
}
int calendar_record_set_caltime(calendar_record_h record, unsigned property, const calendar_time_s& value) {
    return calls::setTime(record, property, value);
}
int calendar_record_add_child_record(calendar_record_h record, unsigned property, calendar_record_h child) {
    return calls::addChild(record, property, child);
}
int calendar_record_remove_child_record(calendar_record_h record, unsigned property,
                                        calendar_record_h child) {
    return calls::removeChild(record, property, child);
}
int calendar_record_get_child_record_count(calendar_record_h record, unsigned property, unsigned* count) {
    return calls::countChildren(record, property, count);
}
int calendar_record_get_child_record_at_p(calendar_record_h record, unsigned property, unsigned index,
                                          calendar_record_h* child) {
    return calls::childAt(record, property, index, child);
}

// --- lists

int calendar_list_create(calendar_list_h* out) {
    return makeList(out, [](RecordList*) { return PLATFORM_ERROR_NONE; });
}
int calendar_list_destroy(calendar_list_h list, bool with_records) {
    if (list != nullptr && !with_records) list->release();
    return destroy(list);
}
int calendar_list_add(calendar_list_h list, calendar_record_h record) {
    return calls::listAdd(list, record);
}
int calendar_list_get_count(calendar_list_h list, int* count) {
    if (list == nullptr || count == nullptr) return kInvalid;
    *count = static_cast<int>(list->records.size());
    return PLATFORM_ERROR_NONE;
}
int calendar_list_first(calendar_list_h list) {
    return calls::listMove(list, /*first=*/true);
}
int calendar_list_next(calendar_list_h list) {
    return calls::listMove(list, /*first=*/false);
}
int calendar_list_get_current_record_p(calendar_list_h list, calendar_record_h* record) {
    return calls::listCurrent(list, record);
}

// --- queries

int calendar_query_create(const char* view, calendar_query_h* out) {
    return calls::queryCreate(calendarStore(), view, out);
}
int calendar_query_destroy(calendar_query_h query) {
    return destroy(query);
}
int calendar_query_add_filter_int(calendar_query_h query, unsigned property, int value) {
    return calls::queryFilter(query, property, Value(int64_t{value}));
}
int calendar_query_add_filter_str(calendar_query_h query, unsigned property, const char* value) {
    if (value == nullptr) return kInvalid;
    return calls::queryFilter(query, property, Value(std::string(value)));
}
int calendar_query_set_projection(calendar_query_h query, const unsigned* properties, size_t count) {
    return calls::queryProjection(query, properties, count);
}
int calendar_query_set_sort(calendar_query_h query, unsigned property, bool ascending) {
    return calls::querySort(query, property, ascending);
}

// --- database: reads

int calendar_db_get_record(const char* view, int id, calendar_record_h* out) {
    const View* found = calendarStore().viewOf(view);
    if (found == nullptr || found->idProperty == 0 || out == nullptr) return kInvalid;
    std::unique_ptr<Record> record;
    if (const int code = calendarStore().get(*found, id, &record); code != PLATFORM_ERROR_NONE) return code;
    *out = record.release();
    return PLATFORM_ERROR_NONE;
}
int calendar_db_get_all_records(const char* view, int offset, int limit, calendar_list_h* out) {
    const View* found = calendarStore().viewOf(view);
    if (found == nullptr) return kInvalid;
    return makeList(
        out, [&](RecordList* list) { return calendarStore().query(Query(*found), offset, limit, list); });
}
int calendar_db_get_records_with_query(calendar_query_h query, int offset, int limit, calendar_list_h* out) {
    if (query == nullptr) return kInvalid;
    return makeList(out,
                    [&](RecordList* list) { return calendarStore().query(*query, offset, limit, list); });
}
int calendar_db_get_changes_by_version(const char* view, int book_id, int version, calendar_list_h* out,
                                       int* current_version) {
    const View* found = calendarStore().viewOf(view);
    if (found == nullptr || current_version == nullptr) return kInvalid;
    return makeList(out, [&](RecordList* list) {
        return calendarStore().changes(*found, book_id, version, list, current_version);
    });
}
int calendar_db_get_current_version(int* version) {
    return version != nullptr ? calendarStore().currentVersion(version) : kInvalid;
}
int calendar_db_get_last_change_version(int* version) {
    return version != nullptr ? calendarStore().lastChangeVersion(version) : kInvalid;
}

// --- database: writes

int calendar_db_insert_record(calendar_record_h record, int* id, const record_write_options_s& options) {
    if (record == nullptr) return kInvalid;
    const int code = calls::insert(calendarStore(), {&record, 1}, options, /*single=*/true);
    if (code == PLATFORM_ERROR_NONE && id != nullptr) *id = record->id();
    return code;
}
int calendar_db_insert_records(calendar_list_h list, const record_write_options_s& options) {
    if (list == nullptr) return kInvalid;
    return calls::insert(calendarStore(), list->records, options, /*single=*/false);
}
int calendar_db_update_record(calendar_record_h record, const record_write_options_s& options) {
    if (record == nullptr) return kInvalid;
    return calls::update(calendarStore(), {&record, 1}, options, /*single=*/true);
}
int calendar_db_update_records(calendar_list_h list, const record_write_options_s& options) {
    if (list == nullptr) return kInvalid;
    return calls::update(calendarStore(), list->records, options, /*single=*/false);
}
int calendar_db_replace_record(calendar_record_h record, int id, const record_write_options_s& options) {
    if (record == nullptr) return kInvalid;
    return calls::replace(calendarStore(), {&record, 1}, {&id, 1}, options, /*single=*/true);
}
int calendar_db_replace_records(calendar_list_h list, const int* ids, size_t count,
                                const record_write_options_s& options) {
    if (list == nullptr || ids == nullptr) return kInvalid;
    return calls::replace(calendarStore(), list->records, {ids, count}, options, /*single=*/false);
}
int calendar_db_delete_record(const char* view, int id, const record_write_options_s& options) {
    return calls::remove(calendarStore(), view, {&id, 1}, options, /*single=*/true);
}
int calendar_db_delete_records(const char* view, const int* ids, size_t count,
                               const record_write_options_s& options) {
    if (ids == nullptr) return kInvalid;
    return calls::remove(calendarStore(), view, {ids, count}, options, /*single=*/false);
}
int calendar_db_begin_transaction() {
    return calendarStore().begin();
}
int calendar_db_end_transaction(bool commit) {
    return calendarStore().end(commit);
}

// --- change callbacks

int calendar_db_add_changed_cb(const char* view, calendar_db_changed_cb callback, void* user_data) {
    const View* found = calendarStore().viewOf(view);
    return found != nullptr ? calendarStore().addCallback(*found, callback, user_data) : kInvalid;
}
int calendar_db_remove_changed_cb(const char* view, calendar_db_changed_cb callback, void* user_data) {
    const View* found = calendarStore().viewOf(view);
    return found != nullptr ? calendarStore().removeCallback(*found, callback, user_data) : kInvalid;
}
