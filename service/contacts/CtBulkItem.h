// BulkItem: one server entry on its way into the device's address book.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "contacts/CtEntryInfo.h"
#include "contacts/CtMetaData.h"
#include "contacts/CtStagedPhoto.h"
#include "platform/record_types.h"

// What becomes of the metadata row once the record is written.
enum class CtRowWrite { kInsert, kUpdate };

struct BulkItem {
    std::shared_ptr<ContactInfo> entry;
    std::string profile;                   // of the person's public profile, empty when there is none
    std::unique_ptr<CtStagedPhoto> photo;  // downloaded for this write, NULL when there is none
    bool keepsImage = false;               // without a photo: the image on the device stays
    bool isForPhoto = false;               // nothing but the photo is missing
    CtContactSyncRow row;                  // as it is to be stored; contact_id 0 for a new contact
    CtRowWrite rowWrite = CtRowWrite::kInsert;
    int lostId = 0;                     // the record of an older row of this entry, which goes
    int expectedVersion = kAnyVersion;  // of a known contact
};

// A row that changes although no record is written.
struct CtRowChange {
    CtContactSyncRow row;
    CtRowWrite rowWrite = CtRowWrite::kUpdate;
};

// What one page of the feed writes: one transaction in each store.
struct CtContactBatch {
    std::vector<BulkItem> inserts;
    std::vector<BulkItem> updates;
    std::vector<CtRowChange> rows;
    [[nodiscard]] bool empty() const { return inserts.empty() && updates.empty() && rows.empty(); }
};

// One group of the feed.
struct CtGroupItem {
    std::shared_ptr<GroupInfo> entry;
    CtGroupSyncRow row;  // as it is to be stored; group_id 0 for a new group
    CtRowWrite rowWrite = CtRowWrite::kInsert;
    int lostId = 0;
    int expectedVersion = kAnyVersion;
    bool isRowOnly = false;
};
