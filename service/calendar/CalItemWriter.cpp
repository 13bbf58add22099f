#include "calendar/CalItemWriter.h"

#include <utility>

#include "calendar/CalJsonParser.h"
#include "calendar/CalSeriesDates.h"
#include "calendar/CalTransaction.h"
#include "calendar/CalWriteBack.h"
#include "common/SyncLog.h"
#include "platform/calendar_read.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace {

// The records of one bulk call, with the planned items they come from.
template <class Planned>
class Bulk {
public:
    Bulk() {
        calendar_list_h list = nullptr;
        if (calendar_list_create(&list) == PLATFORM_ERROR_NONE) mList.reset(list);
    }

    void add(Planned* item, int recordId, int expectedVersion) {
        if (!mList || calendar_list_add(mList.get(), item->record.get()) != PLATFORM_ERROR_NONE) {
            SYNC_ERR("calendar_list_add fail");
            return;
        }
        mRecords.push_back(item->record.release());
        mItems.push_back(item);
        mIds.push_back(recordId);
        mExpected.push_back(expectedVersion);
    }

    [[nodiscard]] bool empty() const { return mItems.empty(); }
    [[nodiscard]] calendar_list_h list() const { return mList.get(); }
    [[nodiscard]] const std::vector<int>& ids() const { return mIds; }

    [[nodiscard]] record_write_options_s options() {
        return {.by_sync = true, .expected_versions = mExpected, .skipped = &mSkipped};
    }

    // Calls `use(item, record id)` for what was written; what had moved on goes into `skipped`.
    template <class Use>
    void finish(unsigned idProperty, std::unordered_set<const void*>* skipped, Use use) const {
        std::unordered_set<size_t> left(mSkipped.begin(), mSkipped.end());
        for (size_t i = 0; i < mItems.size(); ++i) {
            if (left.contains(i)) {
                SYNC_ERR("item(%s) was changed on the device meanwhile, it is left for the next sync",
                         mItems[i]->row.uri.c_str());
                skipped->insert(mItems[i]);
            } else {
                use(mItems[i], mIds[i] != 0 ? mIds[i] : calendar_read::intOf(mRecords[i], idProperty));
            }
        }
    }

private:
    CalendarList mList;
    std::vector<calendar_record_h> mRecords;  // owned by mList
    std::vector<Planned*> mItems;
    std::vector<int> mIds;
    std::vector<int> mExpected;
    std::vector<size_t> mSkipped;
};

}  // namespace

CalItemWriter::CalItemWriter(CalItemStore* store, CalBookSnapshot* snapshot)
    : mpStore(store), mpSnapshot(snapshot) {}

int CalItemWriter::writePage(const CalListPage& page) {
    if (page.unreadable > 0) mListIsProof = false;
    mListed.insert(page.idOnly.begin(), page.idOnly.end());
    CalList fresh;
    for (const CalListInfoPtr& entry : page.entries) {
        if (mListed.insert(entry->id).second) {
            fresh.push_back(entry);
        } else {
            SYNC_ERR("%s(%s) is listed twice, ignoring", mpSnapshot->kind().itemName, entry->id.c_str());
        }
    }
    CalPagePlan plan = planPage(fresh, *mpSnapshot);
    mWaiting.insert(mWaiting.end(), plan.waiting.begin(), plan.waiting.end());
    return write(&plan);
}

int CalItemWriter::adoptSent(const CalListPage& page) {
    CalPagePlan plan = planPage(page.entries, *mpSnapshot);
    std::erase_if(plan.events, [](const PlannedEvent& planned) { return planned.record != nullptr; });
    plan.instances.clear();
    return write(&plan);
}

int CalItemWriter::writeWaiting() {
    CalPagePlan plan = planPage(std::exchange(mWaiting, {}), *mpSnapshot);
    for (const CalListInfoPtr& entry : plan.waiting) {
        ExceptionInfo info;
        (void)CalJsonParser::checkException(jsonObjectOf(entry->json), &info);
        SYNC_ERR("not found original_event(%s)", info.seriesUri.c_str());
    }
    return write(&plan);
}

