#include "calendar/CalTodoDataManager.h"

#include <algorithm>
#include <utility>

#include "calendar/CalItemWriter.h"
#include "calendar/CalJsonBuilder.h"
#include "common/SyncLog.h"
#include "platform/calendar_read.h"

using sync_result::kFailed;
using sync_result::kOk;

CalTodoDataManager& CalTodoDataManager::getInstance() {
    static CalTodoDataManager* const instance = new CalTodoDataManager;
    return *instance;
}

CalTodoDataManager::~CalTodoDataManager() {
    if (mpMetaData) calendar_db_remove_changed_cb(_calendar_todo, changedDBCallback, this);
}

int CalTodoDataManager::prepareSync() {
    const std::lock_guard lock(mPrepareMutex);
    if (mpMetaData) return kOk;
    if (calendar_db_add_changed_cb(_calendar_todo, changedDBCallback, this) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("add_changed_cb fail");
        return kFailed;
    }
    mpMetaData = std::make_unique<CalTodoMetaDataDBHelper>();
    if (mpMetaData->openDb() != kOk) SYNC_ERR("MetaDB fail, it is opened once it can be, ignoring");
    return kOk;
}

void CalTodoDataManager::changedDBCallback(const char* view, void* userData) {
    auto* self = static_cast<CalTodoDataManager*>(userData);
    if (self == nullptr || self->metaData() == nullptr) {
        SYNC_ERR("fail");
        return;
    }
    if (std::string_view(view) != _calendar_book) self->sendChanges();
}

// --- task lists

int CalTodoDataManager::updateTodobook(int accountId, const CalListInfoPtr& list) {
    return updateBooks(accountId, {list});
}

bool CalTodoDataManager::isBookChanged(int accountId, const CalListInfo& entry) {
    CalItemStore* store = prepared();
    int calendarId = 0;
    calendar_record_h raw = nullptr;
    if (store == nullptr || store->books().getId(accountId, entry.id, &calendarId) != kOk ||
        calendar_db_get_record(_calendar_book, calendarId, &raw) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("get fail");
        return true;
    }
    const CalendarRecord record(raw);
    return calendar_read::textOf(raw, CALENDAR_BOOK_NAME) != entry.summary;
}

int CalTodoDataManager::deleteBookRows(CalItemStore& store, int /*accountId*/,
                                       const std::vector<int>& calendarIds) {
    int result = kOk;
    for (const int calendarId : calendarIds) {
        if (store.books().remove(calendarId) == kOk) continue;
        SYNC_ERR("metaDB deletecalendarbook fail(%d)", calendarId);
        result = kFailed;
    }
    return result;
}

// --- to-dos

int CalTodoDataManager::writeTasks(int accountId, const std::string& listUri, const CalList& tasks,
                                   const char* failureText) {
    CalItemStore* store = prepared();
    CalBookMetaData book;
    CalBookSnapshot snapshot(kTodoKind);
    if (store == nullptr || store->books().get(accountId, listUri, &book) != kOk ||
        snapshot.load(*store, book) != kOk) {
        SYNC_ERR("get fail");
        return kFailed;
    }
    CalItemWriter writer(store, &snapshot);
    CalListPage page;
    page.entries = tasks;
    if (writer.writePage(page) == kOk) return kOk;
    SYNC_ERR("%s", failureText);
    return kFailed;
}

int CalTodoDataManager::insertTodo(int accountId, const std::string& listUri, const CalListInfoPtr& task) {
    return writeTasks(accountId, listUri, {task}, "get_records_with_query fail");
}

int CalTodoDataManager::updateTodo(int accountId, const std::string& listUri, const CalListInfoPtr& task) {
    CalTodoMetaData row;
    if (prepared() == nullptr || mpMetaData->getTodo(task->id, &row) != kOk) {
        SYNC_ERR("get fail");
        return kFailed;
    }
    return writeTasks(accountId, listUri, {task}, "convert fail");
}

int CalTodoDataManager::insertTodos(int accountId, const std::string& listUri, const CalList& tasks) {
    return writeTasks(accountId, listUri, tasks, "insert fail");
}

int CalTodoDataManager::updateTodos(int accountId, const std::string& listUri, const CalList& tasks) {
    return writeTasks(accountId, listUri, tasks, "insert fail");
}

int CalTodoDataManager::deleteTodo(int calendarId, const std::string& uri) {
    return deleteTodos(calendarId, {uri});
}

int CalTodoDataManager::deleteTodos(int calendarId, const std::list<std::string>& uris) {
    CalItemStore* store = prepared();
    std::vector<CalEventMetaData> rows;
    if (store == nullptr || store->getAllItems(calendarId, &rows) != kOk) return kFailed;
    std::vector<int> ids;
    for (const CalEventMetaData& row : rows) {
        if (std::find(uris.begin(), uris.end(), row.uri) != uris.end()) ids.push_back(row.event_id);
    }
    if (ids.size() != uris.size()) {
        SYNC_ERR("get fail");
        return kFailed;
    }
    std::vector<size_t> gone;
    const record_write_options_s options{.by_sync = true, .skipped = &gone};
    if (calendar_db_delete_records(_calendar_todo, ids.data(), ids.size(), options) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("db_delete_records fail");
        return kFailed;
    }
    int result = kOk;
    for (const std::string& uri : uris) {
        if (store->deleteItem(calendarId, uri) == kOk) continue;
        SYNC_ERR("metaDB deleteTodo fail");
        result = kFailed;
    }
    return result;
}

int CalTodoDataManager::getTodo(int todoId, std::string* json) {
    CalendarRecord record;
    if (getRecord(todoId, &record) != kOk) return kFailed;
    *json = kTodoKind.build(record.get());
    return json->empty() ? kFailed : kOk;
}

