// CalItemKind: what tells events from to-dos. Everything that compares, writes, walks and sends items is written once over it.
#pragma once

#include <json-glib/json-glib.h>

#include <span>
#include <string>

#include "calendar/CalJsonObject.h"
#include "platform/calendar.h"

struct CalItemKind {
    const char* itemName;  // for the log
    const char* bookName;
    const char* view;
    int storeType;  // of its books

    // Properties; 0: the view has none.
    unsigned id;
    unsigned bookId;
    unsigned uid;
    unsigned etag;
    unsigned version;
    unsigned ownVersion;
    unsigned syncedVersion;
    unsigned seriesId;
    unsigned recurrenceId;

    // The server's JSON as a new record, and a record as the body of a request; 0 or -1.
    int (*convert)(JsonObject* json, CalendarRecord* out);
    int (*compose)(calendar_record_h record, CalJsonObject* body);
    // Without what servers fill in on their own.
    int (*composeComparable)(calendar_record_h record, CalJsonObject* body);

    // What is not sent, or what the server fills in; read from its answer to an upload. False when a value cannot be set.
    std::span<const unsigned> serverFields;
    bool (*takeServerFields)(calendar_record_h server, calendar_record_h record);

    // What is logged when something fails.
    struct Texts {
        const char* notJson;
        const char* insertItems;
        const char* updateItems;
        const char* insertRow;
        const char* updateRow;
        const char* deleteRow;
        const char* insertBookRecord;
        const char* deleteBookRow;
        const char* bookIds;
        const char* bookChanged;
    } texts;

    [[nodiscard]] bool hasSeries() const { return seriesId != 0; }

    // A record as the text of a body; empty when it cannot be written.
    [[nodiscard]] std::string build(calendar_record_h record) const;
    // What both sides can say of an item, as text: equal when the device's record and the server's item say the same. Empty when
    // the item cannot be converted.
    [[nodiscard]] std::string comparable(calendar_record_h record) const;
    [[nodiscard]] std::string comparable(JsonObject* item) const;
    // The same of a record that was just made of a server's item; it may lose what is not compared.
    [[nodiscard]] std::string comparableOfConverted(calendar_record_h record) const;
};

extern const CalItemKind kEventKind;
extern const CalItemKind kTodoKind;
