#include "calendar/CalDataManager.h"

#include <utility>

#include "calendar/CalItemWriter.h"
#include "common/SyncLog.h"
#include "platform/calendar_read.h"

using calendar_read::intOf;
using sync_result::kFailed;
using sync_result::kOk;

namespace {

// Loads a book's snapshot and writes one item as a page of its own.
int writeOne(CalMetaDataDBHelper& metaData, const CalBookMetaData& book, const CalListInfoPtr& event) {
    CalBookSnapshot snapshot(kEventKind);
    if (snapshot.load(metaData, book) != kOk) return kFailed;
    CalItemWriter writer(&metaData, &snapshot);
    CalListPage page;
    page.entries.push_back(event);
    const int written = writer.writePage(page);
    const int waited = writer.writeWaiting();
    return written != kOk ? written : waited;
}

}  // namespace

CalDataManager& CalDataManager::getInstance() {
    static CalDataManager* const instance = new CalDataManager;
    return *instance;
}

CalDataManager::~CalDataManager() {
    if (mpMetaData) {
        calendar_db_remove_changed_cb(_calendar_event, changedDBCallback, this);
        calendar_db_remove_changed_cb(_calendar_book, changedDBCallback, this);
    }
    if (mConnected) calendar_disconnect();
}

int CalDataManager::prepareSync() {
    const std::lock_guard lock(mPrepareMutex);
    if (mpMetaData) return kOk;
    if (!mConnected) {
        if (const int code = calendar_connect_with_flags(0); code != PLATFORM_ERROR_NONE) {
            SYNC_ERR("calendar_connect_with_flags fail(%d)", code);
            return kFailed;
        }
        mConnected = true;
    }
    if (calendar_db_add_changed_cb(_calendar_event, changedDBCallback, this) != PLATFORM_ERROR_NONE ||
        calendar_db_add_changed_cb(_calendar_book, changedDBCallback, this) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("add_changed_cb fail");
        calendar_db_remove_changed_cb(_calendar_event, changedDBCallback, this);
        return kFailed;
    }
    mpMetaData = std::make_unique<CalMetaDataDBHelper>();
    if (mpMetaData->openDb() != kOk) SYNC_ERR("MetaDB fail, it is opened once it can be, ignoring");
    return kOk;
}

bool CalDataManager::isBookChanged(int accountId, const CalListInfo& entry) {
    std::string etag;
    return getCalendarbookEtag(accountId, entry.id, &etag) != kOk || etag != entry.etag;
}

int CalDataManager::deleteBookRows(CalItemStore& store, int accountId,
                                   const std::vector<int>& /*calendarIds*/) {
    const int result = store.books().removeAccount(accountId);
    if (result != kOk) SYNC_ERR("metaDB deleteAccount fail(%d)", result);
    return result;
}

int CalDataManager::updateCalendarbookUri(int calendarId, const std::string& uri, const std::string& etag) {
    CalMetaDataDBHelper* metaData = preparedStore();
    if (metaData == nullptr) return kFailed;
    if (metaData->books().updateUri(calendarId, uri, etag) != kOk) {
        SYNC_ERR("metaDB updatecalendarbook fail");
        return kFailed;
    }
    return kOk;
}

int CalDataManager::getCalendarbookEtag(int accountId, const std::string& uri, std::string* etag) {
    CalMetaDataDBHelper* metaData = preparedStore();
    CalBookMetaData row;
    if (metaData == nullptr || metaData->getCalendarbook(accountId, uri, &row) != kOk) return kFailed;
    *etag = row.etag;
    return kOk;
}

void CalDataManager::changedDBCallback(const char* view, void* userData) {
    auto* self = static_cast<CalDataManager*>(userData);
    if (self == nullptr || self->metaData() == nullptr) {
        SYNC_ERR("fail");
        return;
    }
    if (std::string_view(view) != _calendar_book) self->sendChanges();
}

int CalDataManager::insertEvent(int accountId, const std::string& bookUri, const CalListInfoPtr& event) {
    CalMetaDataDBHelper* metaData = preparedStore();
    if (metaData == nullptr) return kFailed;
    CalBookMetaData book;
    if (metaData->getCalendarbook(accountId, bookUri, &book) != kOk) {
        SYNC_ERR("not prepare sync");
        return kFailed;
    }
    return writeOne(*metaData, book, event);
}

