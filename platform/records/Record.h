// Record, RecordList, Query: what the services hand out. Not shared between threads.
#pragma once

#include <memory>
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
        return index < 0 ? nullptr : std::get_if<T>(&mValues[static_cast<size_t>(index)]);
    }
    [[nodiscard]] int64_t number(unsigned property) const;
    [[nodiscard]] const Value& valueAt(size_t index) const { return mValues[index]; }
    [[nodiscard]] int id() const { return static_cast<int>(number(mView->idProperty)); }
    [[nodiscard]] int seriesId() const;

    void setAt(size_t index, Value value) {
        mValues[index] = std::move(value);
        mPresent[index] = true;
    }
    void setNumber(unsigned property, int64_t value);

    // Whether the property was read or set: only those are written by an update.
    [[nodiscard]] bool isPresent(size_t index) const { return mPresent[index]; }
    void setPresent(size_t index, bool present) { mPresent[index] = present; }
    void setAllPresent(bool present) { mPresent.assign(mPresent.size(), present); }

    using Children = std::vector<std::unique_ptr<Record>>;
    [[nodiscard]] Children& children(size_t index) { return mChildren[index]; }
    [[nodiscard]] const Children& children(size_t index) const { return mChildren[index]; }

    // Whether both say the same in every property that a user can set, attendees and the like included, exceptions not.
    [[nodiscard]] bool hasSameContent(const Record& other) const;

    std::vector<int> readExceptions;  // ids of the exceptions that the record was read with

private:
    const View* mView;
    std::vector<Value> mValues;       // by position in the view
    std::vector<bool> mPresent;       // likewise
    std::vector<Children> mChildren;  // likewise, empty for other properties
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

class Query {
public:
    explicit Query(const View& queried) : view(&queried) {}

    struct Filter {
        size_t index;
        Value value;
    };
    const View* view;
    std::vector<Filter> filters;
    std::vector<bool> projection;  // by position; empty: everything
    int sortIndex = -1;
    bool ascending = true;
};

}  // namespace platform::records
