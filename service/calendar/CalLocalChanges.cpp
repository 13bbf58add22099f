// The half of CalManager that finds out what was changed on the device.
//
// A change is the sync's own when its version is the one stored in the row, or when the record says that the sync wrote it
// last (the row may be missing after a crash; the next download takes such a record over).
#include <algorithm>
#include <optional>
#include <unordered_map>

#include "calendar/CalManager.h"
#include "calendar/CalTransaction.h"
#include "common/SyncLog.h"
#include "common/SyncService.h"
#include "platform/calendar_read.h"

using calendar_read::intOf;
using calendar_read::textOf;
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
    int itemId = 0;
    int status = RECORD_UPDATED;
    int version = 0;
    int ownVersion = 0;  // of the item itself, its exceptions left out
    int syncedVersion = 0;
    std::vector<ChangedChild> children;

    [[nodiscard]] bool ownWrite() const { return syncedVersion == version; }
    // The sync wrote the record at some time.
    [[nodiscard]] bool knownToSync() const { return syncedVersion != 0; }
};

bool readChange(calendar_record_h record, LocalChange* change) {
    const std::pair<unsigned, int*> fields[] = {
        {CALENDAR_UPDATED_INFO_ID, &change->itemId},
        {CALENDAR_UPDATED_INFO_MODIFIED_STATUS, &change->status},
        {CALENDAR_UPDATED_INFO_VERSION, &change->version},
        {CALENDAR_UPDATED_INFO_SYNCED_VERSION, &change->syncedVersion},
    };
    for (const auto& [property, value] : fields) {
        if (calendar_record_get_int(record, property, value) != PLATFORM_ERROR_NONE) {
            SYNC_ERR("record_get_int fail");
            return false;
        }
    }
    change->ownVersion = change->version;
    return true;
}

// What others than the sync changed, and whether there was anything at all.
struct Changes {
    std::vector<LocalChange> foreign;
    bool any = false;
    int current = 0;
};

int readChanges(const CalItemKind& kind, int calendarId, int since, Changes* changes) {
    const int code = calendar_read::forEachChange(kind.view, calendarId, since, &changes->current,
                                                  [changes](calendar_record_h record) {
                                                      LocalChange change;
                                                      if (!readChange(record, &change)) return;
                                                      changes->any = true;
                                                      if (!change.ownWrite())
                                                          changes->foreign.push_back(std::move(change));
                                                  });
    if (code == PLATFORM_ERROR_NONE) return kOk;
    SYNC_ERR("db_get_changes_by_version fail");
    return kFailed;
}

void readSeries(LocalChange* change) {
    const auto readChild = [change](calendar_record_h child) {
        const int version = intOf(child, CALENDAR_EVENT_VERSION);
        change->children.push_back({.eventId = intOf(child, CALENDAR_EVENT_ID),
                                    .version = version,
                                    .ownWrite = intOf(child, CALENDAR_EVENT_SYNCED_VERSION) == version,
                                    .recurrenceId = textOf(child, CALENDAR_EVENT_RECURRENCE_ID)});
    };
    bool isFound = false;
    const int code = calendar_read::forEachPart(
        _calendar_event, CALENDAR_EVENT_ID, change->itemId,
        {CALENDAR_EVENT_OWN_VERSION, CALENDAR_EVENT_EXCEPTIONS}, [&](calendar_record_h record) {
            isFound = true;
            change->ownVersion = intOf(record, CALENDAR_EVENT_OWN_VERSION);
            calendar_read::forEachChild(record, CALENDAR_EVENT_EXCEPTIONS, readChild);
        });
    if (code != PLATFORM_ERROR_NONE || !isFound) SYNC_ERR("db_get_record fail");
}

void readAllSeries(std::vector<LocalChange>* changes) {
    // Taking the store's lock costs more than a record: many are read under one, and nothing is written.
    std::optional<CalTransaction> reading;
    if (changes->size() > 1) reading.emplace();
    for (LocalChange& change : *changes) {
        if (change.status != RECORD_DELETED) readSeries(&change);
    }
    if (reading && reading->begun()) (void)reading->commit();
}

