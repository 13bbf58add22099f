#include "contacts/CtListing.h"

#include "common/DeletionProof.h"
#include "common/SyncLog.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace {

void makeNew(CtContactSyncRow* row) {
    row->photo_etag.clear();
    row->image_dirty = 1;
}

void makeNew(CtGroupSyncRow* /*row*/) {}

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
    size_t known = 0;
    for (const Row& row : mpSnapshot->rows()) known += row.uri.empty() ? 0 : 1;
    const size_t gone = unlisted().size();
    return deletion_proof::needsSecondLook(known, gone, gone == known);
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
