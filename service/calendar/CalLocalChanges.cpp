// The half of CalDataManager that finds out what was changed on the device.
//
// A change is the sync's own when its version is the one stored in the row, or when the record says that the sync wrote it
// last (the row may be missing after a crash; the next download takes such a record over).
#include <unordered_map>

#include "calendar/CalDataManager.h"
#include "calendar/CalRecordAccess.h"
#include "common/SyncLog.h"
#include "common/SyncService.h"

using cal_record::intOf;
using cal_record::textOf;
using sync_result::kFailed;
using sync_result::kOk;

namespace {

// An exception of a changed series.
struct ChangedChild {
    int eventId = 0;
    int version = 0;
    bool ownWrite = false;
    std::string recurrenceId;
};

struct LocalChange {
    int eventId = 0;
    int status = RECORD_UPDATED;
    int version = 0;
    bool ownWrite = false;
    bool knownToSync = false;  // the sync wrote the record at some time
    std::vector<ChangedChild> children;
};

int readChanges(int calendarId, int since, std::vector<LocalChange>* changes, int* current) {
    calendar_list_h rawList = nullptr;
    if (calendar_db_get_changes_by_version(_calendar_event, calendarId, since, &rawList, current) !=
        PLATFORM_ERROR_NONE) {
        SYNC_ERR("db_get_changes_by_version fail");
        return kFailed;
    }
    const CalendarList list(rawList);
    for (int code = calendar_list_first(rawList); code == PLATFORM_ERROR_NONE;
         code = calendar_list_next(rawList)) {
        calendar_record_h record = nullptr;
        LocalChange change;
        int synced = 0;
        if (calendar_list_get_current_record_p(rawList, &record) != PLATFORM_ERROR_NONE) {
            SYNC_ERR("list_get_current_record_p fail");
        } else if (calendar_record_get_int(record, CALENDAR_UPDATED_INFO_ID, &change.eventId) !=
                       PLATFORM_ERROR_NONE ||
                   calendar_record_get_int(record, CALENDAR_UPDATED_INFO_MODIFIED_STATUS, &change.status) !=
                       PLATFORM_ERROR_NONE ||
                   calendar_record_get_int(record, CALENDAR_UPDATED_INFO_VERSION, &change.version) !=
                       PLATFORM_ERROR_NONE ||
                   calendar_record_get_int(record, CALENDAR_UPDATED_INFO_SYNCED_VERSION, &synced) !=
                       PLATFORM_ERROR_NONE) {
            SYNC_ERR("record_get_int fail");
        } else {
            change.ownWrite = synced == change.version;
            change.knownToSync = synced != 0;
            changes->push_back(std::move(change));
        }
    }
    return kOk;
}

void readChildren(LocalChange* change) {
    calendar_record_h raw = nullptr;
    if (calendar_db_get_record(_calendar_event, change->eventId, &raw) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("db_get_record fail");
        return;
    }
    const CalendarRecord record(raw);
    unsigned count = 0;
    if (calendar_record_get_child_record_count(raw, CALENDAR_EVENT_EXCEPTIONS, &count) !=
        PLATFORM_ERROR_NONE) {
        SYNC_ERR("get_child_record_coun fail");
        return;
    }
    for (unsigned i = 0; i < count; ++i) {
        calendar_record_h child = nullptr;
        if (calendar_record_get_child_record_at_p(raw, CALENDAR_EVENT_EXCEPTIONS, i, &child) !=
            PLATFORM_ERROR_NONE) {
            SYNC_ERR("get child fail[%u]", i);
            continue;
        }
        const int version = intOf(child, CALENDAR_EVENT_VERSION);
        change->children.push_back({.eventId = intOf(child, CALENDAR_EVENT_ID),
                                    .version = version,
                                    .ownWrite = intOf(child, CALENDAR_EVENT_SYNCED_VERSION) == version,
                                    .recurrenceId = textOf(child, CALENDAR_EVENT_RECURRENCE_ID)});
    }
}

// Marks the rows of one book; runs inside the store's transaction and touches nothing else.
class Marker {
public:
    Marker(CalMetaDataDBHelper& store, int calendarId, const std::vector<CalEventMetaData>& rows)
        : mStore(store), mCalendarId(calendarId) {
        for (const CalEventMetaData& row : rows) {
            if (row.original_event_id == 0) mRows.emplace(row.event_id, row);
        }
    }

    void mark(const LocalChange& change) {
        const auto known = mRows.find(change.eventId);
        const CalEventMetaData* row = known != mRows.end() ? &known->second : nullptr;
        if (row != nullptr && row->version == change.version) return;
        if (change.status == RECORD_DELETED) {
            if (mStore.updateEventDeleted(change.eventId, 1) != kOk) SYNC_ERR("MetaDB update deleted fail");
        } else if (row != nullptr) {
            if (mStore.updateEventDirty(change.eventId, 1) != kOk) SYNC_ERR("MetaDB update dirty fail");
            markChildren(*row, change);
        } else if (!change.knownToSync) {
            markNew(change);
        }
        // A record of the sync that has no row is taken over by the next download, as changed.
    }

private:
    void markNew(const LocalChange& change) {
        CalEventMetaData row;
        row.event_id = change.eventId;
        row.calendar_id = mCalendarId;
        row.version = change.version;
        row.dirty = 1;
        if (mStore.insertEvent(row) != kOk) {
            SYNC_ERR("MetaDB insert fail");
            return;
        }
        markChildren(row, change);
    }

