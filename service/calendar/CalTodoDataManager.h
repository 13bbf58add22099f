// CalTodoDataManager: the task-side twin of CalDataManager: the provider's task lists and tasks in the device's calendar service as
// to-do books and to-dos, their metadata store, and the detection of local changes.
// Owner, threads, errors and the order of writes are those of CalDataManager. The calendar service is connected by that one.
#pragma once

#include <list>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "calendar/CalListInfo.h"
#include "calendar/CalManager.h"
#include "calendar/CalTodoMetaDataDBHelper.h"
#include "platform/calendar.h"

class CalTodoDataManager : public CalManager {
public:
    static CalTodoDataManager& getInstance();

    CalTodoDataManager() : CalManager(kTodoKind) {}
    ~CalTodoDataManager() override;

    // Registers the change callback and makes the metadata store. Later calls return at once.
    [[nodiscard]] int prepareSync();

    // --- task lists
    [[nodiscard]] int insertTodobook(int accountId, const CalListInfo& list) {
        return insertBook(accountId, list);
    }
    [[nodiscard]] int updateTodobook(int accountId, const CalListInfoPtr& list);
    [[nodiscard]] int updateTodobookUri(int calendarId, const std::string& uri, const std::string& etag);
    [[nodiscard]] int deleteTodobook(int accountId, const std::string& uri) {
        return deleteBook(accountId, uri);
    }
    [[nodiscard]] int getTodobookId(const std::string& uri, int* calendarId);
    [[nodiscard]] int getTodobookUri(int calendarId, std::string* uri);
    [[nodiscard]] int getTodobookEtag(const std::string& uri, std::string* etag);
    [[nodiscard]] int getAllTodobookIds(int accountId, std::list<int>* calendarIds);
    [[nodiscard]] int getAllTodobookUri(int accountId, std::list<std::string>* uris);
    [[nodiscard]] int getAllDirtyTodobookIds(int accountId, std::list<int>* calendarIds);
    [[nodiscard]] int getAllDeletedTodobookIds(int accountId, std::list<int>* calendarIds);
    [[nodiscard]] int clearDirtyTodobook(int calendarId);
    [[nodiscard]] int clearDeletedTodobook(int calendarId);
    // By title: the lists come without etags.
    [[nodiscard]] bool isBookChanged(int accountId, const CalListInfo& entry) override;

    // --- to-dos; the tasks carry their JSON
    [[nodiscard]] int insertTodo(int accountId, const std::string& listUri, const CalListInfoPtr& task);
    [[nodiscard]] int updateTodo(int accountId, const std::string& listUri, const CalListInfoPtr& task);
    [[nodiscard]] int insertTodos(int accountId, const std::string& listUri, const CalList& tasks);
    [[nodiscard]] int updateTodos(int accountId, const std::string& listUri, const CalList& tasks);
    [[nodiscard]] int deleteTodo(int calendarId, const std::string& uri);
    [[nodiscard]] int deleteTodos(int calendarId, const std::list<std::string>& uris);
    // A to-do as the body that would be sent for it.
    [[nodiscard]] int getTodo(int todoId, std::string* json);
    [[nodiscard]] int getTodo(const std::string& uri, std::string* json);
    [[nodiscard]] int getTodoId(const std::string& uri, int* todoId);
    [[nodiscard]] int getTodoUri(int todoId, std::string* uri);
    [[nodiscard]] int getTodoEtag(const std::string& uri, std::string* etag);
    [[nodiscard]] int getAllTodoUri(const std::string& listUri, std::list<std::string>* uris);
    [[nodiscard]] int getAllDirtyTodoIds(const std::string& listUri, std::list<int>* todoIds);
    [[nodiscard]] int getAllDeletedTodoIds(const std::string& listUri, std::list<int>* todoIds);
    [[nodiscard]] int clearDirtyTodo(int todoId);
    [[nodiscard]] int clearDeletedTodo(int todoId);
    [[nodiscard]] int updateTodoEtag(int todoId, const std::string& etag);
    [[nodiscard]] int updateTodoUri(int todoId, const std::string& uri, const std::string& etag);

    // --- local changes
    [[nodiscard]] int setTodobookChanged(int calendarId) { return setBookChanged(calendarId); }
    static void changedDBCallback(const char* view, void* userData);

    [[nodiscard]] CalTodoMetaDataDBHelper* metaData() { return mpMetaData.get(); }

protected:
    CalItemStore* prepareStore() override {
        return prepareSync() == sync_result::kOk ? mpMetaData.get() : nullptr;
    }
    int deleteBookRows(CalItemStore& store, int accountId, const std::vector<int>& calendarIds) override;

private:
    // Forwards to the store; a failure is logged as "metaDB OPERATION fail".
    template <class... Params, class... Args>
    int forward(const char* operation, int (CalTodoMetaDataDBHelper::*call)(Params...), Args&&... args);
    // Writes tasks of one list as a page of their own.
    [[nodiscard]] int writeTasks(int accountId, const std::string& listUri, const CalList& tasks,
                                 const char* failureText);

    std::mutex mPrepareMutex;
    std::unique_ptr<CalTodoMetaDataDBHelper> mpMetaData;  // set once under mPrepareMutex, then constant
};