int CalItemWriter::write(CalPagePlan* plan) {
    if (plan->events.empty() && plan->instances.empty()) return kOk;
    Batch batch;
    if (writeRecords(plan, &batch) != kOk || writeRows(plan, batch) != kOk) return kFailed;
    remember(*plan, batch);
    return kOk;
}

int CalItemWriter::writeRecords(CalPagePlan* plan, Batch* batch) {
    CalTransaction transaction;
    if (!transaction.begun()) {
        SYNC_ERR("get svc fail");
        return kFailed;
    }
    if (insertItems(plan, batch) != kOk || updateItems(plan, batch) != kOk) return kFailed;
    for (const PlannedEvent& planned : plan->events) {
        if (!planned.sent) continue;
        const CalWriteBack sent{planned.row.event_id, planned.row.version, planned.row.uri, planned.row.etag};
        CalendarRecord server;
        (void)mpSnapshot->kind().convert(jsonObjectOf(planned.sent->json), &server);
        if (!writeBack(mpSnapshot->kind(), sent, server.get())) return kFailed;
    }
    resolveSeries(plan, batch);
    if (insertException(plan, batch) != kOk || updateException(plan, batch) != kOk) return kFailed;
    std::vector<PlannedInstance*> cancelled;
    for (PlannedInstance& planned : plan->instances) {
        if (planned.addDate && planned.childId != 0 && !batch->skipped.contains(&planned))
            cancelled.push_back(&planned);
    }
    if (deleteExceptions(cancelled, batch) != kOk || writeExceptionDates(plan, batch) != kOk) return kFailed;
    if (!transaction.commit()) {
        SYNC_ERR("get svc fail");
        return kFailed;
    }
    return kOk;
}

namespace {

// Writes a bulk, as new records or over those it names, and tells `note(item, record id, version)` of each that was written.
template <class Planned, class Note>
int writeBulk(const CalItemKind& kind, Bulk<Planned>* bulk, bool isNew,
              std::unordered_set<const void*>* skipped, Note note) {
    if (bulk->empty()) return kOk;
    const int code = isNew ? calendar_db_insert_records(bulk->list(), bulk->options())
                           : calendar_db_replace_records(bulk->list(), bulk->ids().data(), bulk->ids().size(),
                                                         bulk->options());
    if (code != PLATFORM_ERROR_NONE) {
        SYNC_ERR("%s", isNew ? kind.texts.insertItems : kind.texts.updateItems);
        return kFailed;
    }
    int version = 0;
    if (calendar_db_get_last_change_version(&version) != PLATFORM_ERROR_NONE) return kFailed;
    bulk->finish(kind.id, skipped, [&](Planned* planned, int id) {
        planned->row.event_id = id;
        planned->row.version = version;
        note(planned, id, version);
    });
    return kOk;
}

}  // namespace

int CalItemWriter::insertItems(CalPagePlan* plan, Batch* batch) {
    Bulk<PlannedEvent> bulk;
    for (PlannedEvent& planned : plan->events) {
        if (planned.record && planned.row.event_id == 0) bulk.add(&planned, 0, kAnyVersion);
    }
    return writeBulk(mpSnapshot->kind(), &bulk, /*isNew=*/true, &batch->skipped,
                     [&](const PlannedEvent* planned, int id, int) {
                         batch->insertedIds.emplace(planned->row.uri, id);
                         ++mCounts.inserted;
                     });
}

int CalItemWriter::updateItems(CalPagePlan* plan, Batch* batch) {
    Bulk<PlannedEvent> bulk;
    for (PlannedEvent& planned : plan->events) {
        if (planned.record && planned.row.event_id != 0) {
            bulk.add(&planned, planned.row.event_id, planned.expectedVersion);
        }
    }
    return writeBulk(mpSnapshot->kind(), &bulk, /*isNew=*/false, &batch->skipped,
                     [&](const PlannedEvent*, int, int) { ++mCounts.updated; });
}

