// CalBookRows: the rows of calendars, or of task lists, in a sync metadata store. The two stores differ in the table's name.
// Owner: a metadata store.   Threads: any; the database's mutex guards every statement.
// Errors: 0 or -1, outputs untouched on failure; a read that finds no row is -1 without a log. Lists are appended to.
#pragma once

#include <list>
#include <string>

#include "calendar/CalMetaData.h"
#include "common/SyncDatabase.h"

class CalBookRows {
public:
    // The database is not owned.
    CalBookRows(SyncDatabase* database, std::string table);

    [[nodiscard]] int get(int calendarId, CalBookMetaData* row);
    [[nodiscard]] int get(int accountId, const std::string& uri, CalBookMetaData* row);
    // Any account's.
    [[nodiscard]] int getByUri(const std::string& uri, CalBookMetaData* row);
    [[nodiscard]] int getId(int accountId, const std::string& uri, int* calendarId);
    [[nodiscard]] int getUri(int calendarId, std::string* uri);
    [[nodiscard]] int getVersion(int calendarId, int* version);
    [[nodiscard]] int getIds(int accountId, std::list<int>* calendarIds);
    [[nodiscard]] int getDirtyIds(int accountId, std::list<int>* calendarIds);
    [[nodiscard]] int getDeletedIds(int accountId, std::list<int>* calendarIds);
    [[nodiscard]] int getUris(int accountId, std::list<std::string>* uris);
    [[nodiscard]] int getAccountIds(std::list<int>* accountIds);

    // Dirty and deleted rows of `itemTable` in an account's books.
    [[nodiscard]] int countPending(const std::string& itemTable, int accountId, int* dirty, int* deleted);

    [[nodiscard]] int insert(const CalBookMetaData& row);
    // The row with the same uri and account.
    [[nodiscard]] int update(const CalBookMetaData& row);
    [[nodiscard]] int updateUri(int calendarId, const std::string& uri, const std::string& etag);
    [[nodiscard]] int updateVersion(int calendarId, int version);
    [[nodiscard]] int updateDirty(int calendarId, int dirty);
    [[nodiscard]] int updateDeleted(int calendarId, int deleted);
    // The rows of the book's items follow by trigger.
    [[nodiscard]] int remove(int calendarId);
    [[nodiscard]] int remove(int accountId, const std::string& uri);
    [[nodiscard]] int removeByUri(const std::string& uri);
    [[nodiscard]] int removeAccount(int accountId);

private:
    // "SELECT WHAT FROM table where CONDITION".
    [[nodiscard]] std::string select(const char* what, const char* condition) const;
    // "UPDATE table SET COLUMN=? WHERE calendar_id=?".
    [[nodiscard]] int set(const char* column, int value, int calendarId);

    SyncDatabase* const mpDatabase;
    const std::string mTable;
};
