// CalTodoMetaDataDBHelper: the task-side twin of CalMetaDataDBHelper, in a file of its own.
// Owner: CalTodoDataManager, process-wide, made on first use, never destroyed.   Threads: any; the database's mutex guards
// every statement.   Errors: 0 or -1; outputs untouched on failure; a read that finds no row is -1 without a log. Lists are
// appended to.
//
// Operations that ask by a uri alone cross accounts; the sync uses those bound to a book or account.
#pragma once

#include <list>
#include <string>
#include <vector>

#include "calendar/CalItemStore.h"
#include "calendar/CalMetaData.h"
#include "common/SyncDatabase.h"

class CalTodoMetaDataDBHelper : public CalItemStore {
public:
    CalTodoMetaDataDBHelper();
    [[nodiscard]] int openDb() { return mDatabase.openDb(); }

    // --- to-dos
    [[nodiscard]] int getTodoId(const std::string& uri, int* todoId);
    [[nodiscard]] int getTodoUri(int todoId, std::string* uri);
    [[nodiscard]] int getTodoEtag(const std::string& uri, std::string* etag);
    [[nodiscard]] int getTodoVersion(int todoId, int* version);
    // Always -1: to-dos have no instances, and their table no such columns.
    [[nodiscard]] int getTodo(int originalTodoId, const std::string& recurrenceId, CalTodoMetaData* row);
    [[nodiscard]] int getTodo(int todoId, CalTodoMetaData* row);
    [[nodiscard]] int getTodo(const std::string& uri, CalTodoMetaData* row);
    [[nodiscard]] int getAllDeletedTodoIds(const std::string& listUri, std::list<int>* todoIds);
    [[nodiscard]] int getAllDirtyTodoIds(const std::string& listUri, std::list<int>* todoIds);
    [[nodiscard]] int getAllTodoUri(const std::string& listUri, std::list<std::string>* uris);
    [[nodiscard]] int insertTodo(const CalTodoMetaData& row);
    [[nodiscard]] int updateTodo(const CalTodoMetaData& row);
    [[nodiscard]] int updateTodoDirty(int todoId, int dirty);
    [[nodiscard]] int updateTodoDeleted(int todoId, int deleted);
    [[nodiscard]] int deleteTodo(const std::string& uri);

    // --- task lists
    [[nodiscard]] int getTodobookId(const std::string& uri, int* calendarId);
    [[nodiscard]] int getTodobookUri(int calendarId, std::string* uri) {
        return mBooks.getUri(calendarId, uri);
    }
    [[nodiscard]] int getTodobook(int calendarId, CalBookMetaData* row) {
        return mBooks.get(calendarId, row);
    }
    [[nodiscard]] int getTodobook(const std::string& uri, CalBookMetaData* row) {
        return mBooks.getByUri(uri, row);
    }
    [[nodiscard]] int getTodobookVersion(int calendarId, int* version) {
        return mBooks.getVersion(calendarId, version);
    }
    [[nodiscard]] int getTodobookEtag(const std::string& uri, std::string* etag);
    [[nodiscard]] int getAllAccountIds(std::list<int>* accountIds) {
        return mBooks.getAccountIds(accountIds);
    }
    [[nodiscard]] int getAllDeletedTodobookIds(int accountId, std::list<int>* ids) {
        return mBooks.getDeletedIds(accountId, ids);
    }
    [[nodiscard]] int getAllDirtyTodobookIds(int accountId, std::list<int>* ids) {
        return mBooks.getDirtyIds(accountId, ids);
    }
    [[nodiscard]] int getAllTodobookIds(int accountId, std::list<int>* ids) {
        return mBooks.getIds(accountId, ids);
    }
    [[nodiscard]] int getTodobookIds(int accountId, std::list<int>* ids) {
        return mBooks.getIds(accountId, ids);
    }
    [[nodiscard]] int getAllTodobookUri(int accountId, std::list<std::string>* uris) {
        return mBooks.getUris(accountId, uris);
    }
    [[nodiscard]] int insertTodobook(const CalBookMetaData& row) { return mBooks.insert(row); }
    [[nodiscard]] int updateTodobook(const CalBookMetaData& row) { return mBooks.update(row); }
    [[nodiscard]] int updateTodobookVersion(int calendarId, int version) {
        return mBooks.updateVersion(calendarId, version);
    }
    [[nodiscard]] int updateTodobookDirty(int calendarId, int dirty) {
        return mBooks.updateDirty(calendarId, dirty);
    }
    [[nodiscard]] int updateTodobookDeleted(int calendarId, int deleted) {
        return mBooks.updateDeleted(calendarId, deleted);
    }
    [[nodiscard]] int deleteTodobook(int calendarId) { return mBooks.remove(calendarId); }
    [[nodiscard]] int deleteTodobook(const std::string& uri) { return mBooks.removeByUri(uri); }

    // --- CalItemStore
    [[nodiscard]] int getAllItems(int calendarId, std::vector<CalEventMetaData>* rows) override;
    [[nodiscard]] int getItem(int itemId, CalEventMetaData* row) override;
    [[nodiscard]] int insertItem(const CalEventMetaData& row) override;
    [[nodiscard]] int updateItem(const CalEventMetaData& row) override;
    [[nodiscard]] int deleteItem(int calendarId, const std::string& uri) override;
    [[nodiscard]] int forgetItem(int itemId) override;
    [[nodiscard]] int markDirty(int itemId, int dirty) override { return updateTodoDirty(itemId, dirty); }
    [[nodiscard]] int markDeleted(int itemId, int deleted) override {
        return updateTodoDeleted(itemId, deleted);
    }
    [[nodiscard]] int countPending(int accountId, int* dirty, int* deleted) override {
        return mBooks.countPending("todosync_table", accountId, dirty, deleted);
    }
    [[nodiscard]] CalBookRows& books() override { return mBooks; }
    SyncDatabase& database() override { return mDatabase; }

private:
    SyncDatabase mDatabase;
    CalBookRows mBooks;
};