int CalDataManager::updateEvent(int accountId, const std::string& bookUri, const CalListInfoPtr& event) {
    CalMetaDataDBHelper* metaData = preparedStore();
    if (metaData == nullptr) return kFailed;
    CalBookMetaData book;
    CalEventMetaData row;
    if (metaData->getCalendarbook(accountId, bookUri, &book) != kOk ||
        metaData->getEvent(book.calendar_id, event->id, &row) != kOk) {
        SYNC_ERR("get fail");
        return kFailed;
    }
    return writeOne(*metaData, book, event);
}

int CalDataManager::deleteEvent(int calendarId, const std::string& uri) {
    CalMetaDataDBHelper* metaData = preparedStore();
    if (metaData == nullptr) return kFailed;
    CalEventMetaData row;
    if (metaData->getEvent(calendarId, uri, &row) != kOk) {
        SYNC_ERR("get fail");
        return kFailed;
    }
    if (row.event_id > 0) {
        const int code = calendar_db_delete_record(_calendar_event, row.event_id, {.by_sync = true});
        if (code != PLATFORM_ERROR_NONE && code != PLATFORM_ERROR_NOT_FOUND) {
            SYNC_ERR("db_delete_records fail");
            return kFailed;
        }
    }
    return metaData->deleteEvent(calendarId, uri);
}

int CalDataManager::getEvent(int eventId, CalendarRecord* record) {
    return getRecord(eventId, record);
}

int CalDataManager::updateEventUri(int eventId, const std::string& uri, const std::string& etag) {
    return updateRow(
        [eventId](CalMetaDataDBHelper& store, CalEventMetaData* row) { return store.getEvent(eventId, row); },
        [](CalMetaDataDBHelper& store, const CalEventMetaData& row) { return store.updateEvent(row); }, uri,
        etag);
}

int CalDataManager::updateExceptionEventUri(int originalEventId, const std::string& recurrenceId,
                                            const std::string& uri, const std::string& etag) {
    return updateRow(
        [&](CalMetaDataDBHelper& store, CalEventMetaData* row) {
            return store.getEvent(CalInstanceKey{originalEventId, recurrenceId}, row);
        },
        [](CalMetaDataDBHelper& store, const CalEventMetaData& row) {
            return store.updateExceptionEvent(row);
        },
        uri, etag);
}

template <class Read, class Write>
int CalDataManager::updateRow(Read read, Write write, const std::string& uri, const std::string& etag) {
    CalMetaDataDBHelper* metaData = preparedStore();
    if (metaData == nullptr) return kFailed;
    SyncTransaction transaction(metaData->database());
    CalEventMetaData row;
    if (!transaction.begun() || read(*metaData, &row) != kOk) {
        SYNC_ERR("metaDB getEvent fail");
        return kFailed;
    }
    row.uri = uri;
    row.etag = etag;
    if (write(*metaData, row) != kOk) {
        SYNC_ERR("metaDB updateEvent fail");
        return kFailed;
    }
    return transaction.commit();
}

// --- forwards to the metadata store

template <class... Params, class... Args>
int CalDataManager::forward(int (CalMetaDataDBHelper::*operation)(Params...), Args&&... args) {
    CalMetaDataDBHelper* metaData = preparedStore();
    return metaData == nullptr ? kFailed : (metaData->*operation)(std::forward<Args>(args)...);
}

