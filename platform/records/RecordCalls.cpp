#include "RecordCalls.h"

#include <glib.h>

#include <algorithm>
#include <limits>

#include "platform/error.h"

namespace platform::records::calls {

namespace {

constexpr int kInvalid = PLATFORM_ERROR_INVALID_PARAMETER;
constexpr int kNone = PLATFORM_ERROR_NONE;

// The position of a property of `type`, or -1.
int positionOf(const Record* record, unsigned property, Type type) {
    if (record == nullptr) return -1;
    const int index = record->view().indexOf(property);
    return index >= 0 && record->view().properties[static_cast<size_t>(index)].type == type ? index : -1;
}

int settable(const Record* record, unsigned property, Type type) {
    const int index = positionOf(record, property, type);
    return index >= 0 && !record->view().properties[static_cast<size_t>(index)].readOnly ? index : -1;
}

template <class T, class Out>
int read(const Record* record, unsigned property, Type type, Out* out) {
    const int index = positionOf(record, property, type);
    if (index < 0 || out == nullptr) return kInvalid;
    *out = static_cast<Out>(std::get<T>(record->valueAt(static_cast<size_t>(index))));
    return kNone;
}

}  // namespace

int create(Store& store, const char* view, Record** out) {
    const View* found = store.viewOf(view);
    if (found == nullptr || out == nullptr) return kInvalid;
    *out = new Record(*found);
    return kNone;
}

int clone(const Record* record, Record** out) {
    if (record == nullptr || out == nullptr) return kInvalid;
    *out = record->clone().release();
    return kNone;
}

int getInt(const Record* record, unsigned property, int* out) {
    return read<int64_t>(record, property, Type::kInt, out);
}

int getLong(const Record* record, unsigned property, int64_t* out) {
    return read<int64_t>(record, property, Type::kLong, out);
}

int getText(const Record* record, unsigned property, const char** out) {
    const int index = positionOf(record, property, Type::kText);
    if (index < 0 || out == nullptr) return kInvalid;
    *out = std::get<std::string>(record->valueAt(static_cast<size_t>(index))).c_str();
    return kNone;
}

int getTime(const Record* record, unsigned property, calendar_time_s* out) {
    return read<calendar_time_s>(record, property, Type::kTime, out);
}

int setNumber(Record* record, unsigned property, Type type, int64_t value) {
    const int index = settable(record, property, type);
    if (index < 0) return kInvalid;
    record->setAt(static_cast<size_t>(index), value);
    return kNone;
}

int setText(Record* record, unsigned property, const char* value) {
    const int index = settable(record, property, Type::kText);
    if (index < 0 || value == nullptr || g_utf8_validate(value, -1, nullptr) == FALSE) return kInvalid;
    record->setAt(static_cast<size_t>(index), std::string(value));
    return kNone;
}

int setTime(Record* record, unsigned property, const calendar_time_s& value) {
    const int index = settable(record, property, Type::kTime);
    if (index < 0) return kInvalid;
    record->setAt(static_cast<size_t>(index), value);
    return kNone;
}

int addChild(Record* record, unsigned property, Record* child) {
    const int index = positionOf(record, property, Type::kChildren);
    if (index < 0 || child == nullptr || child == record) return kInvalid;
    const auto position = static_cast<size_t>(index);
    if (!isSame(record->view().properties[position].childView, child->view().uri)) return kInvalid;
    record->children(position).emplace_back(child);
    record->setPresent(position, true);
    return kNone;
}

int removeChild(Record* record, unsigned property, Record* child) {
    const int index = positionOf(record, property, Type::kChildren);
    if (index < 0) return kInvalid;
    Record::Children& all = record->children(static_cast<size_t>(index));
    const auto found =
        std::find_if(all.begin(), all.end(), [child](const auto& entry) { return entry.get() == child; });
    if (found == all.end()) return PLATFORM_ERROR_NOT_FOUND;
    (void)found->release();
    all.erase(found);
    record->setPresent(static_cast<size_t>(index), true);
    return kNone;
}

int countChildren(const Record* record, unsigned property, unsigned* count) {
    const int index = positionOf(record, property, Type::kChildren);
    if (index < 0 || count == nullptr) return kInvalid;
    *count = static_cast<unsigned>(record->children(static_cast<size_t>(index)).size());
    return kNone;
}

int childAt(Record* record, unsigned property, unsigned index, Record** child) {
    const int position = positionOf(record, property, Type::kChildren);
    if (position < 0 || child == nullptr) return kInvalid;
    Record::Children& all = record->children(static_cast<size_t>(position));
    if (index >= all.size()) return PLATFORM_ERROR_NOT_FOUND;
    *child = all[index].get();
    return kNone;
}

int listAdd(RecordList* list, Record* record) {
    if (list == nullptr || record == nullptr) return kInvalid;
    list->records.push_back(record);
    return kNone;
}

int listMove(RecordList* list, bool first) {
    if (list == nullptr) return kInvalid;
    const size_t wanted = first ? 0 : list->cursor + 1;
    if (wanted >= list->records.size()) return PLATFORM_ERROR_NOT_FOUND;
    list->cursor = wanted;
    return kNone;
}

int listCurrent(const RecordList* list, Record** record) {
    if (list == nullptr || record == nullptr) return kInvalid;
    if (list->cursor >= list->records.size()) return PLATFORM_ERROR_NOT_FOUND;
    *record = list->records[list->cursor];
    return kNone;
}

int queryCreate(Store& store, const char* view, Query** out) {
    const View* found = store.viewOf(view);
    if (found == nullptr || out == nullptr) return kInvalid;
    *out = new Query(*found);
    return kNone;
}

int queryFilter(Query* query, unsigned property, Value value) {
    const int index = query != nullptr ? query->view->indexOf(property) : -1;
    if (index < 0 || query->view->properties[static_cast<size_t>(index)].column == nullptr) return kInvalid;
    query->filters.push_back({static_cast<size_t>(index), std::move(value)});
    return kNone;
}

int queryProjection(Query* query, const unsigned* properties, size_t count) {
    if (query == nullptr || properties == nullptr) return kInvalid;
    std::vector<bool> projection(query->view->properties.size(), false);
    for (size_t i = 0; i < count; ++i) {
        const int index = query->view->indexOf(properties[i]);
        if (index < 0) return kInvalid;
        projection[static_cast<size_t>(index)] = true;
    }
    query->projection = std::move(projection);
    return kNone;
}

int querySort(Query* query, unsigned property, bool ascending) {
    const int index = query != nullptr ? query->view->indexOf(property) : -1;
    if (index < 0 || query->view->properties[static_cast<size_t>(index)].column == nullptr) return kInvalid;
    query->sortIndex = index;
    query->ascending = ascending;
    return kNone;
}

namespace {

// A single call says why its record was left out, a bulk call which ones were.
template <class Call>
int written(const record_write_options_s& options, bool single, Call call) {
    std::vector<Store::Skip> skips;
    if (options.skipped != nullptr) options.skipped->clear();
    if (const int code = call(&skips); code != kNone) return code;
    if (single) return skips.empty() ? kNone : skips.front().reason;
    if (options.skipped != nullptr) {
        for (const Store::Skip& skip : skips) options.skipped->push_back(skip.position);
    }
    return kNone;
}

}  // namespace

int insert(Store& store, std::span<Record* const> records, const record_write_options_s& options,
           bool single) {
    return written(options, single, [&](auto* skips) { return store.insert(records, options, skips); });
}

int update(Store& store, std::span<Record* const> records, const record_write_options_s& options,
           bool single) {
    return written(options, single, [&](auto* skips) { return store.update(records, options, skips); });
}

int replace(Store& store, std::span<Record* const> records, std::span<const int> ids,
            const record_write_options_s& options, bool single) {
    return written(options, single, [&](auto* skips) { return store.replace(records, ids, options, skips); });
}

int remove(Store& store, const char* view, std::span<const int> ids, const record_write_options_s& options,
           bool single) {
    const View* found = store.viewOf(view);
    if (found == nullptr) return kInvalid;
    return written(options, single, [&](auto* skips) { return store.remove(*found, ids, options, skips); });
}

}  // namespace platform::records::calls
