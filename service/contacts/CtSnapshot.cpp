#include "contacts/CtSnapshot.h"

#include <algorithm>

#include "common/JsonAccess.h"
#include "common/JsonText.h"
#include "common/SyncLog.h"
#include "contacts/CtIdUtil.h"
#include "contacts/CtLocalChanges.h"
#include "contacts/CtRecordRead.h"
#include "platform/contacts_read.h"

using contacts_read::intOf;
using contacts_read::textOf;
using sync_result::kFailed;
using sync_result::kOk;

namespace {

// What a record says of the server's item that it stands for; an empty uri when it does not.
void readServerId(CtContactKind /*kind*/, contacts_record_h record, std::string* uri, std::string* etag) {
    const JsonNodePtr root = json_text::parse(ct_record::originOf(record));
    JsonObject* origin = json_access::objectIn(root.get());
    const std::string id = json_access::textOr(json_access::object(origin, "id"), "$t", "");
    if (!id.empty()) *uri = CtIdUtil::idAfterBase(id);
    *etag = json_access::textOr(origin, "gd$etag", "");
}

void readServerId(CtGroupKind /*kind*/, contacts_record_h record, std::string* uri, std::string* /*etag*/) {
    *uri = textOf(record, CONTACTS_GROUP_SYNC_DATA1);
}

std::vector<unsigned> stateProperties(CtContactKind /*kind*/) {
    return {CONTACTS_CONTACT_ID, CONTACTS_CONTACT_VERSION, CONTACTS_CONTACT_SYNCED_VERSION,
            CONTACTS_CONTACT_GROUP_RELATIONS};
}
std::vector<unsigned> stateProperties(CtGroupKind /*kind*/) {
    return {CONTACTS_GROUP_ID, CONTACTS_GROUP_VERSION, CONTACTS_GROUP_SYNCED_VERSION};
}

std::vector<int> groupsOf(CtContactKind /*kind*/, contacts_record_h contact) {
    std::vector<int> groups;
    contacts_read::forEachChild(contact, CONTACTS_CONTACT_GROUP_RELATIONS,
                                [&groups](contacts_record_h relation) {
                                    groups.push_back(intOf(relation, CONTACTS_GROUP_RELATION_GROUP_ID));
                                });
    return groups;
}
std::vector<int> groupsOf(CtGroupKind /*kind*/, contacts_record_h /*group*/) {
    return {};
}

}  // namespace

template <class Kind>
int CtSnapshot<Kind>::load(CtMetaDataDBHelper& store, int addressBookId) {
    mAddressBookId = addressBookId;
    // Rows before records: a record that appears in between is the user's own and has no row to be compared with.
    if (Kind::getAll(store, addressBookId, &mRows) != kOk || readStates() != kOk) return kFailed;
    for (size_t i = 0; i < mRows.size(); ++i) {
        if (!mRows[i].uri.empty()) mByUri.emplace(mRows[i].uri, i);
    }
    if (readOrphans() != kOk) return kFailed;
    return readUnseenDeletions(store);
}

template <class Kind>
int CtSnapshot<Kind>::readStates() {
    const std::vector<unsigned> properties = stateProperties(Kind());
    const int code = contacts_read::forEachPart(Kind::kView, Kind::kBookProperty, mAddressBookId, properties,
                                                [this](contacts_record_h record) {
                                                    mRecords[intOf(record, Kind::kIdProperty)] = {
                                                        .version = intOf(record, Kind::kVersionProperty),
                                                        .syncedVersion = intOf(record, Kind::kSyncedProperty),
                                                        .groups = groupsOf(Kind(), record)};
                                                });
    if (code == PLATFORM_ERROR_NONE) return kOk;
    SYNC_ERR("get_records_with_query fail");
    return kFailed;
}

template <class Kind>
int CtSnapshot<Kind>::readOrphans() {
    std::unordered_set<int> withRow;
    for (const Row& row : mRows) withRow.insert(row.*Kind::kId);
    for (const auto& [id, state] : mRecords) {
        if (state.syncedVersion == 0 || withRow.contains(id)) continue;
        contacts_record_h raw = nullptr;
        if (contacts_db_get_record(Kind::kView, id, &raw) != PLATFORM_ERROR_NONE) {
            SYNC_ERR("db_get_record fail");
            return kFailed;
        }
        const ContactsRecord record(raw);
        CtOrphan orphan;
        orphan.id = id;
        std::string uri;
        readServerId(Kind(), raw, &uri, &orphan.etag);
        if (!uri.empty()) mOrphans.emplace(uri, orphan);
    }
    return kOk;
}

template <class Kind>
int CtSnapshot<Kind>::readUnseenDeletions(CtMetaDataDBHelper& store) {
    int since = 0;
    ct_changes::Changes changes;
    if (Kind::getLatest(store, mAddressBookId, &since) != kOk ||
        ct_changes::read<Kind>(mAddressBookId, since, &changes) != kOk) {
        return kFailed;
    }
    for (const CtLocalChange& change : changes.foreign) {
        if (change.type == RECORD_DELETED) mDeletedByUser.insert(change.itemId);
    }
    return kOk;
}

template <class Kind>
auto CtSnapshot<Kind>::rowByUri(const std::string& uri) const -> const Row* {
    const auto found = mByUri.find(uri);
    return found != mByUri.end() ? &mRows[found->second] : nullptr;
}

template <class Kind>
const CtRecordState* CtSnapshot<Kind>::record(int id) const {
    const auto found = mRecords.find(id);
    return found != mRecords.end() ? &found->second : nullptr;
}

template <class Kind>
const CtOrphan* CtSnapshot<Kind>::orphan(const std::string& uri) const {
    const auto found = mOrphans.find(uri);
    return found != mOrphans.end() ? &found->second : nullptr;
}

template <class Kind>
bool CtSnapshot<Kind>::isLost(const Row& row) const {
    return record(row.*Kind::kId) == nullptr && row.deleted == 0 && !mDeletedByUser.contains(row.*Kind::kId);
}

template <class Kind>
bool CtSnapshot<Kind>::missesGroup(const Row& row, const std::vector<int>& groups) const {
    const CtRecordState* state = record(row.*Kind::kId);
    return state != nullptr && std::any_of(groups.begin(), groups.end(), [state](int group) {
               return std::find(state->groups.begin(), state->groups.end(), group) == state->groups.end();
           });
}

template <class Kind>
bool CtSnapshot<Kind>::hasLocalChange(const Row& row) const {
    if (row.dirty != 0 || row.deleted != 0 || mDeletedByUser.contains(row.*Kind::kId)) return true;
    const CtRecordState* state = record(row.*Kind::kId);
    return state != nullptr && state->version != row.version && !state->isEnginesOwnWrite();
}

template class CtSnapshot<CtContactKind>;
template class CtSnapshot<CtGroupKind>;