int CalDataManager::getCalendarbookUri(int calendarId, std::string* uri) {
    return forward(&CalMetaDataDBHelper::getCalendarbookUri, calendarId, uri);
}
int CalDataManager::getCalendarbookId(int accountId, const std::string& uri, int* calendarId) {
    return forward(&CalMetaDataDBHelper::getCalendarbookId, accountId, uri, calendarId);
}
int CalDataManager::getAllCalendarbookUri(int accountId, std::list<std::string>* uris) {
    return forward(&CalMetaDataDBHelper::getAllCalendarbookUri, accountId, uris);
}
int CalDataManager::getAllCalendarbookIds(int accountId, std::list<int>* calendarIds) {
    return forward(&CalMetaDataDBHelper::getAllCalendarbookIds, accountId, calendarIds);
}
int CalDataManager::getAllDirtyCalendarbookIds(int accountId, std::list<int>* calendarIds) {
    return forward(&CalMetaDataDBHelper::getAllDirtyCalendarbookIds, accountId, calendarIds);
}
int CalDataManager::getAllDeletedCalendarbookIds(int accountId, std::list<int>* calendarIds) {
    return forward(&CalMetaDataDBHelper::getAllDeletedCalendarbookIds, accountId, calendarIds);
}
int CalDataManager::clearDirtyCalendarbook(int calendarId) {
    return forward(&CalMetaDataDBHelper::updateCalendarbookDirty, calendarId, 0);
}
int CalDataManager::clearDeletedCalendarbook(int calendarId) {
    return forward(&CalMetaDataDBHelper::updateCalendarbookDeleted, calendarId, 0);
}
int CalDataManager::getEventUri(int eventId, std::string* uri) {
    return forward(&CalMetaDataDBHelper::getEventUri, eventId, uri);
}
int CalDataManager::getEventId(int calendarId, const std::string& uri, int* eventId) {
    return forward(&CalMetaDataDBHelper::getEventId, calendarId, uri, eventId);
}
int CalDataManager::getEventEtag(int eventId, std::string* etag) {
    CalMetaDataDBHelper* metaData = preparedStore();
    return metaData == nullptr ? kFailed : metaData->getEventEtag(eventId, etag);
}
int CalDataManager::getEventEtag(int calendarId, const std::string& uri, std::string* etag) {
    CalMetaDataDBHelper* metaData = preparedStore();
    return metaData == nullptr ? kFailed : metaData->getEventEtag(calendarId, uri, etag);
}
int CalDataManager::getAllDirtyEventIds(const std::string& bookUri, std::list<int>* eventIds) {
    return forward(&CalMetaDataDBHelper::getAllDirtyEventIds, bookUri, eventIds);
}
int CalDataManager::getAllDeletedEventIds(const std::string& bookUri, std::list<int>* eventIds) {
    return forward(&CalMetaDataDBHelper::getAllDeletedEventIds, bookUri, eventIds);
}
int CalDataManager::getAllEventUri(const std::string& bookUri, std::list<std::string>* uris) {
    return forward(&CalMetaDataDBHelper::getAllEventUri, bookUri, uris);
}
int CalDataManager::clearDirtyEvent(int eventId) {
    return forward(&CalMetaDataDBHelper::updateEventDirty, eventId, 0);
}
int CalDataManager::clearDeletedEvent(int eventId) {
    return forward(&CalMetaDataDBHelper::updateEventDeleted, eventId, 0);
}
int CalDataManager::hasExceptionEvent(int originalEventId) {
    return forward(&CalMetaDataDBHelper::hasExceptionEvent, originalEventId);
}
int CalDataManager::getAllExceptionEvents(int originalEventId, std::list<std::string>* recurrenceIds) {
    return forward(&CalMetaDataDBHelper::getAllExceptionEvents, originalEventId, recurrenceIds);
}
int CalDataManager::getExceptionEventUri(int originalEventId, const std::string& recurrenceId,
                                         std::string* uri) {
    CalEventMetaData row;
    CalMetaDataDBHelper* metaData = preparedStore();
    if (metaData == nullptr || metaData->getEvent(CalInstanceKey{originalEventId, recurrenceId}, &row) != kOk)
        return kFailed;
    *uri = row.uri;
    return kOk;
}
int CalDataManager::getExceptionEventEtag(int originalEventId, const std::string& recurrenceId,
                                          std::string* etag) {
    CalEventMetaData row;
    CalMetaDataDBHelper* metaData = preparedStore();
    if (metaData == nullptr || metaData->getEvent(CalInstanceKey{originalEventId, recurrenceId}, &row) != kOk)
        return kFailed;
    *etag = row.etag;
    return kOk;
}

int findList(calendar_list_h list, unsigned idProperty, int id) {
    if (list == nullptr) {
        SYNC_ERR("invalid input");
        return PLATFORM_ERROR_INVALID_PARAMETER;
    }
    for (int code = calendar_list_first(list); code == PLATFORM_ERROR_NONE; code = calendar_list_next(list)) {
        calendar_record_h record = nullptr;
        if (calendar_list_get_current_record_p(list, &record) != PLATFORM_ERROR_NONE) break;
        if (intOf(record, idProperty) == id) return PLATFORM_ERROR_NONE;
    }
    return PLATFORM_ERROR_NOT_FOUND;
}
