#include "calendar/CalPagePlan.h"

#include <set>
#include <unordered_set>
#include <utility>

#include "calendar/CalJsonParser.h"
#include "common/SentMark.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"

using sync_result::kOk;

namespace {

class Planner {
public:
    explicit Planner(const CalBookSnapshot& snapshot) : mSnapshot(snapshot), mKind(snapshot.kind()) {}

    CalPagePlan plan(const CalList& entries) {
        // Series before instances: a page may list an instance ahead of the series that it also brings.
        std::vector<std::pair<CalListInfoPtr, ExceptionInfo>> instances;
        for (const CalListInfoPtr& entry : entries) {
            ExceptionInfo info;
            JsonObject* json = jsonObjectOf(entry->json);
            if (mKind.hasSeries() && json == nullptr) {
                SYNC_ERR("%s", mKind.texts.notJson);
            } else if (mKind.hasSeries() && CalJsonParser::checkException(json, &info) != kOk) {
                SYNC_ERR("checkException fail");
                SYNC_ERR("event(%s) is left out", entry->id.c_str());
            } else if (info.kind == ExceptionKind::kOrdinary) {
                planEvent(entry);
            } else {
                instances.emplace_back(entry, info);
            }
        }
        for (const auto& [entry, info] : instances) planInstance(entry, info);
        return std::move(mPlan);
    }

private:
    [[nodiscard]] CalEventMetaData newRow(const CalListInfo& entry) const {
        CalEventMetaData row;
        row.calendar_id = mSnapshot.book().calendar_id;
        row.uri = entry.id;
        row.etag = entry.etag;
        return row;
    }

    bool convertJson2Record(const CalListInfo& entry, const char* failureText, CalendarRecord* out) const {
        JsonObject* json = jsonObjectOf(entry.json);
        if (json != nullptr && mKind.convert(json, out) == kOk &&
            calendar_record_set_int(out->get(), mKind.bookId, mSnapshot.book().calendar_id) ==
                PLATFORM_ERROR_NONE) {
            return true;
        }
        SYNC_ERR("%s", json == nullptr ? mKind.texts.notJson : failureText);
        SYNC_ERR("%s(%s) is left out", mKind.itemName, entry.id.c_str());
        return false;
    }

    void planEvent(const CalListInfoPtr& listed) {
        const CalListInfo& entry = *listed;
        if (const CalEventMetaData* row = mSnapshot.rowByUri(entry.id)) {
            if (row->original_event_id != 0) {
                SYNC_ERR("event(%s) is an instance of a series on the device, ignoring", entry.id.c_str());
                return;
            }
            planKnown(entry, *row);
        } else if (const int orphan = mSnapshot.orphan(entry.id)) {
            planOrphan(entry, orphan);
        } else if (const CalEventMetaData* sent = unconfirmedRow(entry)) {
            planSent(listed, *sent);
        } else {
            PlannedEvent planned;
            planned.row = newRow(entry);
            if (!convertJson2Record(entry, "json parse fail", &planned.record)) return;
            add(std::move(planned));
        }
    }

    void planKnown(const CalListInfo& entry, const CalEventMetaData& row) {
        PlannedEvent planned;
        planned.row = row;
        planned.row.etag = entry.etag;
        planned.rowWrite = RowWrite::kUpdate;
        if (mSnapshot.isLost(row)) {
            SYNC_ERR("%s(%s) has lost its record, it is made again", mKind.itemName, entry.id.c_str());
            planned.row = newRow(entry);
            planned.rowWrite = RowWrite::kReplaceLost;
            if (!convertJson2Record(entry, "json parse fail", &planned.record)) return;
        } else if (row.etag == entry.etag && !mSnapshot.isBehindRow(row)) {
            return;
        } else if (mSnapshot.hasLocalChange(row)) {
            SYNC_ERR("%s(%s) was changed on both sides, the device's change wins", mKind.itemName,
                     entry.id.c_str());
        } else if (mSnapshot.hasUnseenChange(row)) {
            SYNC_ERR("%s(%s) waits until the device's change of an instance has been seen", mKind.itemName,
                     entry.id.c_str());
            return;
        } else {
            planned.expectedVersion = mSnapshot.record(row.event_id)->version;
            if (!convertJson2Record(entry, "convert fail", &planned.record)) return;
        }
        add(std::move(planned));
    }

