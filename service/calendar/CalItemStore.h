// CalItemStore: what the metadata stores of events and of to-dos have in common, so that one comparison, one change walk and one
// upload serve both. A to-do's row uses the event row's like-named columns and leaves the others empty.
// Threads: any; the database's mutex guards every statement.   Errors: 0 or -1, outputs untouched on failure.
#pragma once

#include <string>
#include <vector>

#include "calendar/CalBookRows.h"
#include "calendar/CalMetaData.h"
#include "common/SyncDatabase.h"

class CalItemStore {
public:
    virtual ~CalItemStore() = default;

    // All rows of one book, read once for a comparison, a change walk or an upload.
    [[nodiscard]] virtual int getAllItems(int calendarId, std::vector<CalEventMetaData>* rows) = 0;
    [[nodiscard]] virtual int getItem(int itemId, CalEventMetaData* row) = 0;
    [[nodiscard]] virtual int insertItem(const CalEventMetaData& row) = 0;
    // An instance's row is addressed by its series and recurrence id.
    [[nodiscard]] virtual int updateItem(const CalEventMetaData& row) = 0;
    [[nodiscard]] virtual int deleteItem(int calendarId, const std::string& uri) = 0;
    // A row that the server does not know, by the id of its record.
    [[nodiscard]] virtual int forgetItem(int itemId) = 0;
    [[nodiscard]] virtual int markDirty(int itemId, int dirty) = 0;
    [[nodiscard]] virtual int markDeleted(int itemId, int deleted) = 0;
    // Dirty and deleted rows of one account's books.
    [[nodiscard]] virtual int countPending(int accountId, int* dirty, int* deleted) = 0;

    [[nodiscard]] virtual CalBookRows& books() = 0;
    // For SyncTransaction: one transaction over several writes.
    virtual SyncDatabase& database() = 0;
};
