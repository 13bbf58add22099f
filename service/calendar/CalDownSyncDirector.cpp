#include "calendar/CalDownSyncDirector.h"

#include <algorithm>
#include <unordered_map>
#include <unordered_set>

#include "calendar/CalDataManager.h"
#include "calendar/CalEventWriter.h"
#include "common/Account.h"
#include "common/DeletionProof.h"
#include "common/PageReader.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"

using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kStopped;
using sync_result::kTokenFailed;

CalDownSyncDirector::CalDownSyncDirector(Account* account, IStopQuery* stopQuery)
    : mpAccount(account),
      mpStopQuery(stopQuery),
      mpShare(std::make_shared<HttpShare>()),
      mBookListTask(account, this, mpShare),
      mEventListTask(account, this, mpShare) {}

CalDownSyncDirector::~CalDownSyncDirector() = default;

int CalDownSyncDirector::run() {
    mFailure.clear();
    return syncCalendar();
}

std::string CalDownSyncDirector::lastFailure() const {
    return mFailure;
}

int CalDownSyncDirector::onProgress(double, double, double, double) {
    return isStopped() ? 1 : 0;
}

bool CalDownSyncDirector::isStopped() const {
    return mpStopQuery != nullptr && mpStopQuery->isStopped();
}

int CalDownSyncDirector::fail(int result, const std::string& text) {
    if (isStopped()) return kStopped;  // a transfer that the stop cut off is no failure
    if (result < 0 && mFailure.empty()) {
        mFailure = result == kTokenFailed ? "the account's authorisation is no longer accepted" : text;
    }
    return result;
}

int CalDownSyncDirector::syncCalendar() {
    CalDataManager& manager = CalDataManager::getInstance();
    const int accountId = mpAccount->getAccountId();
    if (manager.reconcileCalendarbooks(accountId) != kOk)
        return fail(kFailed, "the device's stores cannot be read");

    BookPlan plan;
    if (const int result = fetchCalendars(&plan.listed); result != kOk) return result;
    if (const int result = planBooks(&plan); result != kOk) return result;
    if (const int result = proveBookDeletions(&plan); result != kOk) return result;
    if (isStopped()) return kStopped;

    int first = deleteBooks(plan);
    if (!plan.changed.empty() && manager.updateCalendarbooks(accountId, plan.changed) != kOk) {
        SYNC_ERR("updateCalendarbooks fail");
        first = fail(kFailed, "a calendar could not be updated on the device");
    }
    if (const int result = syncEvents(plan.known, EventPageMode::kComparing); result != kOk) {
        if (result == kStopped || result == kTokenFailed) return result;
        if (first == kOk) first = result;
    }
    if (isStopped()) return kStopped;
    if (const int result = insertBooks(plan); result != kOk && first == kOk) first = result;
    if (const int result = syncEvents(plan.fresh, EventPageMode::kFirstTime); result != kOk) {
        if (result == kStopped || result == kTokenFailed) return result;
        if (first == kOk) first = result;
    }
    return first;
}

int CalDownSyncDirector::fetchCalendars(CalListPage* listed) {
    CalListPage all;
    std::unordered_set<std::string> ids;
    const int result = readPages<CalListPage>(
        [this](const std::string& token, CalListPage* page) { return mBookListTask.getList(token, page); },
        [&](CalListPage& page) {
            for (CalListInfoPtr& entry : page.entries) {
                if (ids.insert(entry->id).second) all.entries.push_back(std::move(entry));
            }
            all.idOnly.insert(all.idOnly.end(), page.idOnly.begin(), page.idOnly.end());
            all.unreadable += page.unreadable;
            return kOk;
        },
        [this] { return isStopped(); });
    if (result != kOk) {
        SYNC_ERR("getList fail");
        return fail(result, "the list of calendars: " + mBookListTask.failure());
    }
    *listed = std::move(all);
    return kOk;
}

int CalDownSyncDirector::planBooks(BookPlan* plan) {
    CalDataManager& manager = CalDataManager::getInstance();
    std::list<std::string> uris;
    if (manager.getAllCalendarbookUri(mpAccount->getAccountId(), &uris) != kOk) {
        return fail(kFailed, "the device's stores cannot be read");
    }
    std::unordered_set<std::string> known(uris.begin(), uris.end());
    for (const CalListInfoPtr& entry : plan->listed.entries) {
        if (known.erase(entry->id) == 0) {
            plan->fresh.push_back(entry);
            continue;
        }
        plan->known.push_back(entry);
        std::string etag;
        if (manager.getCalendarbookEtag(mpAccount->getAccountId(), entry->id, &etag) != kOk ||
            etag != entry->etag) {
            plan->changed.push_back(entry);
        }
    }
    for (const std::string& id : plan->listed.idOnly) known.erase(id);
    plan->gone.assign(known.begin(), known.end());
    if (plan->listed.unreadable > 0) plan->gone.clear();
    return kOk;
}

