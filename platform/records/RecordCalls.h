// RecordCalls: what the services' record, list and query functions have in common; each service's functions forward to these.
// Every NULL handle, foreign property or wrong type is PLATFORM_ERROR_INVALID_PARAMETER.
#pragma once

#include "Store.h"

namespace platform::records::calls {

int create(Store& store, const char* view, Record** out);
int clone(const Record* record, Record** out);
int getInt(const Record* record, unsigned property, int* out);
int getLong(const Record* record, unsigned property, int64_t* out);
int getText(const Record* record, unsigned property, const char** out);
int getTime(const Record* record, unsigned property, calendar_time_s* out);
int setNumber(Record* record, unsigned property, Type type, int64_t value);
int setText(Record* record, unsigned property, const char* value);
int setTime(Record* record, unsigned property, const calendar_time_s& value);
int addChild(Record* record, unsigned property, Record* child);
int removeChild(Record* record, unsigned property, Record* child);
int countChildren(const Record* record, unsigned property, unsigned* count);
int childAt(Record* record, unsigned property, unsigned index, Record** child);

int listAdd(RecordList* list, Record* record);
int listMove(RecordList* list, bool first);
int listCurrent(const RecordList* list, Record** record);

int queryCreate(Store& store, const char* view, Query** out);
int queryFilter(Query* query, unsigned property, Value value);
int queryProjection(Query* query, const unsigned* properties, size_t count);
int querySort(Query* query, unsigned property, bool ascending);

// One record or all of a list, through the store's bulk calls.
int insert(Store& store, std::span<Record* const> records, const record_write_options_s& options,
           bool single);
int update(Store& store, std::span<Record* const> records, const record_write_options_s& options,
           bool single);
int replace(Store& store, std::span<Record* const> records, std::span<const int> ids,
            const record_write_options_s& options, bool single);
int remove(Store& store, const char* view, std::span<const int> ids, const record_write_options_s& options,
           bool single);

}  // namespace platform::records::calls
