// Reads of the sync metadata stores: single values, rows and lists. A type that can be read has a `take` for its row.
#pragma once

#include <iterator>
#include <string>
#include <utility>

#include "common/SyncDatabase.h"

namespace row_read {

inline void take(const SyncDatabase::Row& row, int* value) {
    *value = row.integer(0);
}
inline void take(const SyncDatabase::Row& row, std::string* value) {
    *value = row.text(0);
}

// -1 without a log when there is no row; `out` is then untouched.
template <class Value>
int readOne(SyncDatabase& database, std::string_view sql, SyncDatabase::Params params, Value* out) {
    return database.readRow(sql, params, [out](const SyncDatabase::Row& row) { take(row, out); });
}

// Appends one value a row; `out` is untouched on failure.
template <class List>
int readList(SyncDatabase& database, std::string_view sql, SyncDatabase::Params params, List* out) {
    List found;
    const int result = database.readAll(sql, params, [&found](const SyncDatabase::Row& row) {
        found.emplace_back();
        take(row, &found.back());
    });
    if (result != sync_result::kOk) return result;
    if (out->empty()) {
        *out = std::move(found);
    } else {
        out->insert(out->end(), std::make_move_iterator(found.begin()), std::make_move_iterator(found.end()));
    }
    return sync_result::kOk;
}

}  // namespace row_read