int CalDownSyncDirector::proveBookDeletions(BookPlan* plan) {
    if (plan->gone.empty()) return kOk;
    CalDataManager& manager = CalDataManager::getInstance();
    const auto countItems = [&manager](const std::string& uri) {
        std::list<std::string> events;
        (void)manager.getAllEventUri(uri, &events);
        return events.size() + 1;
    };
    size_t gone = 0;
    for (const std::string& uri : plan->gone) gone += countItems(uri);
    size_t known = gone;
    for (const CalListInfoPtr& entry : plan->known) known += countItems(entry->id);
    if (!deletion_proof::needsSecondLook(known, gone, plan->known.empty())) return kOk;

    SYNC_INFO("%zu calendars are no longer listed, the list is fetched again", plan->gone.size());
    CalListPage again;
    if (const int result = fetchCalendars(&again); result != kOk) return result;
    std::unordered_set<std::string> listed(again.idOnly.begin(), again.idOnly.end());
    for (const CalListInfoPtr& entry : again.entries) listed.insert(entry->id);
    std::erase_if(plan->gone,
                  [&](const std::string& uri) { return again.unreadable > 0 || listed.contains(uri); });
    return kOk;
}

int CalDownSyncDirector::deleteBooks(const BookPlan& plan) {
    int first = kOk;
    for (const std::string& uri : plan.gone) {
        SYNC_INFO("calendar(%s) is no longer on the server", uri.c_str());
        if (CalDataManager::getInstance().deleteCalendarbook(mpAccount->getAccountId(), uri) != kOk) {
            first = fail(kFailed, "a calendar could not be deleted on the device");
        }
    }
    return first;
}

int CalDownSyncDirector::insertBooks(const BookPlan& plan) {
    int first = kOk;
    for (const CalListInfoPtr& entry : plan.fresh) {
        if (CalDataManager::getInstance().insertCalendarbook(mpAccount->getAccountId(), *entry) != kOk) {
            SYNC_ERR("insertCalendarbooks fail");
            first = fail(kFailed, "a calendar could not be written to the device");
        }
    }
    return first;
}

int CalDownSyncDirector::syncEvents(const CalList& calendars, EventPageMode mode) {
    int first = kOk;
    for (const CalListInfoPtr& entry : calendars) {
        const int result = syncEventPage(entry->id, mode);
        if (result == kStopped || result == kTokenFailed) return result;
        if (result == kOk) continue;
        if (first == kOk) first = result;
        if (mEventListTask.unreachable()) break;
    }
    return first;
}

int CalDownSyncDirector::syncEventPage(const std::string& calendarUri, EventPageMode mode) {
    CalMetaDataDBHelper* metaData = CalDataManager::getInstance().metaData();
    CalBookMetaData book;
    CalBookSnapshot snapshot;
    if (metaData->getCalendarbook(mpAccount->getAccountId(), calendarUri, &book) != kOk ||
        snapshot.load(*metaData, book) != kOk) {
        return fail(kFailed, "the device's stores cannot be read");
    }
    CalEventWriter writer(metaData, &snapshot);
    int written = kOk;
    const int fetched = readPages<CalListPage>(
        [&](const std::string& token, CalListPage* page) {
            return mEventListTask.getAllPage(calendarUri, token, page);
        },
        [&](const CalListPage& page) {
            if (writer.writePage(page) != kOk) written = kFailed;
            return kOk;
        },
        [this] { return isStopped(); });
    if (fetched != kOk) {
        if (fetched != kStopped) SYNC_ERR("getListPage fail");
        return fail(fetched, "calendar " + calendarUri + ": " + mEventListTask.failure());
    }
    if (writer.writeWaiting() != kOk) written = kFailed;
    if (mode == EventPageMode::kComparing && writer.listIsProof()) {
        const size_t gone = writer.unlisted().size();
        const size_t known = snapshot.knownToServer().size();
        if (deletion_proof::needsSecondLook(known, gone, gone == known)) {
            SYNC_INFO("%zu of %zu events are no longer listed, the list is fetched again", gone, known);
            if (const int result = secondLook(calendarUri, &writer); result != kOk) return result;
        }
        if (writer.listIsProof() && writer.deleteUnlisted() != kOk) written = kFailed;
    }
    const CalEventWriter::Counts& counts = writer.counts();
    // What the sync wrote itself is examined now, so that no later look goes through it again.
    const bool wrote = counts.inserted + counts.updated + counts.deleted > 0;
    if (wrote && CalDataManager::getInstance().setCalendarbookChanged(book.calendar_id) != kOk)
        written = kFailed;
    SYNC_INFO("calendar(%s): %d inserted, %d updated, %d deleted", calendarUri.c_str(), counts.inserted,
              counts.updated, counts.deleted);
    return written == kOk
               ? kOk
               : fail(kFailed, "calendar " + calendarUri + ": events could not be written to the device");
}

int CalDownSyncDirector::secondLook(const std::string& calendarUri, CalEventWriter* writer) {
    const int result = readPages<CalListPage>(
        [&](const std::string& token, CalListPage* page) {
            return mEventListTask.getListPage(calendarUri, token, page);
        },
        [writer](const CalListPage& page) {
            writer->markListed(page);
            return kOk;
        },
        [this] { return isStopped(); });
    if (result == kOk) return kOk;
    if (result != kStopped) SYNC_ERR("getListPage fail");
    return fail(result, "calendar " + calendarUri + ": " + mEventListTask.failure());
}
