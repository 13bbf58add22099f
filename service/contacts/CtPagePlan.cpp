#include "contacts/CtPagePlan.h"

#include "common/SentMark.h"
#include "common/SyncLog.h"
#include "platform/contacts_read.h"

namespace {

void markEdited(CtContactSyncRow* row) {
    row->image_dirty = 1;
}

void markEdited(CtGroupSyncRow* /*row*/) {}

// Where an entry stands between the server, the rows and the device.
enum class Standing {
    kNew,
    kSent,
    kEditedSent,
    kLost,
    kUnchanged,
    kChanged,
    kDeviceWins,
    kOrphan,
    kEditedOrphan
};

template <class Kind>
struct Finding {
    Standing standing = Standing::kNew;
    typename Kind::Row row;  // known, or begun
    int version = kAnyVersion;
};

template <class Kind>
Finding<Kind> find(const CtEntryInfo& entry, const CtSnapshot<Kind>& snapshot, CtSentRows<Kind>* sent,
                   const std::string& says) {
    Finding<Kind> finding;
    finding.row.addressbook_id = snapshot.addressBookId();
    if (const auto* row = snapshot.rowByUri(entry.id)) {
        finding.row = *row;
        const CtRecordState* state = snapshot.record(row->*Kind::kId);
        finding.version = state != nullptr ? state->version : kAnyVersion;
        if (snapshot.isLost(*row)) {
            finding.standing = Standing::kLost;
        } else if (row->etag == entry.etag) {
            finding.standing = Standing::kUnchanged;
        } else {
            finding.standing = snapshot.hasLocalChange(*row) ? Standing::kDeviceWins : Standing::kChanged;
        }
    } else if (const CtOrphan* orphan = snapshot.orphan(entry.id)) {
        const CtRecordState& state = *snapshot.record(orphan->id);
        finding.row.*Kind::kId = orphan->id;
        finding.row.version = state.isEnginesOwnWrite() ? state.version : state.syncedVersion;
        finding.version = state.version;
        finding.standing = state.isEnginesOwnWrite() ? Standing::kOrphan : Standing::kEditedOrphan;
    } else if (const auto known = sent->find(sent_mark::of(says)); !says.empty() && known != sent->end()) {
        finding.row = known->second.row;
        const CtRecordState* state = snapshot.record(finding.row.*Kind::kId);
        finding.version = state != nullptr ? state->version : kAnyVersion;
        finding.standing =
            state != nullptr && !known->second.isEdited ? Standing::kSent : Standing::kEditedSent;
        std::erase_if(
            *sent, [&](const auto& other) { return other.second.row.*Kind::kId == finding.row.*Kind::kId; });
        SYNC_INFO("%s(%s) is the device's %d, which was sent before", Kind::kName, entry.id.c_str(),
                  finding.row.*Kind::kId);
    }
    if (finding.standing == Standing::kChanged && finding.row.etag.empty()) {
        SYNC_ERR("This uri[%s] has no etag yet. We will overwrite this with server's item!",
                 entry.id.c_str());
    } else if (finding.standing == Standing::kDeviceWins) {
        SYNC_ERR("%s(%s, %s) was changed on both sides, the device's %s wins", Kind::kName, entry.id.c_str(),
                 entry.title.c_str(), finding.row.deleted != 0 ? "deletion" : "change");
    } else if (finding.standing == Standing::kEditedOrphan) {
        SYNC_ERR("%s(%s, %s) is taken over with the device's change", Kind::kName, entry.id.c_str(),
                 entry.title.c_str());
        finding.row.dirty = 1;
        markEdited(&finding.row);
    } else if (finding.standing == Standing::kLost) {
        SYNC_ERR("%s(%s, %s) has lost its record, it is made again", Kind::kName, entry.id.c_str(),
                 entry.title.c_str());
    }
    finding.row.uri = entry.id;
    finding.row.etag = entry.etag;
    finding.row.updated = entry.updated;
    return finding;
}

bool hasRow(Standing standing) {
    return standing != Standing::kNew && standing != Standing::kLost && standing != Standing::kOrphan &&
           standing != Standing::kEditedOrphan;
}

// The row learns of the server's entry, the device's change stays.
bool isRowOnly(Standing standing) {
    return standing == Standing::kDeviceWins || standing == Standing::kEditedOrphan ||
           standing == Standing::kEditedSent;
}

template <class Kind, class Says>
CtSentRows<Kind> readSent(const CtSnapshot<Kind>& snapshot, Says says) {
    CtSentRows<Kind> sent;
    for (const typename Kind::Row& row : snapshot.rows()) {
        if (!row.uri.empty() || !sent_mark::isOn(row.etag)) continue;
        contacts_record_h raw = nullptr;
        const bool isThere = snapshot.record(row.*Kind::kId) != nullptr &&
                             contacts_db_get_record(Kind::kView, row.*Kind::kId, &raw) == PLATFORM_ERROR_NONE;
        const ContactsRecord record(raw);
        const std::string mark = isThere ? sent_mark::of(says(raw)) : std::string();
        if (row.etag != sent_mark::kNamesNothing)
            sent.emplace(row.etag, CtSentRow<Kind>{row, mark != row.etag});
        if (isThere && mark != row.etag) sent.emplace(mark, CtSentRow<Kind>{row});
    }
    return sent;
}

}  // namespace

