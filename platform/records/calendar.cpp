// The calendar service's functions.
#include "platform/calendar.h"

#include "CalendarViews.h"

using platform::records::calendarStore;

#define RECORD_CALL(name) calendar_##name
#define RECORD_STORE calendarStore
#include "ServiceCalls.inc"

int calendar_record_get_lli(calendar_record_h record, unsigned property, int64_t* out) {
    return calls::getLong(record, property, out);
}
int calendar_record_get_caltime(calendar_record_h record, unsigned property, calendar_time_s* out) {
    return calls::getTime(record, property, out);
}
int calendar_record_set_lli(calendar_record_h record, unsigned property, int64_t value) {
    return calls::setNumber(record, property, Type::kLong, value);
}
int calendar_record_set_caltime(calendar_record_h record, unsigned property, const calendar_time_s& value) {
    return calls::setTime(record, property, value);
}

int calendar_db_get_changes_by_version(const char* view, int book_id, int version, calendar_list_h* out,
                                       int* current_version) {
    const View* found = calendarStore().viewOf(view);
    if (found == nullptr || current_version == nullptr) return kInvalid;
    return makeList(out, [&](RecordList* list) {
        return calendarStore().changes(*found, book_id, version, list, current_version);
    });
}

int calendar_db_for_each_change(const char* view, int book_id, int version, calendar_record_cb use,
                                void* user_data, int* current_version) {
    const View* found = calendarStore().viewOf(view);
    if (found == nullptr || use == nullptr || current_version == nullptr) return kInvalid;
    return calendarStore().visitChanges(
        *found, book_id, version, [use, user_data](auto& record) { use(record.get(), user_data); },
        current_version);
}