    [[nodiscard]] const CalEventMetaData* unconfirmedRow(const CalListInfo& entry) const {
        JsonObject* json = jsonObjectOf(entry.json);
        if (!mSnapshot.hasUnconfirmed() || json == nullptr) return nullptr;
        const std::string says = mKind.comparable(json);
        const CalEventMetaData* row = says.empty() ? nullptr : mSnapshot.unconfirmed(sent_mark::of(says));
        return row != nullptr && !mTakenRows.contains(row->event_id) ? row : nullptr;
    }

    // Sent in an earlier run whose answer was lost.
    void planSent(const CalListInfoPtr& entry, const CalEventMetaData& sent) {
        SYNC_INFO("%s(%s) is the device's %d, which was sent before", mKind.itemName, entry->id.c_str(),
                  sent.event_id);
        PlannedEvent planned;
        planned.row = sent;
        planned.row.uri = entry->id;
        planned.row.etag = entry->etag;
        if (const CalRecordState* state = mSnapshot.record(sent.event_id)) {
            // Cancelled instances go up after their series, and were not part of what was sent; neither was a later edit.
            const bool isEdited = sent.etag != sent_mark::kNamesNothing && sent.etag != state->sentMark;
            planned.row.dirty = state->hasDates || isEdited ? 1 : 0;
            planned.row.version = state->version;
        }
        planned.rowWrite = RowWrite::kUpdate;
        planned.ownWrite = false;
        planned.sent = entry;
        mTakenRows.insert(sent.event_id);
        add(std::move(planned));
    }

    void planOrphan(const CalListInfo& entry, int eventId) {
        const CalRecordState& state = *mSnapshot.record(eventId);
        PlannedEvent planned;
        planned.row = newRow(entry);
        planned.row.event_id = eventId;
        planned.row.version = state.version;
        if (!state.isEnginesOwnWrite()) {
            SYNC_ERR("%s(%s) is taken over with the device's change", mKind.itemName, entry.id.c_str());
            planned.row.version = state.syncedVersion;
            planned.row.dirty = 1;
            planned.ownWrite = false;
        } else if (state.etag != entry.etag) {
            planned.expectedVersion = state.version;
            if (!convertJson2Record(entry, "convert fail", &planned.record)) return;
        }
        add(std::move(planned));
    }

    void add(PlannedEvent planned) {
        mPlannedUris.insert(planned.row.uri);
        mPlan.events.push_back(std::move(planned));
    }

    void planInstance(const CalListInfoPtr& entry, const ExceptionInfo& info) {
        const CalEventMetaData* series = seriesRow(info.seriesUri);
        if (series == nullptr && !mPlannedUris.contains(info.seriesUri)) {
            mPlan.waiting.push_back(entry);
            return;
        }
        if (!mPlannedInstances.emplace(info.seriesUri, info.recurrenceId).second) {
            SYNC_ERR("event(%s) is listed twice, ignoring", entry->id.c_str());
            return;
        }
        const int seriesId = series != nullptr ? series->event_id : mSnapshot.orphan(info.seriesUri);

        PlannedInstance planned;
        planned.seriesUri = info.seriesUri;
        planned.row = newRow(*entry);
        planned.row.original_event_id = seriesId;
        planned.row.recurrence_id = info.recurrenceId;
        planned.row.sequence = info.sequence;
        if (const CalEventMetaData* known = knownInstance(*entry, seriesId, info.recurrenceId)) {
            planned.row.recurrence_id = known->recurrence_id;
            if (!planKnownInstance(*entry, info, *known, &planned)) return;
        } else if (const int orphan = mSnapshot.orphan(entry->id)) {
            planOrphanInstance(*entry, info, orphan, &planned);
        }
        if (!planned.rowOnly && series != nullptr &&
            (mSnapshot.hasLocalChange(*series) || mSnapshot.hasUnseenChange(*series))) {
            SYNC_ERR("event(%s) waits until the device's change of its series has been sent",
                     entry->id.c_str());
            return;
        }
        finishInstance(*entry, info, std::move(planned));
    }