// Marks the rows of one book; runs inside the store's transaction and touches nothing else.
class Marker {
public:
    Marker(const CalItemKind& kind, CalItemStore& store, const CalBookMetaData& book,
           const std::vector<CalEventMetaData>& rows)
        : mKind(kind), mStore(store), mBook(book), mIsReadOnly(CalManager::isReadOnly(book.calendar_id)) {
        for (const CalEventMetaData& row : rows) {
            if (row.original_event_id == 0) {
                mRows.emplace(row.event_id, row);
            } else {
                mInstances.emplace(std::pair(row.original_event_id, row.recurrence_id), row);
            }
        }
    }

    [[nodiscard]] int mark(const LocalChange& change) {
        const auto known = mRows.find(change.itemId);
        CalEventMetaData* row = known != mRows.end() ? &known->second : nullptr;
        if (row != nullptr && row->version == change.version) return kOk;
        if (mIsReadOnly) return pass(change, row);
        if (change.status == RECORD_DELETED)
            return logged(mStore.markDeleted(change.itemId, 1), "MetaDB update deleted fail");
        if (row != nullptr) return markChanged(change, *row);
        // A record of the sync that has no row is taken over by the next download, as changed.
        return change.knownToSync() ? kOk : markNew(change);
    }

private:
    static int logged(int result, const char* failureText) {
        if (result != kOk) SYNC_ERR_AS("mark", "%s", failureText);
        return result;
    }

    // Nobody will take it. The item counts as seen, so that the server's next change of it comes down.
    int pass(const LocalChange& change, CalEventMetaData* row) {
        SYNC_ERR("%s(%s) is read-only, the device's change of %s(%d) is not sent", mKind.bookName,
                 mBook.uri.c_str(), mKind.itemName, change.itemId);
        if (row == nullptr || change.status == RECORD_DELETED) return kOk;
        row->version = change.version;
        return logged(mStore.updateItem(*row), "MetaDB update dirty fail");
    }

    int markChanged(const LocalChange& change, CalEventMetaData& row) {
        if (change.ownVersion > std::max(row.version, change.syncedVersion)) row.dirty = 1;
        row.version = change.version;
        const int result = logged(mStore.updateItem(row), "MetaDB update dirty fail");
        return result == kOk ? markChildren(row, change) : result;
    }

    int markNew(const LocalChange& change) {
        CalEventMetaData row;
        row.event_id = change.itemId;
        row.calendar_id = mBook.calendar_id;
        row.version = change.version;
        row.dirty = 1;
        const int result = logged(mStore.insertItem(row), "MetaDB insert fail");
        return result == kOk ? markChildren(row, change) : result;
    }

    int markChildren(const CalEventMetaData& series, const LocalChange& change) {
        for (const ChangedChild& child : change.children) {
            const auto known = mInstances.find({series.event_id, child.recurrenceId});
            const bool isKnown = known != mInstances.end();
            const bool isSeen =
                isKnown && known->second.event_id == child.eventId && known->second.version >= child.version;
            if (child.ownWrite || isSeen) continue;
            CalEventMetaData row = isKnown ? known->second
                                           : CalEventMetaData{.calendar_id = mBook.calendar_id,
                                                              .original_event_id = series.event_id,
                                                              .exception_type = 1,
                                                              .sequence = series.sequence,
                                                              .recurrence_id = child.recurrenceId,
                                                              .uri = series.uri,
                                                              .etag = series.etag};
            // A cancelled instance that a user brought back has a record again.
            row.event_id = child.eventId;
            row.version = child.version;
            row.dirty = 1;
            const int result = isKnown ? mStore.updateItem(row) : mStore.insertItem(row);
            if (logged(result, "MetaDB insert fail") != kOk) return result;
        }
        return kOk;
    }

    const CalItemKind& mKind;
    CalItemStore& mStore;
    const CalBookMetaData& mBook;
    const bool mIsReadOnly;
    std::unordered_map<int, CalEventMetaData> mRows;                     // ordinary items
    std::map<std::pair<int, std::string>, CalEventMetaData> mInstances;  // by series and recurrence id
};

}  // namespace

