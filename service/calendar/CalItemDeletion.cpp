// The deleting half of CalItemWriter: what a complete list no longer holds.
#include "calendar/CalItemWriter.h"
#include "calendar/CalSeriesDates.h"
#include "calendar/CalTransaction.h"
#include "common/SyncLog.h"

using sync_result::kFailed;
using sync_result::kOk;

void CalItemWriter::markListed(const CalListPage& page) {
    if (page.unreadable > 0) mListIsProof = false;
    mListed.insert(page.idOnly.begin(), page.idOnly.end());
    for (const CalListInfoPtr& entry : page.entries) mListed.insert(entry->id);
}

std::vector<CalEventMetaData> CalItemWriter::unlisted() const {
    std::vector<CalEventMetaData> rows;
    std::unordered_set<int> series;
    const std::vector<const CalEventMetaData*> known = mpSnapshot->knownToServer();
    for (const CalEventMetaData* row : known) {
        if (row->original_event_id == 0 && !mListed.contains(row->uri)) series.insert(row->event_id);
    }
    for (const CalEventMetaData* row : known) {
        if (!mListed.contains(row->uri) || series.contains(row->original_event_id)) rows.push_back(*row);
    }
    return rows;
}

void CalItemWriter::logKept(const CalEventMetaData& row) const {
    SYNC_ERR(
        "%s(%s) is no longer on the server but was changed on the device, it stays until that has been sent",
        mpSnapshot->kind().itemName, row.uri.c_str());
}

// The unlisted rows that may go now. A change that the device has not sent yet keeps its item: the upload finds out that the
// server has it no more, and the download after it lets it go.
std::vector<CalEventMetaData> CalItemWriter::deletable() const {
    std::vector<CalEventMetaData> gone;
    std::unordered_set<int> keptSeries;
    const std::vector<CalEventMetaData> rows = unlisted();
    for (const CalEventMetaData& row : rows) {
        const bool deletedHere = row.deleted != 0 || mpSnapshot->record(row.event_id) == nullptr;
        if (row.original_event_id != 0) continue;
        if (!deletedHere && (mpSnapshot->hasLocalChange(row) || mpSnapshot->hasUnseenChange(row) ||
                             mpSnapshot->hasChangedInstance(row.event_id))) {
            keptSeries.insert(row.event_id);
            logKept(row);
        } else {
            gone.push_back(row);
        }
    }
    std::unordered_set<int> goneSeries;
    for (const CalEventMetaData& row : gone) goneSeries.insert(row.event_id);
    for (const CalEventMetaData& row : rows) {
        // Instances go with their series.
        if (row.original_event_id == 0 || goneSeries.contains(row.original_event_id)) continue;
        if (keptSeries.contains(row.original_event_id) || mpSnapshot->hasLocalChange(row)) {
            logKept(row);
        } else {
            gone.push_back(row);
        }
    }
    return gone;
}

int CalItemWriter::deleteUnlisted() {
    std::vector<CalEventMetaData> gone = deletable();
    if (gone.empty()) return kOk;
    Batch batch;
    if (deleteRecords(&gone, &batch) != kOk || deleteRows(gone, batch) != kOk) return kFailed;
    mCounts.deleted += static_cast<int>(gone.size());
    return kOk;
}

// Takes out of `gone` what could not be deleted because the device changed it meanwhile.
int CalItemWriter::deleteRecords(std::vector<CalEventMetaData>* gone, Batch* batch) {
    CalTransaction transaction;
    if (!transaction.begun()) {
        SYNC_ERR("get svc fail");
        return kFailed;
    }
    std::vector<int> ids;
    std::vector<int> expected;
    std::vector<size_t> skipped;
    std::map<int, std::vector<std::pair<std::string, bool>>> dates;
    for (const CalEventMetaData& row : *gone) {
        if (row.event_id < 0) {
            dates[row.original_event_id].emplace_back(row.recurrence_id, false);
        } else if (mpSnapshot->record(row.event_id) != nullptr) {
            ids.push_back(row.event_id);
            expected.push_back(
                expectedSeriesVersion(row.original_event_id != 0 ? row.original_event_id : row.event_id));
        }
    }
    const record_write_options_s options{.by_sync = true, .expected_versions = expected, .skipped = &skipped};
    if (!ids.empty() && calendar_db_delete_records(mpSnapshot->kind().view, ids.data(), ids.size(),
                                                   options) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("db_delete_records fail");
        return kFailed;
    }
    std::unordered_set<int> kept;
    for (const size_t position : skipped) kept.insert(ids[position]);
    int version = 0;
    if (!ids.empty() && calendar_db_get_last_change_version(&version) != PLATFORM_ERROR_NONE) return kFailed;
    for (const CalEventMetaData& row : *gone) {
        if (row.event_id > 0 && row.original_event_id != 0 && !kept.contains(row.event_id)) {
            batch->seriesVersions[row.original_event_id] = version;
        }
    }
    for (const auto& [seriesId, changes] : dates) {
        int dateVersion = 0;
        const int code =
            changeExceptionDates(seriesId, changes, expectedSeriesVersion(seriesId), &dateVersion);
        if (code == PLATFORM_ERROR_CONFLICT) {
            kept.insert(-seriesId);
        } else if (code != PLATFORM_ERROR_NONE && code != PLATFORM_ERROR_NOT_FOUND) {
            SYNC_ERR("fail");
            return kFailed;
        }
        if (dateVersion != 0) batch->seriesVersions[seriesId] = dateVersion;
    }
    std::erase_if(*gone, [&kept](const CalEventMetaData& row) { return kept.contains(row.event_id); });
    if (!transaction.commit()) {
        SYNC_ERR("get svc fail");
        return kFailed;
    }
    return kOk;
}

int CalItemWriter::deleteRows(const std::vector<CalEventMetaData>& gone, const Batch& batch) {
    SyncTransaction transaction(mpStore->database());
    if (!transaction.begun()) {
        SYNC_ERR("begin trans fail");
        return kFailed;
    }
    for (const CalEventMetaData& row : gone) {
        if (mpStore->deleteItem(row.calendar_id, row.uri) != kOk) {
            SYNC_ERR("%s", mpSnapshot->kind().texts.deleteRow);
            return kFailed;
        }
    }
    if (writeSeriesVersions(CalPagePlan{}, batch) != kOk) return kFailed;
    return transaction.commit();
}
