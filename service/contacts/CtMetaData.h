// The rows of the contacts sync metadata store.
#pragma once

#include <string>

struct CtContactSyncRow {
    int contact_id = 0;
    int addressbook_id = 0;
    int version = 0;  // change version of the record as last written or seen by the engine
    int dirty = 0;    // to be uploaded
    int image_dirty = 0;
    int deleted = 0;         // the deletion is to be sent
    std::string uri;         // the server's id of the entry; empty until uploaded or downloaded
    std::string etag;        // without a uri: a SentMark or empty
    std::string photo_etag;  // of the photo last downloaded or uploaded
    std::string updated;     // ISO 8601 UTC with milliseconds
};

struct CtGroupSyncRow {
    int group_id = 0;
    int addressbook_id = 0;
    int starred = 0;  // the group stands for the device's favourites
    int version = 0;
    int dirty = 0;
    int deleted = 0;
    std::string uri;   // as of the contact
    std::string etag;  // likewise
    std::string updated;
    std::string source;  // the server's text of the entry, written with the insert only
};
