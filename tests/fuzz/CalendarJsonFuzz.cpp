// Replies of the calendar and tasks services, as far as the records and back to the bodies of uploads.
#include "calendar/CalItemKind.h"
#include "calendar/CalJsonBuilder.h"
#include "calendar/CalJsonParser.h"
#include "common/JsonText.h"
#include "common/SyncResult.h"
#include "fuzz/Fuzz.h"

using fuzz::require;
using sync_result::kOk;

namespace {

// What the device sends of a record is read to a record that is sent the same way. A first conversion may drop what the device has
// no room for, so it is the second that must change nothing.
void checkRoundTrip(JsonObject* item, const CalItemKind& kind) {
    CalendarRecord record;
    if (kind.convert(item, &record) != kOk) return;
    const std::string sent = kind.build(record.get());
    if (sent.empty()) return;
    const JsonNodePtr read = json_text::parse(sent);
    require(read != nullptr, "a body is JSON", sent);
    CalendarRecord again;
    require(kind.convert(jsonObjectOf(read), &again) == kOk, "a body can be read", sent);
    require(kind.build(again.get()) == sent, "a body is read to the same",
            sent + "\n" + kind.build(again.get()));
}

void checkItem(const CalListInfo& info) {
    require(!info.id.empty() && !info.etag.empty(), "what can be compared has id and etag");
    JsonObject* item = jsonObjectOf(info.json);
    require(item != nullptr, "an entry is an object");
    require(json_text::parse(info.jsonText()) != nullptr, "an entry's text is JSON", info.jsonText());
    checkRoundTrip(item, kEventKind);
    checkRoundTrip(item, kTodoKind);
    ExceptionInfo exception;
    CalendarRecord record;
    if (CalJsonParser::checkException(item, &exception) != kOk || exception.recurrenceId.empty() ||
        CalJsonParser::convertEvent(item, &record) != kOk ||
        calendar_record_set_str(record.get(), CALENDAR_EVENT_RECURRENCE_ID, exception.recurrenceId.c_str()) !=
            PLATFORM_ERROR_NONE) {
        return;
    }
    const std::string sent = cal_json::convertException2Json(record.get(), exception.seriesUri);
    const JsonNodePtr read = json_text::parse(sent);
    ExceptionInfo again;
    require(read != nullptr && CalJsonParser::checkException(jsonObjectOf(read), &again) == kOk,
            "an instance can be read", sent);
    require(again.recurrenceId == exception.recurrenceId, "an instance keeps its place", sent);
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    CalJsonParser parser;
    if (parser.setString(fuzz::textOf(data, size)) != kOk) return 0;
    (void)parser.checkData();
    CalListPage page;
    constexpr int (CalJsonParser::*kLists[])(CalListPage*)
        const = {&CalJsonParser::getBookList, &CalJsonParser::getEventList, &CalJsonParser::getEventListPage,
                 &CalJsonParser::getTodoBookList, &CalJsonParser::getTodoListPage};
    for (const auto list : kLists) (void)(parser.*list)(&page);
    if (parser.getEventAllPage(&page) != kOk) return 0;
    for (const CalListInfoPtr& info : page.entries) checkItem(*info);
    return 0;
}
