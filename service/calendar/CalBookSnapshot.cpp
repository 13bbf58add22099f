#include "calendar/CalBookSnapshot.h"

#include <algorithm>

#include "common/SentMark.h"
#include "common/SyncLog.h"
#include "platform/calendar_read.h"

using calendar_read::intOf;
using calendar_read::textOf;
using sync_result::kFailed;
using sync_result::kOk;

namespace {

// Items that a user deleted since the book's changes were last examined.
int readUnseenDeletions(const CalItemKind& kind, const CalBookMetaData& book,
                        std::unordered_set<int>* eventIds) {
    int current = 0;
    const int code = calendar_read::forEachChange(
        kind.view, book.calendar_id, book.sync_version, &current, [eventIds](calendar_record_h record) {
            const bool deleted = intOf(record, CALENDAR_UPDATED_INFO_MODIFIED_STATUS) == RECORD_DELETED;
            const bool own = intOf(record, CALENDAR_UPDATED_INFO_SYNCED_VERSION) ==
                             intOf(record, CALENDAR_UPDATED_INFO_VERSION);
            if (deleted && !own) eventIds->insert(intOf(record, CALENDAR_UPDATED_INFO_ID));
        });
    if (code == PLATFORM_ERROR_NONE) return kOk;
    SYNC_ERR("db_get_changes_by_version fail");
    return kFailed;
}

}  // namespace

int CalBookSnapshot::load(CalItemStore& store, const CalBookMetaData& book) {
    mBook = book;
    // Rows before records: a record that appears in between is the user's own and has no row to be compared with.
    std::vector<CalEventMetaData> rows;
    if (store.getAllItems(book.calendar_id, &rows) != kOk) return kFailed;
    for (CalEventMetaData& row : rows) {
        mRows.push_back(std::move(row));
        index(mRows.size() - 1);
    }
    rows = {};
    if (readRecordStates() != kOk) return kFailed;
    readUnconfirmed();
    const bool someMissing = std::any_of(mRows.begin(), mRows.end(), [this](const CalEventMetaData& row) {
        return row.event_id > 0 && record(row.event_id) == nullptr;
    });
    return someMissing ? readUnseenDeletions(mKind, book, &mDeletedByUser) : kOk;
}

int CalBookSnapshot::readRecordStates() {
    std::unordered_map<int, const CalEventMetaData*> rows;
    for (const CalEventMetaData& row : mRows) rows.emplace(row.event_id, &row);
    std::vector<unsigned> properties = {mKind.id, mKind.version, mKind.syncedVersion, mKind.uid, mKind.etag};
    if (mKind.hasSeries()) properties.push_back(mKind.ownVersion);
    const auto take = [&](calendar_record_h record) {
        const int eventId = intOf(record, mKind.id);
        const std::string uid = textOf(record, mKind.uid);
        CalRecordState state;
        state.version = intOf(record, mKind.version);
        state.ownVersion = intOf(record, mKind.ownVersion);
        state.syncedVersion = intOf(record, mKind.syncedVersion);
        state.etag = textOf(record, mKind.etag);
        if (const auto row = rows.find(eventId); row != rows.end()) {
            state.isBehind = state.etag != row->second->etag || uid != row->second->uri;
            state.etag = {};
        } else if (state.syncedVersion != 0 && !uid.empty()) {
            mOrphans.emplace(uid, eventId);
        }
        mRecords.emplace(eventId, std::move(state));
    };
    const int code =
        calendar_read::forEachPart(mKind.view, mKind.bookId, mBook.calendar_id, properties, take);
    if (code == PLATFORM_ERROR_NONE) return kOk;
    SYNC_ERR("get_records_with_query fail");
    return kFailed;
}

void CalBookSnapshot::readUnconfirmed() {
    for (size_t i = 0; i < mRows.size(); ++i) {
        const CalEventMetaData& row = mRows[i];
        if (!row.uri.empty() || !sent_mark::isOn(row.etag) || row.original_event_id != 0) continue;
        if (row.etag != sent_mark::kNamesNothing) mUnconfirmed.emplace(row.etag, i);
        calendar_record_h raw = nullptr;
        if (calendar_db_get_record(mKind.view, row.event_id, &raw) != PLATFORM_ERROR_NONE) continue;
        const CalendarRecord record(raw);
        // The version comes with the content: an edit after this look is still to be found.
        CalRecordState& state = mRecords[row.event_id];
        state.version = intOf(raw, mKind.version);
        state.hasDates = mKind.hasSeries() && !textOf(raw, CALENDAR_EVENT_EXDATE).empty();
        state.sentMark = sent_mark::of(mKind.comparable(raw));
        if (state.sentMark != row.etag) mUnconfirmed.emplace(state.sentMark, i);
    }
}

