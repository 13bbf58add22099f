// CalJsonParser: reads the replies of the calendar and tasks services into list entries, page tokens, error codes and
// calendar records.
// Owner: a request task or a data manager call.   Threads: one at a time.
// Errors: SyncResult.h codes, each failure logged with its own text; outputs untouched on failure. A reply is read
// once: setString() parses, the operations read the parsed document.
#pragma once

#include <string>
#include <string_view>

#include "calendar/CalListInfo.h"
#include "platform/calendar.h"

class CalJsonParser {
public:
    // Parses a reply body. -1 when it is no JSON (logged "load fail") or nested too deeply.
    [[nodiscard]] int setString(std::string_view body);

    // The code of the document's "error" object ("Has error return" is logged), 0 when there is none.
    [[nodiscard]] int checkData() const;

    [[nodiscard]] int getAccessToken(std::string* token) const;
    [[nodiscard]] int getEtagUri(std::string* etag, std::string* uri) const;
    [[nodiscard]] int getBookList(CalListPage* page) const;
    [[nodiscard]] int getEventList(CalListPage* page) const;
    [[nodiscard]] int getEventListPage(CalListPage* page) const;
    [[nodiscard]] int getEventAllPage(CalListPage* page) const;  // entries carry their JSON
    [[nodiscard]] int getTodoBookList(CalListPage* page) const;
    [[nodiscard]] int getTodoListPage(CalListPage* page) const;

    // One event as a new event record. The record's uid is the event's id, its SYNC_DATA2 the event's etag.
    [[nodiscard]] static int convertEvent(JsonObject* event, CalendarRecord* out);
    // One task as a new to-do record, marked like the event's.
    [[nodiscard]] static int convertTodo(JsonObject* task, CalendarRecord* out);
    // -1 ("checkException fail" at the caller) when "originalStartTime" is there but cannot be read.
    [[nodiscard]] static int checkException(JsonObject* event, ExceptionInfo* out);

    // The document's object, or NULL. It ends with the parser.
    [[nodiscard]] JsonObject* root() const;
    // The document, to be kept.
    [[nodiscard]] JsonNodePtr takeRoot() { return std::move(mpRoot); }
    [[nodiscard]] JsonNodePtr copyRoot() const { return JsonNodePtr(json_node_ref(mpRoot.get())); }

private:
    JsonNodePtr mpRoot;
};

// The object inside a node, or NULL when it is none.
JsonObject* jsonObjectOf(const JsonNodePtr& node);
