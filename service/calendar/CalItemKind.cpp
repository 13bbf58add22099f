#include "calendar/CalItemKind.h"

#include "calendar/CalJsonBuilder.h"
#include "calendar/CalJsonParser.h"
#include "calendar/CalMappings.h"
#include "common/SyncResult.h"
#include "platform/calendar_read.h"

using calendar_read::intOf;
using calendar_read::textOf;
using sync_result::kOk;

std::string CalItemKind::build(calendar_record_h record) const {
    CalJsonObject body;
    return compose(record, &body) == kOk ? body.getJsonString() : std::string();
}

// Through the record and back, so that defaults and spellings of the server do not matter.
std::string CalItemKind::comparable(JsonObject* item) const {
    CalendarRecord record;
    return convert(item, &record) == kOk ? comparableOfConverted(record.get()) : std::string();
}

std::string CalItemKind::comparableOfConverted(calendar_record_h record) const {
    CalJsonObject body;
    return composeComparable(record, &body) == kOk ? body.getJsonString() : std::string();
}

std::string CalItemKind::comparable(calendar_record_h record) const {
    CalJsonObject body;
    return compose(record, &body) == kOk ? comparable(body.object()) : std::string();
}

namespace {

constexpr unsigned kEventServerFields[] = {CALENDAR_EVENT_STATUS, CALENDAR_EVENT_ORGANIZER_NAME,
                                           CALENDAR_EVENT_ORGANIZER_EMAIL, CALENDAR_EVENT_MEETING_STATUS};
constexpr unsigned kTodoServerFields[] = {CALENDAR_TODO_COMPLETED_TIME, CALENDAR_TODO_SYNC_DATA1};

// A status or an organizer of the user's own stays.
bool takeEventFields(calendar_record_h server, calendar_record_h record) {
    const auto setInt = [&](unsigned property) {
        return calendar_record_set_int(record, property, intOf(server, property)) == PLATFORM_ERROR_NONE;
    };
    const auto setText = [&](unsigned property) {
        return calendar_record_set_str(record, property, textOf(server, property).c_str()) ==
               PLATFORM_ERROR_NONE;
    };
    if (intOf(record, CALENDAR_EVENT_STATUS) == cal_mapping::kStatusNone && !setInt(CALENDAR_EVENT_STATUS))
        return false;
    if (!textOf(record, CALENDAR_EVENT_ORGANIZER_EMAIL).empty()) return true;
    return setText(CALENDAR_EVENT_ORGANIZER_NAME) && setText(CALENDAR_EVENT_ORGANIZER_EMAIL) &&
           setInt(CALENDAR_EVENT_MEETING_STATUS);
}

bool takeTodoFields(calendar_record_h server, calendar_record_h record) {
    int64_t completed = 0;
    return calendar_record_get_lli(server, CALENDAR_TODO_COMPLETED_TIME, &completed) == PLATFORM_ERROR_NONE &&
           calendar_record_set_lli(record, CALENDAR_TODO_COMPLETED_TIME, completed) == PLATFORM_ERROR_NONE &&
           calendar_record_set_str(record, CALENDAR_TODO_SYNC_DATA1,
                                   textOf(server, CALENDAR_TODO_SYNC_DATA1).c_str()) == PLATFORM_ERROR_NONE;
}

}  // namespace

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
    .compose = cal_json::composeEvent,
    .composeComparable = cal_json::composeComparableEvent,
    .serverFields = kEventServerFields,
    .takeServerFields = takeEventFields,
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
    .compose = cal_json::composeTodo,
    .composeComparable = cal_json::composeTodo,
    .serverFields = kTodoServerFields,
    .takeServerFields = takeTodoFields,
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
