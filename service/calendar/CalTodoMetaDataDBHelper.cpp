#include "calendar/CalTodoMetaDataDBHelper.h"

#include "common/RowRead.h"
#include "common/SyncLog.h"

using row_read::readList;
using row_read::readOne;
using sync_result::kOk;
using Row = SyncDatabase::Row;

namespace {

constexpr const char* kPath = "/opt/usr/dbspace/.vantor_pim_sync_todo.db";

constexpr const char* kSchema[] = {
    "CREATE TABLE todobooksync_table(id INTEGER PRIMARY KEY AUTOINCREMENT, calendar_id INTEGER UNIQUE, "
    "account_id INTEGER, sync_version INTEGER, dirty INTEGER, deleted INTEGER, uri TEXT, etag TEXT );",
    "CREATE TABLE todosync_table(id INTEGER PRIMARY KEY AUTOINCREMENT, todo_id INTEGER, calendar_id INTEGER, "
    "version INTEGER, dirty INTEGER, deleted INTEGER, uri TEXT, etag TEXT );",
    "CREATE TRIGGER trg_cal_del AFTER DELETE ON todobooksync_table BEGIN   DELETE FROM todosync_table WHERE "
    "calendar_id = old.calendar_id; END;",
    // Ours, as in the calendar's store.
    "CREATE INDEX ts_idx1 ON todosync_table(calendar_id);CREATE INDEX ts_idx2 ON todosync_table(todo_id);",
};

// Columns of the whole-row reads, in table order.
enum TodoColumn { kId, kTodoId, kCalendarId, kVersion, kDirty, kDeleted, kUri, kEtag };

CalEventMetaData itemOf(const CalTodoMetaData& row) {
    CalEventMetaData item;
    item.id = row.id;
    item.event_id = row.todo_id;
    item.calendar_id = row.calendar_id;
    item.version = row.version;
    item.dirty = row.dirty;
    item.deleted = row.deleted;
    item.uri = row.uri;
    item.etag = row.etag;
    return item;
}

CalTodoMetaData todoOf(const CalEventMetaData& row) {
    return {.id = row.id,
            .todo_id = row.event_id,
            .calendar_id = row.calendar_id,
            .version = row.version,
            .dirty = row.dirty,
            .deleted = row.deleted,
            .uri = row.uri,
            .etag = row.etag};
}

}  // namespace

static void take(const Row& row, CalTodoMetaData* todo) {
    todo->id = row.integer(kId);
    todo->todo_id = row.integer(kTodoId);
    todo->calendar_id = row.integer(kCalendarId);
    todo->version = row.integer(kVersion);
    todo->dirty = row.integer(kDirty);
    todo->deleted = row.integer(kDeleted);
    todo->uri = row.text(kUri);
    todo->etag = row.text(kEtag);
}

CalTodoMetaDataDBHelper::CalTodoMetaDataDBHelper()
    : mDatabase(kPath, kSchema), mBooks(&mDatabase, "todobooksync_table") {}

// --- to-dos

int CalTodoMetaDataDBHelper::getTodoId(const std::string& uri, int* todoId) {
    return readOne(mDatabase, "SELECT todo_id FROM todosync_table where uri =?", {uri}, todoId);
}

int CalTodoMetaDataDBHelper::getTodoUri(int todoId, std::string* uri) {
    return readOne(mDatabase, "SELECT uri FROM todosync_table where todo_id =?", {todoId}, uri);
}

int CalTodoMetaDataDBHelper::getTodoEtag(const std::string& uri, std::string* etag) {
    return readOne(mDatabase, "SELECT etag FROM todosync_table where uri =?", {uri}, etag);
}

int CalTodoMetaDataDBHelper::getTodoVersion(int todoId, int* version) {
    return readOne(mDatabase, "SELECT version FROM todosync_table where todo_id =?", {todoId}, version);
}

int CalTodoMetaDataDBHelper::getTodo(int originalTodoId, const std::string& recurrenceId,
                                     CalTodoMetaData* row) {
    return readOne(mDatabase, "SELECT * FROM todosync_table where original_todo_id =? AND recurrence_id = ?",
                   {originalTodoId, recurrenceId}, row);
}

int CalTodoMetaDataDBHelper::getTodo(int todoId, CalTodoMetaData* row) {
    return readOne(mDatabase, "SELECT * FROM todosync_table where todo_id =?", {todoId}, row);
}

int CalTodoMetaDataDBHelper::getTodo(const std::string& uri, CalTodoMetaData* row) {
    return readOne(mDatabase, "SELECT * FROM todosync_table where uri =?", {uri}, row);
}

