// The rows of the calendar sync metadata store, in column order.
#pragma once

#include <string>

// A calendar, or a task list, of an account that the sync mirrors.
struct CalBookMetaData {
    int id = 0;
    int calendar_id = 0;  // the platform's book
    int account_id = 0;
    int sync_version = 0;  // store version up to which local changes have been examined; moves forward only
    int dirty = 0;
    int deleted = 0;
    std::string uri;  // the server's calendar id
    std::string etag;
};

// An event, or an instance of a series (original_event_id is then the series). A cancelled instance has no record: its
// event_id is minus the series' event id, and it is addressed by (original_event_id, recurrence_id) only.
struct CalEventMetaData {
    int id = 0;
    int event_id = 0;
    int calendar_id = 0;
    int version = 0;  // change version of the record as last written or seen by the engine
    int dirty = 0;    // set by change detection, cleared when the server took the change
    int deleted = 0;  // likewise for a local deletion
    int original_event_id = 0;
    int exception_type = 0;  // 0 ordinary, 1 an exception found locally
    int sequence = 0;
    std::string recurrence_id;
    std::string uri;   // the server's event id; empty until uploaded or downloaded
    std::string etag;  // without a uri: a SentMark or empty
};

// A to-do.
struct CalTodoMetaData {
    int id = 0;
    int todo_id = 0;
    int calendar_id = 0;
    int version = 0;
    int dirty = 0;
    int deleted = 0;
    std::string uri;   // as of the event
    std::string etag;  // likewise
};

// Addresses the row of one instance of a series.
struct CalInstanceKey {
    int original_event_id = 0;
    std::string recurrence_id;
};