bool CalManager::setChanged(int calendarId) {
    CalItemStore* store = prepared();
    if (store == nullptr) return false;
    int since = 0;
    (void)store->books().getVersion(calendarId, &since);
    Changes changes;
    return readChanges(mKind, calendarId, since, &changes) == kOk && !changes.foreign.empty();
}

int CalManager::passOwnWrites(int calendarId) {
    CalItemStore* store = prepared();
    int since = 0;
    Changes changes;
    if (store == nullptr || store->books().getVersion(calendarId, &since) != kOk ||
        readChanges(mKind, calendarId, since, &changes) != kOk) {
        return kFailed;
    }
    return !changes.any || !changes.foreign.empty()
               ? kOk
               : store->books().updateVersion(calendarId, changes.current);
}

int CalManager::setBookChanged(int calendarId) {
    CalItemStore* store = prepared();
    CalBookMetaData book;
    if (store == nullptr || store->books().get(calendarId, &book) != kOk) return kFailed;
    Changes changes;
    if (readChanges(mKind, calendarId, book.sync_version, &changes) != kOk) return kFailed;
    // A store that nobody wrote stays as it is.
    if (!changes.any || changes.current <= book.sync_version) return kOk;
    // Everything is read from the calendar service before the transaction begins.
    if (mKind.hasSeries()) readAllSeries(&changes.foreign);
    std::vector<CalEventMetaData> rows;
    if (!changes.foreign.empty() && store->getAllItems(calendarId, &rows) != kOk) return kFailed;
    Marker marker(mKind, *store, book, rows);

    // The version moves first, but only together with the marks: a walk that was cut off is walked again.
    SyncTransaction transaction(store->database());
    if (!transaction.begun() || store->books().updateVersion(calendarId, changes.current) != kOk)
        return kFailed;
    for (const LocalChange& change : changes.foreign) {
        if (marker.mark(change) != kOk) return kFailed;
    }
    return transaction.commit();
}

int CalManager::setAccountChanged(int accountId) {
    CalItemStore* store = prepared();
    std::list<int> calendarIds;
    if (store == nullptr || store->books().getIds(accountId, &calendarIds) != kOk) {
        SYNC_ERR("%s[%d]", mKind.texts.bookIds, accountId);
        return kFailed;
    }
    int result = kOk;
    for (const int calendarId : calendarIds) {
        if (setBookChanged(calendarId) == kOk) continue;
        result = kFailed;
        SYNC_ERR("%s[%d]", mKind.texts.bookChanged, calendarId);
    }
    return result;
}

bool CalManager::anyBookChanged(int accountId) {
    CalItemStore* store = prepared();
    std::list<int> calendarIds;
    if (store == nullptr || store->books().getIds(accountId, &calendarIds) != kOk) {
        SYNC_ERR("%s[%d]", mKind.texts.bookIds, accountId);
        return false;
    }
    return std::any_of(calendarIds.begin(), calendarIds.end(), [this](int id) { return setChanged(id); });
}

int CalManager::countPending(int accountId, int* dirty, int* deleted) {
    CalItemStore* store = prepared();
    return store == nullptr ? kFailed : store->countPending(accountId, dirty, deleted);
}

bool CalManager::hasSomethingToSend(int accountId) {
    int dirty = 0;
    int deleted = 0;
    if (countPending(accountId, &dirty, &deleted) == kOk && dirty + deleted > 0) return true;
    return anyBookChanged(accountId);
}

void CalManager::sendChanges() {
    std::list<int> accountIds;
    CalItemStore* store = prepared();
    if (store == nullptr || store->books().getAccountIds(&accountIds) != kOk) return;
    for (const int accountId : accountIds) {
        if (!anyBookChanged(accountId)) continue;
        (void)SyncService::getInstance().startUpSync(accountId, VANTOR_PIM_SYNC_TYPE_CALENDAR);
    }
}