int CalItemWriter::expectedSeriesVersion(int seriesId) const {
    const CalRecordState* state = mpSnapshot->record(seriesId);
    // A series of this very page is not in the snapshot; nobody else can have seen it yet.
    return state != nullptr ? state->version : kAnyVersion;
}

void CalItemWriter::resolveSeries(CalPagePlan* plan, Batch* batch) {
    for (PlannedInstance& planned : plan->instances) {
        int& seriesId = planned.row.original_event_id;
        if (const auto inserted = batch->insertedIds.find(planned.seriesUri);
            inserted != batch->insertedIds.end()) {
            seriesId = inserted->second;
        }
        const bool attached =
            seriesId != 0 && (!planned.record ||
                              calendar_record_set_int(planned.record.get(), CALENDAR_EVENT_ORIGINAL_EVENT_ID,
                                                      seriesId) == PLATFORM_ERROR_NONE);
        if (!attached) {
            SYNC_ERR("not found original_event(%s)", planned.seriesUri.c_str());
            batch->skipped.insert(&planned);
        }
        if (planned.addDate) planned.row.event_id = -seriesId;
    }
}

int CalItemWriter::insertException(CalPagePlan* plan, Batch* batch) {
    return writeExceptions(plan, batch, /*isNew=*/true, &mCounts.inserted);
}

int CalItemWriter::updateException(CalPagePlan* plan, Batch* batch) {
    return writeExceptions(plan, batch, /*isNew=*/false, &mCounts.updated);
}

int CalItemWriter::writeExceptions(CalPagePlan* plan, Batch* batch, bool isNew, int* count) {
    Bulk<PlannedInstance> bulk;
    for (PlannedInstance& planned : plan->instances) {
        if (planned.record && (planned.childId == 0) == isNew && !batch->skipped.contains(&planned)) {
            bulk.add(&planned, planned.childId, expectedSeriesVersion(planned.row.original_event_id));
        }
    }
    return writeBulk(mpSnapshot->kind(), &bulk, isNew, &batch->skipped,
                     [&](const PlannedInstance* planned, int, int version) {
                         batch->seriesVersions[planned->row.original_event_id] = version;
                         ++*count;
                     });
}

int CalItemWriter::deleteExceptions(const std::vector<PlannedInstance*>& instances, Batch* batch) {
    if (instances.empty()) return kOk;
    std::vector<int> ids;
    std::vector<int> expected;
    std::vector<size_t> skipped;
    for (const PlannedInstance* planned : instances) {
        ids.push_back(planned->childId);
        expected.push_back(expectedSeriesVersion(planned->row.original_event_id));
    }
    const record_write_options_s options{.by_sync = true, .expected_versions = expected, .skipped = &skipped};
    if (calendar_db_delete_records(_calendar_event, ids.data(), ids.size(), options) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("db_delete_records fail");
        return kFailed;
    }
    int version = 0;
    if (calendar_db_get_last_change_version(&version) != PLATFORM_ERROR_NONE) return kFailed;
    std::unordered_set<size_t> left(skipped.begin(), skipped.end());
    for (size_t i = 0; i < instances.size(); ++i) {
        if (left.contains(i)) {
            batch->skipped.insert(instances[i]);
        } else {
            batch->seriesVersions[instances[i]->row.original_event_id] = version;
        }
    }
    return kOk;
}

int CalItemWriter::writeExceptionDates(CalPagePlan* plan, Batch* batch) {
    std::map<int, std::vector<PlannedInstance*>> bySeries;
    for (PlannedInstance& planned : plan->instances) {
        if ((planned.addDate || planned.dropDate) && !batch->skipped.contains(&planned)) {
            bySeries[planned.row.original_event_id].push_back(&planned);
        }
    }
    for (const auto& [seriesId, instances] : bySeries) {
        std::vector<std::pair<std::string, bool>> changes;
        for (const PlannedInstance* planned : instances) {
            changes.emplace_back(planned->row.recurrence_id, planned->addDate);
        }
        int version = 0;
        switch (changeExceptionDates(seriesId, changes, expectedSeriesVersion(seriesId), &version)) {
            case PLATFORM_ERROR_NONE:
                if (version != 0) batch->seriesVersions[seriesId] = version;
                break;
            case PLATFORM_ERROR_CONFLICT:
            case PLATFORM_ERROR_NOT_FOUND:
                batch->skipped.insert(instances.begin(), instances.end());
                break;
            default:
                SYNC_ERR("fail");
                return kFailed;
        }
        mCounts.updated += static_cast<int>(instances.size());
    }
    return kOk;
}