void CalBookSnapshot::index(size_t position) {
    const CalEventMetaData& row = mRows[position];
    if (row.original_event_id != 0) {
        mInstances.insert_or_assign({row.original_event_id, row.recurrence_id}, position);
        // An instance found locally carries its series' uri until it was sent; the series owns that uri.
        if (!row.uri.empty()) mByUri.emplace(row.uri, position);
        return;
    }
    mByEventId.insert_or_assign(row.event_id, position);
    if (!row.uri.empty()) mByUri.insert_or_assign(row.uri, position);
}

const CalEventMetaData* CalBookSnapshot::rowByUri(const std::string& uri) const {
    const auto found = mByUri.find(uri);
    return found == mByUri.end() ? nullptr : &mRows[found->second];
}

const CalEventMetaData* CalBookSnapshot::instanceRow(int seriesEventId,
                                                     const std::string& recurrenceId) const {
    const auto found = mInstances.find({seriesEventId, recurrenceId});
    return found == mInstances.end() ? nullptr : &mRows[found->second];
}

const CalRecordState* CalBookSnapshot::record(int eventId) const {
    const auto found = mRecords.find(eventId);
    return found == mRecords.end() ? nullptr : &found->second;
}

int CalBookSnapshot::orphan(const std::string& uri) const {
    const auto found = mOrphans.find(uri);
    return found == mOrphans.end() ? 0 : found->second;
}

const CalEventMetaData* CalBookSnapshot::unconfirmed(const std::string& mark) const {
    const auto found = mUnconfirmed.find(mark);
    return found == mUnconfirmed.end() ? nullptr : &mRows[found->second];
}

std::vector<const CalEventMetaData*> CalBookSnapshot::knownToServer() const {
    std::vector<const CalEventMetaData*> rows;
    rows.reserve(mByUri.size());
    for (const auto& [uri, position] : mByUri) rows.push_back(&mRows[position]);
    return rows;
}

bool CalBookSnapshot::isLost(const CalEventMetaData& row) const {
    return row.event_id > 0 && row.deleted == 0 && record(row.event_id) == nullptr &&
           !mDeletedByUser.contains(row.event_id);
}

bool CalBookSnapshot::hasLocalChange(const CalEventMetaData& row) const {
    if (row.dirty != 0 || row.deleted != 0) return true;
    if (row.event_id <= 0) return false;
    const CalRecordState* state = record(row.event_id);
    if (state == nullptr) return mDeletedByUser.contains(row.event_id);
    // What only its exceptions brought to a series is their change, not its own.
    return state->ownVersion > std::max(row.version, state->syncedVersion);
}

bool CalBookSnapshot::hasChangedInstance(int seriesEventId) const {
    for (auto found = mInstances.lower_bound({seriesEventId, std::string()});
         found != mInstances.end() && found->first.first == seriesEventId; ++found) {
        if (hasLocalChange(mRows[found->second])) return true;
    }
    return false;
}

bool CalBookSnapshot::isBehindRow(const CalEventMetaData& row) const {
    const CalRecordState* state = record(row.event_id);
    return state != nullptr && state->isBehind && !hasLocalChange(row) && !hasUnseenChange(row);
}

bool CalBookSnapshot::hasUnseenChange(const CalEventMetaData& row) const {
    const CalRecordState* state = record(row.event_id);
    return state != nullptr && state->version > std::max(row.version, state->syncedVersion);
}

void CalBookSnapshot::put(const CalEventMetaData& row) {
    const auto sameRow = [&row](const CalEventMetaData* known) {
        return known != nullptr && known->uri == row.uri && known->original_event_id == row.original_event_id;
    };
    const CalEventMetaData* known = row.original_event_id != 0
                                        ? instanceRow(row.original_event_id, row.recurrence_id)
                                        : rowByUri(row.uri);
    size_t position = mRows.size();
    if (sameRow(known)) {
        position = row.original_event_id != 0 ? mInstances.at({row.original_event_id, row.recurrence_id})
                                              : mByUri.at(row.uri);
        // The text that names the row stays where it is.
        CalEventMetaData fresh = row;
        fresh.uri.swap(mRows[position].uri);
        mRows[position] = std::move(fresh);
    } else {
        mRows.push_back(row);
    }
    index(position);
    mOrphans.erase(row.uri);
    std::erase_if(mUnconfirmed,
                  [&](const auto& entry) { return mRows[entry.second].event_id == row.event_id; });
}

void CalBookSnapshot::setVersion(int seriesEventId, int version) {
    if (const auto found = mByEventId.find(seriesEventId); found != mByEventId.end())
        mRows[found->second].version = version;
}

void CalBookSnapshot::putRecord(int eventId, CalRecordState state) {
    mRecords.insert_or_assign(eventId, std::move(state));
}
