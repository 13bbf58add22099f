#include "contacts/CtListing.h"

#include <unordered_map>

#include "common/DeletionProof.h"
#include "common/SyncLog.h"
#include "platform/contacts_read.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace {

void makeNew(CtContactSyncRow* row) {
    row->photo_etag.clear();
    row->image_dirty = 1;
}

void makeNew(CtGroupSyncRow* /*row*/) {}

// What is deleted with an item, by its record's id. A group takes its memberships along.
using Companions = std::unordered_map<int, size_t>;

bool readCompanions(CtContactKind /*kind*/, int /*addressBookId*/, Companions* /*counts*/) {
    return true;
}

bool readCompanions(CtGroupKind /*kind*/, int addressBookId, Companions* counts) {
    constexpr unsigned kProperties[] = {CONTACTS_CONTACT_ID, CONTACTS_CONTACT_GROUP_RELATIONS};
    contacts_query_h rawQuery = nullptr;
    if (contacts_query_create(_contacts_contact, &rawQuery) != PLATFORM_ERROR_NONE) return false;
    const ContactsQuery query(rawQuery);
    contacts_list_h rawList = nullptr;
    if (contacts_query_add_filter_int(rawQuery, CONTACTS_CONTACT_ADDRESS_BOOK_ID, addressBookId) !=
            PLATFORM_ERROR_NONE ||
        contacts_query_set_projection(rawQuery, kProperties, std::size(kProperties)) != PLATFORM_ERROR_NONE ||
        contacts_db_get_records_with_query(rawQuery, 0, 0, &rawList) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("get_records_with_query fail");
        return false;
    }
    const ContactsList list(rawList);
    contacts_read::forEach(rawList, [counts](contacts_record_h contact) {
        contacts_read::forEachChild(
            contact, CONTACTS_CONTACT_GROUP_RELATIONS, [counts](contacts_record_h relation) {
                ++(*counts)[contacts_read::intOf(relation, CONTACTS_GROUP_RELATION_GROUP_ID)];
            });
    });
    return true;
}

}  // namespace

template <class Kind>
bool CtListing<Kind>::takeEntry(const CtEntryInfo& entry) {
    if (entry.isDeleted) {
        mMarked.insert(entry.id);
        return false;
    }
    if (mListed.insert(entry.id).second) return true;
    SYNC_ERR("%s(%s, %s) is listed twice, ignoring", Kind::kName, entry.id.c_str(), entry.title.c_str());
    return false;
}

template <class Kind>
auto CtListing<Kind>::unlisted() const -> std::vector<Row> {
    std::vector<Row> rows;
    for (const Row& row : mpSnapshot->rows()) {
        if (!row.uri.empty() && !mListed.contains(row.uri) && !mMarked.contains(row.uri)) rows.push_back(row);
    }
    return rows;
}

template <class Kind>
bool CtListing<Kind>::needsSecondLook() const {
    if (!mIsProof) return false;
    const std::vector<Row> missing = unlisted();
    if (missing.empty()) return false;
    Companions companions;
    if (!readCompanions(Kind(), mpSnapshot->addressBookId(), &companions)) return true;
    const auto count = [&companions](const std::vector<Row>& rows, size_t* items) {
        size_t all = 0;
        for (const Row& row : rows) {
            if (row.uri.empty()) continue;
            const auto found = companions.find(row.*Kind::kId);
            all += 1 + (found != companions.end() ? found->second : 0);
            ++*items;
        }
        return all;
    };
    size_t missingItems = 0;
    size_t knownItems = 0;
    const size_t gone = count(missing, &missingItems);
    const size_t known = count(mpSnapshot->rows(), &knownItems);
    return deletion_proof::needsSecondLook(known, gone, missingItems == knownItems);
}

template <class Kind>
int CtListing<Kind>::deleteGone() {
    std::vector<Row> gone = mIsProof ? unlisted() : std::vector<Row>();
    for (const std::string& uri : mMarked) {
        const Row* row = mpSnapshot->rowByUri(uri);
        if (row != nullptr && !mListed.contains(uri)) gone.push_back(*row);
    }
    std::vector<Row> deletable;
    std::vector<Row> others;
    std::vector<int> versions;
    for (const Row& row : gone) {
        const CtRecordState* state = mpSnapshot->record(row.*Kind::kId);
        if (state == nullptr || mpSnapshot->hasLocalChange(row)) {
            others.push_back(row);
        } else {
            deletable.push_back(row);
            versions.push_back(state->version);
        }
    }
    CtItemWriter writer(mpStore, mpSnapshot->addressBookId());
    if (writer.remove<Kind>(deletable, versions, &mDeleted) != kOk) return kFailed;
    return forgetOrRenew(others);
}

template <class Kind>
int CtListing<Kind>::forgetOrRenew(const std::vector<Row>& rows) {
    if (rows.empty()) return kOk;
    SyncTransaction transaction(mpStore->database());
    if (!transaction.begun()) return kFailed;
    for (const Row& row : rows) {
        int result = kOk;
        if (row.deleted != 0 || mpSnapshot->record(row.*Kind::kId) == nullptr) {
            result = Kind::forget(*mpStore, row.*Kind::kId);
        } else {
            SYNC_ERR("%s(%s) was deleted on the server and changed on the device, it is sent as new",
                     Kind::kName, row.uri.c_str());
            Row renewed = row;
            renewed.uri.clear();
            renewed.etag.clear();
            renewed.dirty = 1;
            makeNew(&renewed);
            result = Kind::update(*mpStore, renewed);
        }
        if (result != kOk) return kFailed;
    }
    return transaction.commit();
}

template class CtListing<CtContactKind>;
template class CtListing<CtGroupKind>;