int CalItemWriter::writeRows(CalPagePlan* plan, const Batch& batch) {
    SyncTransaction transaction(mpStore->database());
    if (!transaction.begun()) {
        SYNC_ERR("begin trans fail");
        return kFailed;
    }
    const CalItemKind::Texts& texts = mpSnapshot->kind().texts;
    for (PlannedEvent& planned : plan->events) {
        if (batch.skipped.contains(&planned)) continue;
        if (const auto touched = batch.seriesVersions.find(planned.row.event_id);
            touched != batch.seriesVersions.end()) {
            planned.row.version = touched->second;
        }
        if (planned.rowWrite == RowWrite::kReplaceLost &&
            mpStore->deleteItem(planned.row.calendar_id, planned.row.uri) != kOk) {
            return kFailed;
        }
        const bool update = planned.rowWrite == RowWrite::kUpdate;
        if ((update ? mpStore->updateItem(planned.row) : mpStore->insertItem(planned.row)) != kOk) {
            SYNC_ERR("%s", update ? texts.updateRow : texts.insertRow);
            return kFailed;
        }
    }
    for (const PlannedInstance& planned : plan->instances) {
        if (batch.skipped.contains(&planned)) continue;
        const bool update = planned.rowWrite == RowWrite::kUpdate;
        if ((update ? mpStore->updateItem(planned.row) : mpStore->insertItem(planned.row)) != kOk) {
            SYNC_ERR("%s", update ? texts.updateRow : texts.insertRow);
            return kFailed;
        }
    }
    if (writeSeriesVersions(*plan, batch) != kOk) return kFailed;
    return transaction.commit();
}

int CalItemWriter::writeSeriesVersions(const CalPagePlan& plan, const Batch& batch) {
    std::unordered_set<int> written;
    for (const PlannedEvent& planned : plan.events) {
        if (!batch.skipped.contains(&planned)) written.insert(planned.row.event_id);
    }
    for (const auto& [seriesId, version] : batch.seriesVersions) {
        if (written.contains(seriesId)) continue;
        CalEventMetaData row;
        if (mpStore->getItem(seriesId, &row) != kOk) {
            SYNC_ERR("metaDB getEvent fail");
            return kFailed;
        }
        row.version = version;
        if (mpStore->updateItem(row) != kOk) {
            SYNC_ERR("metaDB updateEvent fail");
            return kFailed;
        }
    }
    return kOk;
}

void CalItemWriter::remember(const CalPagePlan& plan, const Batch& batch) {
    const auto rememberRow = [this](const CalEventMetaData& row, bool written) {
        mpSnapshot->put(row);
        if (!written || row.event_id <= 0) return;
        mpSnapshot->putRecord(
            row.event_id,
            {.version = row.version, .ownVersion = row.version, .syncedVersion = row.version, .etag = {}});
    };
    for (const PlannedEvent& planned : plan.events) {
        const bool rowOnly = planned.rowWrite == RowWrite::kUpdate && planned.expectedVersion == kAnyVersion;
        if (!batch.skipped.contains(&planned)) rememberRow(planned.row, planned.ownWrite && !rowOnly);
    }
    for (const PlannedInstance& planned : plan.instances) {
        if (!batch.skipped.contains(&planned)) rememberRow(planned.row, !planned.rowOnly);
    }
    for (const auto& [seriesId, version] : batch.seriesVersions) {
        const CalRecordState* known = mpSnapshot->record(seriesId);
        CalRecordState state = known != nullptr ? *known : CalRecordState{};
        state.version = version;
        state.syncedVersion = version;
        mpSnapshot->putRecord(seriesId, std::move(state));
        mpSnapshot->setVersion(seriesId, version);
    }
}
