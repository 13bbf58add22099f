// CalListInfo: one entry of a list page of the calendar or tasks service, held by shared pointer.
// The entry's JSON is kept parsed; its text is made only when it is asked for.
#pragma once

#include <json-glib/json-glib.h>

#include <memory>
#include <string>
#include <vector>

#include "common/Handles.h"

struct CalListInfo {
    std::string id;  // the server's id: "uri" in the metadata stores
    std::string etag;
    std::string summary;          // events and calendars: summary; task lists and tasks: title
    std::string backgroundColor;  // calendars only
    std::string accessRole;       // calendars only
    JsonNodePtr json;             // whole-page variant only: the entry as parsed

    // The entry's complete JSON text, empty when it was not kept.
    [[nodiscard]] std::string jsonText() const;
};

using CalListInfoPtr = std::shared_ptr<CalListInfo>;
using CalList = std::vector<CalListInfoPtr>;

// A page of a list.
struct CalListPage {
    CalList entries;                  // entries that can be compared: with id and etag
    std::vector<std::string> idOnly;  // ids listed without an etag: left as they are, but listed
    std::string nextPageToken;        // empty: the last page
    size_t unreadable = 0;            // items without an id, or that are no objects: the list proves nothing
};

// What checkException finds out about an event.
enum class ExceptionKind { kOrdinary = 0, kModified = 1, kCancelled = 2 };
struct ExceptionInfo {
    ExceptionKind kind = ExceptionKind::kOrdinary;
    std::string seriesUri;     // "recurringEventId"
    std::string recurrenceId;  // "20140501" or "20140501T100000Z"
    int sequence = 0;
};
