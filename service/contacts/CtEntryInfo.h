// What a feed page says of its entries, held by shared pointer. The entry's JSON is kept parsed; its text is made when it is asked for.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "common/Handles.h"

struct CtEntryInfo {
    std::string id;  // the base id: "uri" in the metadata store
    std::string etag;
    std::string updated;  // ISO 8601 UTC
    std::string title;
    std::string editId;
    bool isDeleted = false;
    JsonNodePtr json;

    [[nodiscard]] JsonObject* object() const;
    [[nodiscard]] std::string jsonText() const;
};

struct ContactInfo : CtEntryInfo {
    std::string photoHref;
    std::string photoEtag;               // empty: the contact has no photo
    std::vector<std::string> websites;   // hrefs, of which one may be a profile
    std::vector<std::string> groupUris;  // of its memberships
};

struct GroupInfo : CtEntryInfo {
    bool isSystem = false;  // the server defines it; nobody may change it
    std::string systemId;
};

template <class Info>
struct CtPage {
    std::vector<std::shared_ptr<Info>>
        entries;                      // entries that can be compared: with id and etag, or marked deleted
    std::vector<std::string> idOnly;  // ids listed without an etag: left as they are, but listed
    std::string nextPageToken;        // the URL of the next page, empty on the last
    size_t unreadable = 0;            // entries without an id: the list proves nothing
};
using CtContactPage = CtPage<ContactInfo>;
using CtGroupPage = CtPage<GroupInfo>;