    void markChildren(const CalEventMetaData& series, const LocalChange& change) {
        for (const ChangedChild& child : change.children) {
            CalEventMetaData row;
            const bool known =
                mStore.getEvent(CalInstanceKey{series.event_id, child.recurrenceId}, &row) == kOk;
            if (child.ownWrite || (known && row.event_id == child.eventId && row.version == child.version))
                continue;
            if (!known) {
                row = CalEventMetaData{.calendar_id = mCalendarId,
                                       .version = child.version,
                                       .original_event_id = series.event_id,
                                       .exception_type = 1,
                                       .sequence = series.sequence,
                                       .recurrence_id = child.recurrenceId,
                                       .uri = series.uri,
                                       .etag = series.etag};
            }
            // A cancelled instance that a user brought back has a record again.
            row.event_id = child.eventId;
            row.dirty = 1;
            if ((known ? mStore.updateExceptionEvent(row) : mStore.insertEvent(row)) != kOk) {
                SYNC_ERR("MetaDB insert fail");
            }
        }
    }

    CalMetaDataDBHelper& mStore;
    const int mCalendarId;
    std::unordered_map<int, CalEventMetaData> mRows;  // ordinary events
};

}  // namespace

bool CalDataManager::setChanged(int calendarId) {
    CalMetaDataDBHelper* metaData = prepared();
    if (metaData == nullptr) return false;
    int since = 0;
    (void)metaData->getCalendarbookVersion(calendarId, &since);
    std::vector<LocalChange> changes;
    int current = 0;
    if (readChanges(calendarId, since, &changes, &current) != kOk) return false;
    for (const LocalChange& change : changes) {
        if (!change.ownWrite) return true;
    }
    return false;
}

int CalDataManager::setCalendarbookChanged(int calendarId) {
    CalMetaDataDBHelper* metaData = prepared();
    if (metaData == nullptr) return kFailed;
    int since = 0;
    (void)metaData->getCalendarbookVersion(calendarId, &since);
    std::vector<LocalChange> changes;
    int current = 0;
    if (readChanges(calendarId, since, &changes, &current) != kOk) return kFailed;
    if (current <= since) return kOk;
    std::erase_if(changes, [](const LocalChange& change) { return change.ownWrite; });
    // Everything is read from the calendar service before the transaction begins.
    for (LocalChange& change : changes) {
        if (change.status != RECORD_DELETED) readChildren(&change);
    }
    std::vector<CalEventMetaData> rows;
    if (!changes.empty() && metaData->getAllEvents(calendarId, &rows) != kOk) return kFailed;

    // The version moves first, but only together with the marks: a walk that was cut off is walked again.
    SyncTransaction transaction(metaData->database());
    if (!transaction.begun() || metaData->updateCalendarbookVersion(calendarId, current) != kOk)
        return kFailed;
    Marker marker(*metaData, calendarId, rows);
    for (const LocalChange& change : changes) marker.mark(change);
    return transaction.commit();
}

int CalDataManager::setAccountChanged(int accountId) {
    std::list<int> calendarIds;
    if (getAllCalendarbookIds(accountId, &calendarIds) != kOk) {
        SYNC_ERR("getCalendarbookIds fail[%d]", accountId);
        return kFailed;
    }
    int result = kOk;
    for (const int calendarId : calendarIds) {
        if (setCalendarbookChanged(calendarId) != kOk) result = kFailed;
    }
    return result;
}

bool CalDataManager::anyBookChanged(int accountId) {
    std::list<int> calendarIds;
    if (getAllCalendarbookIds(accountId, &calendarIds) != kOk) {
        SYNC_ERR("getCalendarbookIds fail[%d]", accountId);
        return false;
    }
    for (const int calendarId : calendarIds) {
        if (setChanged(calendarId)) return true;
    }
    return false;
}

bool CalDataManager::hasSomethingToSend(int accountId) {
    int dirty = 0;
    int deleted = 0;
    if (countPending(accountId, &dirty, &deleted) == kOk && dirty + deleted > 0) return true;
    return anyBookChanged(accountId);
}

void CalDataManager::changedDBCallback(const char* view, void* userData) {
    auto* self = static_cast<CalDataManager*>(userData);
    if (self == nullptr || self->metaData() == nullptr) {
        SYNC_ERR("fail");
        return;
    }
    if (std::string_view(view) == _calendar_book) return;
    std::list<int> accountIds;
    if (self->metaData()->getAllAccountIds(&accountIds) != kOk) return;
    for (const int accountId : accountIds) {
        if (!self->anyBookChanged(accountId)) continue;
        (void)SyncService::getInstance().startUpSync(accountId, VANTOR_PIM_SYNC_TYPE_CALENDAR);
    }
}