CtSentRows<CtContactKind> readSentContacts(const CtSnapshot<CtContactKind>& snapshot,
                                           const ContactComposer& composer) {
    return readSent(snapshot, [&](contacts_record_h record) { return composer.composeFields(record); });
}

CtSentRows<CtGroupKind> readSentGroups(const CtSnapshot<CtGroupKind>& snapshot) {
    return readSent(snapshot, [](contacts_record_h record) {
        return contacts_read::textOf(record, CONTACTS_GROUP_NAME);
    });
}

CtContactBatch planContacts(const CtContactPage& page, const CtSnapshot<CtContactKind>& snapshot,
                            const CtGroupMap& groups, const ContactComposer& composer,
                            CtSentRows<CtContactKind>* sent) {
    CtContactBatch batch;
    for (const std::shared_ptr<ContactInfo>& entry : page.entries) {
        const std::string says = sent->empty() ? std::string() : composer.composeFields(entry->object());
        Finding<CtContactKind> finding = find(*entry, snapshot, sent, says);
        const Standing standing = finding.standing;
        const CtRowWrite rowWrite = hasRow(standing) ? CtRowWrite::kUpdate : CtRowWrite::kInsert;
        if (isRowOnly(standing)) {
            batch.rows.push_back({finding.row, rowWrite});
            continue;
        }
        // Also one that was taken away while the device's own change was sent.
        const bool isOtherPhoto = entry->photoEtag != finding.row.photo_etag && finding.row.image_dirty == 0;
        const bool missesGroup = standing == Standing::kUnchanged &&
                                 snapshot.missesGroup(finding.row, groups.idsOf(entry->groupUris));
        if (standing == Standing::kUnchanged &&
            ((!isOtherPhoto && !missesGroup) || snapshot.hasLocalChange(finding.row)))
            continue;
        BulkItem item;
        item.entry = entry;
        item.row = finding.row;
        item.rowWrite = rowWrite;
        item.expectedVersion = finding.version;
        item.isForPhoto = standing == Standing::kUnchanged && !missesGroup && !entry->photoEtag.empty();
        if (standing == Standing::kLost) {
            item.lostId = std::exchange(item.row.contact_id, 0);
            item.row.photo_etag.clear();
            item.expectedVersion = kAnyVersion;
        } else if (standing == Standing::kSent) {
            // Its image, if there is one, has not been sent yet.
            item.row.dirty = 0;
        }
        item.keepsImage = standing == Standing::kSent;
        const bool isNew = item.row.contact_id == 0;
        (isNew ? batch.inserts : batch.updates).push_back(std::move(item));
    }
    return batch;
}

std::vector<CtGroupItem> planGroups(const CtGroupPage& page, const CtSnapshot<CtGroupKind>& snapshot,
                                    CtSentRows<CtGroupKind>* sent) {
    std::vector<CtGroupItem> items;
    for (const std::shared_ptr<GroupInfo>& entry : page.entries) {
        Finding<CtGroupKind> finding = find(*entry, snapshot, sent, entry->title);
        const Standing standing = finding.standing;
        if (standing == Standing::kUnchanged) continue;
        CtGroupItem item;
        item.entry = entry;
        item.row = finding.row;
        item.row.source = entry->jsonText();
        item.row.starred = entry->title == ct_wire::kStarredGroup ? 1 : 0;
        item.rowWrite = hasRow(standing) ? CtRowWrite::kUpdate : CtRowWrite::kInsert;
        item.expectedVersion = finding.version;
        item.isRowOnly = isRowOnly(standing);
        if (standing == Standing::kLost) {
            item.lostId = std::exchange(item.row.group_id, 0);
            item.expectedVersion = kAnyVersion;
        } else if (standing == Standing::kSent) {
            item.row.dirty = 0;
        }
        items.push_back(std::move(item));
    }
    return items;
}
