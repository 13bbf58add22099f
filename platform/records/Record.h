// Record, RecordList, Query: what the services hand out. Not shared between threads.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <span>
#include <string>
#include <utility>
#include <variant>
#include <vector>

#include "View.h"
#include "platform/record_types.h"

namespace platform::records {

using Value = std::variant<int64_t, std::string, calendar_time_s>;

class Record {
public:
    explicit Record(const View& view);
    [[nodiscard]] std::unique_ptr<Record> clone() const;

    [[nodiscard]] const View& view() const { return *mView; }

    // NULL when the view has no such property or it is of another type.
    template <class T>
    [[nodiscard]] const T* get(unsigned property) const {
        const int index = mView->indexOf(property);
        return index < 0 ? nullptr : std::get_if<T>(&valueAt(static_cast<size_t>(index)));
    }
    [[nodiscard]] int64_t number(unsigned property) const;
    [[nodiscard]] const Value& valueAt(size_t index) const {
        return mSlots[index] != kDefault ? mValues[mSlots[index]] : (*mDefaults)[index];
    }
    [[nodiscard]] int id() const { return static_cast<int>(number(mView->idProperty)); }
    [[nodiscard]] int seriesId() const;

    void setAt(size_t index, Value value);
    // Makes room for so many values.
    void reserve(size_t count) { mValues.reserve(count); }
    void setNumber(unsigned property, int64_t value);

    // Whether the property was read or set: only those are written by an update.
    [[nodiscard]] bool isPresent(size_t index) const { return mPresent[index]; }
    void setPresent(size_t index, bool present) { mPresent[index] = present; }
    void setAllPresent(bool present) { mPresent.assign(mPresent.size(), present); }

    using Children = std::vector<std::unique_ptr<Record>>;
    [[nodiscard]] Children& children(size_t index) { return mChildren[index]; }
    [[nodiscard]] const Children& children(size_t index) const;

    // Whether both say the same in every property that a user can set, attendees and the like included, exceptions not.
    [[nodiscard]] bool hasSameContent(const Record& other) const;

    std::vector<int> readExceptions;  // ids of the exceptions that the record was read with

private:
    // Most records hold few of their view's properties: only what was set takes room.
    static constexpr uint8_t kDefault = 0xff;
    const View* mView;
    const std::vector<Value>* mDefaults;   // of the view, by position
    std::vector<uint8_t> mSlots;           // by position in the view: where the value is, or kDefault
    std::vector<Value> mValues;            // in the order in which they were set
    std::vector<bool> mPresent;            // by position in the view
    std::map<size_t, Children> mChildren;  // by position in the view
};

class RecordList {
public:
    std::vector<Record*> records;  // owned, unless release() is called
    size_t cursor = 0;

    ~RecordList() {
        for (Record* record : records) delete record;
    }
    RecordList() = default;
    RecordList(const RecordList&) = delete;
    RecordList& operator=(const RecordList&) = delete;
    void release() { records.clear(); }
};

// The JSON array that a statement's json_each() takes.
[[nodiscard]] std::string idArray(std::span<const int> ids);

class Query {
public:
    explicit Query(const View& queried) : view(&queried) {}

    struct Filter {
        size_t index;
        Value value;
    };
    const View* view;
    std::vector<Filter> filters;
    std::string ids;               // as idArray() makes it; empty: whatever the id
    std::vector<bool> projection;  // by position; empty: everything
    int sortIndex = -1;
    bool ascending = true;
};

}  // namespace platform::records