    // By the server's id first: the time that it lists the instance with need not be spelt as the device's.
    [[nodiscard]] const CalEventMetaData* knownInstance(const CalListInfo& entry, int seriesId,
                                                        const std::string& recurrenceId) const {
        const CalEventMetaData* row = mSnapshot.rowByUri(entry.id);
        if (row != nullptr && row->original_event_id == seriesId && seriesId != 0) return row;
        return mSnapshot.instanceRow(seriesId, recurrenceId);
    }

    // The series' row, unless this page makes the series anew.
    [[nodiscard]] const CalEventMetaData* seriesRow(const std::string& uri) const {
        const CalEventMetaData* row = mSnapshot.rowByUri(uri);
        const bool usable = row != nullptr && row->original_event_id == 0 && !mSnapshot.isLost(*row);
        return usable ? row : nullptr;
    }

    void planOrphanInstance(const CalListInfo& entry, const ExceptionInfo& info, int eventId,
                            PlannedInstance* planned) const {
        const CalRecordState& state = *mSnapshot.record(eventId);
        const bool edited = !state.isEnginesOwnWrite();
        planned->childId = eventId;
        planned->rowOnly = edited || (info.kind == ExceptionKind::kModified && state.etag == entry.etag);
        if (!planned->rowOnly) return;
        planned->row.event_id = eventId;
        planned->row.version = edited ? state.syncedVersion : state.version;
        planned->row.dirty = edited ? 1 : 0;
    }

    // False: nothing is to be done for it.
    bool planKnownInstance(const CalListInfo& entry, const ExceptionInfo& info, const CalEventMetaData& known,
                           PlannedInstance* planned) const {
        const bool lost = known.event_id > 0 && mSnapshot.isLost(known);
        if (!lost && known.etag == entry.etag && known.uri == entry.id && !mSnapshot.isBehindRow(known))
            return false;
        planned->rowWrite = RowWrite::kUpdate;
        if (mSnapshot.hasLocalChange(known)) {
            SYNC_ERR("event(%s) was changed on both sides, the device's change wins", entry.id.c_str());
            const std::string etag = planned->row.etag;
            planned->row = known;
            planned->row.uri = entry.id;
            planned->row.etag = etag;
            planned->rowOnly = true;
            return true;
        }
        planned->row.exception_type = known.exception_type;
        if (known.event_id > 0 && !lost) planned->childId = known.event_id;
        planned->dropDate = known.event_id < 0 && info.kind == ExceptionKind::kModified;
        return true;
    }

    void finishInstance(const CalListInfo& entry, const ExceptionInfo& info, PlannedInstance planned) {
        if (planned.rowOnly) {
            mPlan.instances.push_back(std::move(planned));
            return;
        }
        if (info.kind == ExceptionKind::kCancelled) {
            planned.addDate = true;
        } else {
            if (!convertJson2Record(entry, "json parse fail. but continue.", &planned.record)) return;
            if (calendar_record_set_str(planned.record.get(), CALENDAR_EVENT_RECURRENCE_ID,
                                        planned.row.recurrence_id.c_str()) != PLATFORM_ERROR_NONE) {
                SYNC_ERR("fail");
                return;
            }
        }
        mPlan.instances.push_back(std::move(planned));
    }

    const CalBookSnapshot& mSnapshot;
    const CalItemKind& mKind;
    CalPagePlan mPlan;
    std::unordered_set<int> mTakenRows;            // of items that an earlier run sent
    std::unordered_set<std::string> mPlannedUris;  // ordinary events that this page writes or takes over
    std::set<std::pair<std::string, std::string>> mPlannedInstances;  // by series and recurrence id
};

}  // namespace

bool needsContent(const CalListInfo& entry, const CalBookSnapshot& snapshot) {
    if (const CalEventMetaData* row = snapshot.rowByUri(entry.id)) {
        return snapshot.isLost(*row) || snapshot.isBehindRow(*row) ||
               (row->etag != entry.etag && !snapshot.hasLocalChange(*row));
    }
    const int orphan = snapshot.orphan(entry.id);
    const CalRecordState* state = orphan != 0 ? snapshot.record(orphan) : nullptr;
    return state == nullptr || (state->isEnginesOwnWrite() && state->etag != entry.etag);
}

CalPagePlan planPage(const CalList& entries, const CalBookSnapshot& snapshot) {
    return Planner(snapshot).plan(entries);
}