int CalTodoDataManager::getTodo(const std::string& uri, std::string* json) {
    int todoId = 0;
    return getTodoId(uri, &todoId) == kOk ? getTodo(todoId, json) : kFailed;
}

int CalTodoDataManager::updateTodoUri(int todoId, const std::string& uri, const std::string& etag) {
    if (prepared() == nullptr) return kFailed;
    SyncTransaction transaction(mpMetaData->database());
    CalTodoMetaData row;
    if (!transaction.begun() || mpMetaData->getTodo(todoId, &row) != kOk) return kFailed;
    row.uri = uri;
    row.etag = etag;
    if (mpMetaData->updateTodo(row) != kOk) {
        SYNC_ERR("metaDB updateTodo fail");
        return kFailed;
    }
    return transaction.commit();
}

int CalTodoDataManager::updateTodoEtag(int todoId, const std::string& etag) {
    std::string uri;
    return getTodoUri(todoId, &uri) == kOk ? updateTodoUri(todoId, uri, etag) : kFailed;
}

// --- forwards to the metadata store

template <class... Params, class... Args>
int CalTodoDataManager::forward(const char* operation, int (CalTodoMetaDataDBHelper::*call)(Params...),
                                Args&&... args) {
    if (prepared() == nullptr) return kFailed;
    const int result = (*mpMetaData.*call)(std::forward<Args>(args)...);
    if (result != kOk) SYNC_ERR_AS(operation, "metaDB %s fail", operation);
    return result;
}

int CalTodoDataManager::updateTodobookUri(int calendarId, const std::string& uri, const std::string& etag) {
    CalItemStore* store = prepared();
    if (store == nullptr) return kFailed;
    const int result = store->books().updateUri(calendarId, uri, etag);
    if (result != kOk) SYNC_ERR("metaDB updatecalendarbook fail");
    return result;
}
int CalTodoDataManager::getTodobookId(const std::string& uri, int* calendarId) {
    return forward("getTodobookId", &CalTodoMetaDataDBHelper::getTodobookId, uri, calendarId);
}
int CalTodoDataManager::getTodobookUri(int calendarId, std::string* uri) {
    return forward("getTodobookUri", &CalTodoMetaDataDBHelper::getTodobookUri, calendarId, uri);
}
int CalTodoDataManager::getTodobookEtag(const std::string& uri, std::string* etag) {
    return forward("getTodobookEtag", &CalTodoMetaDataDBHelper::getTodobookEtag, uri, etag);
}
int CalTodoDataManager::getAllTodobookIds(int accountId, std::list<int>* calendarIds) {
    return forward("getAllTodobookIds", &CalTodoMetaDataDBHelper::getAllTodobookIds, accountId, calendarIds);
}
int CalTodoDataManager::getAllTodobookUri(int accountId, std::list<std::string>* uris) {
    return forward("getAllTodobookUri", &CalTodoMetaDataDBHelper::getAllTodobookUri, accountId, uris);
}
int CalTodoDataManager::getAllDirtyTodobookIds(int accountId, std::list<int>* calendarIds) {
    return forward("getAllDirtyTodobookIds", &CalTodoMetaDataDBHelper::getAllDirtyTodobookIds, accountId,
                   calendarIds);
}
int CalTodoDataManager::getAllDeletedTodobookIds(int accountId, std::list<int>* calendarIds) {
    return forward("getAllDeletedTodobookIds", &CalTodoMetaDataDBHelper::getAllDeletedTodobookIds, accountId,
                   calendarIds);
}
int CalTodoDataManager::clearDirtyTodobook(int calendarId) {
    return forward("clearDirtyTodobook", &CalTodoMetaDataDBHelper::updateTodobookDirty, calendarId, 0);
}
int CalTodoDataManager::clearDeletedTodobook(int calendarId) {
    return forward("clearDeletedTodobook", &CalTodoMetaDataDBHelper::updateTodobookDeleted, calendarId, 0);
}
int CalTodoDataManager::getTodoId(const std::string& uri, int* todoId) {
    return forward("getTodoId", &CalTodoMetaDataDBHelper::getTodoId, uri, todoId);
}
int CalTodoDataManager::getTodoUri(int todoId, std::string* uri) {
    return forward("getTodoUri", &CalTodoMetaDataDBHelper::getTodoUri, todoId, uri);
}
int CalTodoDataManager::getTodoEtag(const std::string& uri, std::string* etag) {
    return forward("getEvetEtag", &CalTodoMetaDataDBHelper::getTodoEtag, uri, etag);
}
int CalTodoDataManager::getAllTodoUri(const std::string& listUri, std::list<std::string>* uris) {
    return forward("getAllTodoUri", &CalTodoMetaDataDBHelper::getAllTodoUri, listUri, uris);
}
int CalTodoDataManager::getAllDirtyTodoIds(const std::string& listUri, std::list<int>* todoIds) {
    return forward("getAllDirtyTodoIds", &CalTodoMetaDataDBHelper::getAllDirtyTodoIds, listUri, todoIds);
}
int CalTodoDataManager::getAllDeletedTodoIds(const std::string& listUri, std::list<int>* todoIds) {
    return forward("getAllDeletedTodoIds", &CalTodoMetaDataDBHelper::getAllDeletedTodoIds, listUri, todoIds);
}
int CalTodoDataManager::clearDirtyTodo(int todoId) {
    return forward("clearDirtyTodo", &CalTodoMetaDataDBHelper::updateTodoDirty, todoId, 0);
}
int CalTodoDataManager::clearDeletedTodo(int todoId) {
    return forward("clearDeletedTodo", &CalTodoMetaDataDBHelper::updateTodoDeleted, todoId, 0);
}