int CalTodoMetaDataDBHelper::getAllDeletedTodoIds(const std::string& listUri, std::list<int>* todoIds) {
    return readList(
        mDatabase,
        "SELECT A.todo_id FROM todosync_table as A INNER JOIN todobooksync_table B ON A.calendar_id = "
        "B.calendar_id where B.uri =? AND A.deleted=1",
        {listUri}, todoIds);
}

int CalTodoMetaDataDBHelper::getAllDirtyTodoIds(const std::string& listUri, std::list<int>* todoIds) {
    return readList(
        mDatabase,
        "SELECT A.todo_id FROM todosync_table as A INNER JOIN todobooksync_table B ON A.calendar_id = "
        "B.calendar_id where B.uri =? AND A.dirty=1",
        {listUri}, todoIds);
}

int CalTodoMetaDataDBHelper::getAllTodoUri(const std::string& listUri, std::list<std::string>* uris) {
    return readList(
        mDatabase,
        "SELECT A.uri FROM todosync_table as A INNER JOIN todobooksync_table B ON A.calendar_id = "
        "B.calendar_id where B.uri =? ",
        {listUri}, uris);
}

int CalTodoMetaDataDBHelper::insertTodo(const CalTodoMetaData& row) {
    return mDatabase.write(
        "INSERT INTO todosync_table(todo_id, calendar_id, version, dirty, deleted, uri, etag) VALUES(?, ?, "
        "?, ?, ?, "
        "?, ?)",
        {row.todo_id, row.calendar_id, row.version, row.dirty, row.deleted, row.uri, row.etag});
}

int CalTodoMetaDataDBHelper::updateTodo(const CalTodoMetaData& row) {
    return mDatabase.write(
        "UPDATE todosync_table SET todo_id=?, calendar_id=?, version=?, dirty=?, deleted=?, uri=?, etag=? "
        "WHERE "
        "todo_id=? ",
        {row.todo_id, row.calendar_id, row.version, row.dirty, row.deleted, row.uri, row.etag, row.todo_id});
}

int CalTodoMetaDataDBHelper::updateTodoDirty(int todoId, int dirty) {
    return mDatabase.write("UPDATE todosync_table SET dirty=? WHERE todo_id=?", {dirty, todoId});
}

int CalTodoMetaDataDBHelper::updateTodoDeleted(int todoId, int deleted) {
    return mDatabase.write("UPDATE todosync_table SET deleted=? WHERE todo_id=?", {deleted, todoId});
}

int CalTodoMetaDataDBHelper::deleteTodo(const std::string& uri) {
    return mDatabase.write("DELETE FROM todosync_table WHERE uri=?", {uri});
}

// --- task lists

int CalTodoMetaDataDBHelper::getTodobookId(const std::string& uri, int* calendarId) {
    return readOne(mDatabase, "SELECT calendar_id FROM todobooksync_table where uri =?", {uri}, calendarId);
}

int CalTodoMetaDataDBHelper::getTodobookEtag(const std::string& uri, std::string* etag) {
    return readOne(mDatabase, "SELECT etag FROM todobooksync_table where uri =?", {uri}, etag);
}

// --- CalItemStore

int CalTodoMetaDataDBHelper::getAllItems(int calendarId, std::vector<CalEventMetaData>* rows) {
    std::vector<CalTodoMetaData> found;
    const int result =
        readList(mDatabase, "SELECT * FROM todosync_table where calendar_id =?", {calendarId}, &found);
    for (const CalTodoMetaData& row : found) rows->push_back(itemOf(row));
    return result;
}

int CalTodoMetaDataDBHelper::getItem(int itemId, CalEventMetaData* row) {
    CalTodoMetaData found;
    const int result = getTodo(itemId, &found);
    if (result == kOk) *row = itemOf(found);
    return result;
}

int CalTodoMetaDataDBHelper::insertItem(const CalEventMetaData& row) {
    return insertTodo(todoOf(row));
}

int CalTodoMetaDataDBHelper::updateItem(const CalEventMetaData& row) {
    return updateTodo(todoOf(row));
}

int CalTodoMetaDataDBHelper::deleteItem(int calendarId, const std::string& uri) {
    return mDatabase.write("DELETE FROM todosync_table WHERE uri=? and calendar_id=?", {uri, calendarId});
}

int CalTodoMetaDataDBHelper::forgetItem(int itemId) {
    return mDatabase.write("DELETE FROM todosync_table WHERE todo_id=?", {itemId});
}
