#include "calendar/CalItemKind.h"

#include "calendar/CalJsonBuilder.h"
#include "calendar/CalJsonParser.h"
#include "common/SyncResult.h"

// Through the record and back, so that defaults and spellings of the server do not matter.
std::string CalItemKind::comparable(JsonObject* item) const {
    CalendarRecord record;
    return convert(item, &record) == sync_result::kOk ? buildComparable(record.get()) : std::string();
}

std::string CalItemKind::comparable(calendar_record_h record) const {
    CalJsonParser parser;
    const std::string body = build(record);
    return !body.empty() && parser.setString(body) == sync_result::kOk ? comparable(parser.root())
                                                                       : std::string();
}

const CalItemKind kEventKind = {
    .itemName = "event",
    .bookName = "calendar",
    .view = _calendar_event,
    .storeType = 1,
    .id = CALENDAR_EVENT_ID,
    .bookId = CALENDAR_EVENT_BOOK_ID,
    .uid = CALENDAR_EVENT_UID,
    .etag = CALENDAR_EVENT_SYNC_DATA2,
    .version = CALENDAR_EVENT_VERSION,
    .ownVersion = CALENDAR_EVENT_OWN_VERSION,
    .syncedVersion = CALENDAR_EVENT_SYNCED_VERSION,
    .seriesId = CALENDAR_EVENT_ORIGINAL_EVENT_ID,
    .recurrenceId = CALENDAR_EVENT_RECURRENCE_ID,
    .convert = CalJsonParser::convertEvent,
    .build = cal_json::eventBody,
    .buildComparable = cal_json::comparableEventBody,
    .texts = {.notJson = "This is not event json",
              .insertItems = "insertEvents fail",
              .updateItems = "updateEvents fail",
              .insertRow = "metaDB insertEvent fail",
              .updateRow = "metaDB updateEvent fail",
              .deleteRow = "metaDB deleteEvent fail",
              .insertBookRecord = "db_insert_record fail",
              .deleteBookRow = "metaDB deleteAccount fail",
              .bookIds = "getCalendarbookIds fail",
              .bookChanged = "setCalendarbookChanged fail"},
};

const CalItemKind kTodoKind = {
    .itemName = "task",
    .bookName = "task list",
    .view = _calendar_todo,
    .storeType = 2,
    .id = CALENDAR_TODO_ID,
    .bookId = CALENDAR_TODO_BOOK_ID,
    .uid = CALENDAR_TODO_UID,
    .etag = CALENDAR_TODO_SYNC_DATA2,
    .version = CALENDAR_TODO_VERSION,
    .ownVersion = CALENDAR_TODO_VERSION,
    .syncedVersion = CALENDAR_TODO_SYNCED_VERSION,
    .seriesId = 0,
    .recurrenceId = 0,
    .convert = CalJsonParser::convertTodo,
    .build = cal_json::todoBody,
    .buildComparable = cal_json::todoBody,
    .texts = {.notJson = "checkException fail",
              .insertItems = "insert fail",
              .updateItems = "insert fail",
              .insertRow = "metaDB insertTodo fail",
              .updateRow = "metaDB updateTodo fail",
              .deleteRow = "metaDB deleteTodo fail",
              .insertBookRecord = "get_records_with_query fail",
              .deleteBookRow = "metaDB deletecalendarbook fail",
              .bookIds = "getTodobookIds fail",
              .bookChanged = "setTodobookChanged fail"},
};
