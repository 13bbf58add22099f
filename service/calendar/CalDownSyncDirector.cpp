#include "calendar/CalDownSyncDirector.h"

#include <algorithm>
#include <unordered_set>

#include "calendar/CalItemWriter.h"
#include "common/Account.h"
#include "common/DeletionProof.h"
#include "common/PageReader.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"

using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kStopped;
using sync_result::kTokenFailed;

namespace {

constexpr const char* kStoresUnreadable = "the device's stores cannot be read";

std::string listFailure(CalSyncSide& side) {
    return std::string("the list of ") + side.manager().kind().bookName + "s: " + side.failure();
}

}  // namespace

CalDownSyncDirector::CalDownSyncDirector(Account* account, IStopQuery* stopQuery)
    : mpAccount(account),
      mpStopQuery(stopQuery),
      mpShare(std::make_shared<HttpShare>()),
      mEvents(account, this, mpShare),
      mTodos(account, this, mpShare),
      mProgress(account->getAccountId(), VANTOR_PIM_SYNC_TYPE_CALENDAR) {}

CalDownSyncDirector::~CalDownSyncDirector() = default;

int CalDownSyncDirector::run() {
    mFailure.clear();
    mProgress.beginRun();
    const int calendars = syncCalendar();
    if (calendars == kStopped || calendars == kTokenFailed || (calendars != kOk && mEvents.unreachable()))
        return calendars;
    const int tasks = syncTodo();
    return tasks == kStopped || tasks == kTokenFailed || calendars == kOk ? tasks : calendars;
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

int CalDownSyncDirector::syncBooks(CalSyncSide& side) {
    CalManager& manager = side.manager();
    const int accountId = mpAccount->getAccountId();
    // The device's changes are marked before anything is compared, so that no write of ours can hide one.
    if (manager.reconcileBooks(accountId) != kOk || manager.setAccountChanged(accountId) != kOk)
        return fail(kFailed, kStoresUnreadable);

    BookPlan plan;
    if (const int result = fetchBooks(side, &plan.listed); result != kOk) {
        if (!side.isMissing()) return fail(result, listFailure(side));
        SYNC_INFO("the server has no %ss", manager.kind().bookName);
        return kOk;
    }
    if (const int result = planBooks(side, &plan); result != kOk) return result;
    if (const int result = proveBookDeletions(side, &plan); result != kOk) return result;
    if (isStopped()) return kStopped;

    int first = deleteBooks(side, plan);
    if (!plan.changed.empty() && manager.updateBooks(accountId, plan.changed) != kOk) {
        SYNC_ERR("updateCalendarbooks fail");
        first = fail(kFailed,
                     std::string("a ") + manager.kind().bookName + " could not be updated on the device");
    }
    if (const int result = syncItems(side, plan.known, PageMode::kComparing); result != kOk) {
        if (result == kStopped || result == kTokenFailed) return result;
        if (first == kOk) first = result;
    }
    if (isStopped()) return kStopped;
    if (const int result = insertBooks(side, plan); result != kOk && first == kOk) first = result;
    if (const int result = syncItems(side, plan.fresh, PageMode::kFirstTime); result != kOk) {
        if (result == kStopped || result == kTokenFailed) return result;
        if (first == kOk) first = result;
    }
    return first;
}

int CalDownSyncDirector::fetchBooks(CalSyncSide& side, CalListPage* listed) {
    CalListPage all;
    std::unordered_set<std::string> ids;
    const int result = readPages<CalListPage>(
        [&side](const std::string& token, CalListPage* page) { return side.getBooks(token, page); },
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
        return result;
    }
    *listed = std::move(all);
    return kOk;
}

int CalDownSyncDirector::planBooks(CalSyncSide& side, BookPlan* plan) {
    CalManager& manager = side.manager();
    CalItemStore* store = manager.prepared();
    const int accountId = mpAccount->getAccountId();
    std::list<std::string> uris;
    if (store == nullptr || store->books().getUris(accountId, &uris) != kOk)
        return fail(kFailed, kStoresUnreadable);
    std::unordered_set<std::string> known(uris.begin(), uris.end());
    for (const CalListInfoPtr& entry : plan->listed.entries) {
        if (known.erase(entry->id) == 0) {
            plan->fresh.push_back(entry);
            continue;
        }
        plan->known.push_back(entry);
        if (manager.isBookChanged(accountId, *entry)) plan->changed.push_back(entry);
    }
    for (const std::string& id : plan->listed.idOnly) known.erase(id);
    plan->gone.assign(known.begin(), known.end());
    if (plan->listed.unreadable > 0) plan->gone.clear();
    return kOk;
}

int CalDownSyncDirector::proveBookDeletions(CalSyncSide& side, BookPlan* plan) {
    if (plan->gone.empty()) return kOk;
    CalItemStore* store = side.manager().prepared();
    if (store == nullptr) return kFailed;
    const auto countItems = [&](const std::string& uri) {
        CalBookMetaData book;
        std::vector<CalEventMetaData> items;
        if (store->books().get(mpAccount->getAccountId(), uri, &book) == kOk)
            (void)store->getAllItems(book.calendar_id, &items);
        return items.size() + 1;
    };
    size_t gone = 0;
    for (const std::string& uri : plan->gone) gone += countItems(uri);
    size_t known = gone;
    for (const CalListInfoPtr& entry : plan->known) known += countItems(entry->id);
    if (!deletion_proof::needsSecondLook(known, gone, plan->known.empty())) return kOk;

    SYNC_INFO("%zu %ss are no longer listed, the list is fetched again", plan->gone.size(),
              side.manager().kind().bookName);
    CalListPage again;
    if (const int result = fetchBooks(side, &again); result != kOk) return fail(result, listFailure(side));
    std::unordered_set<std::string> listed(again.idOnly.begin(), again.idOnly.end());
    for (const CalListInfoPtr& entry : again.entries) listed.insert(entry->id);
    std::erase_if(plan->gone,
                  [&](const std::string& uri) { return again.unreadable > 0 || listed.contains(uri); });
    return kOk;
}

int CalDownSyncDirector::deleteBooks(CalSyncSide& side, const BookPlan& plan) {
    CalManager& manager = side.manager();
    int first = kOk;
    for (const std::string& uri : plan.gone) {
        SYNC_INFO("%s(%s) is no longer on the server", manager.kind().bookName, uri.c_str());
        if (manager.deleteBook(mpAccount->getAccountId(), uri) != kOk)
            first = fail(kFailed,
                         std::string("a ") + manager.kind().bookName + " could not be deleted on the device");
    }
    return first;
}

int CalDownSyncDirector::insertBooks(CalSyncSide& side, const BookPlan& plan) {
    CalManager& manager = side.manager();
    int first = kOk;
    for (const CalListInfoPtr& entry : plan.fresh) {
        if (manager.insertBook(mpAccount->getAccountId(), *entry) != kOk) {
            SYNC_ERR("insertCalendarbooks fail");
            first = fail(kFailed,
                         std::string("a ") + manager.kind().bookName + " could not be written to the device");
        }
    }
    return first;
}

int CalDownSyncDirector::syncItems(CalSyncSide& side, const CalList& books, PageMode mode) {
    int first = kOk;
    for (const CalListInfoPtr& entry : books) {
        mProgress.beginPart(entry->summary);
        const int result = syncPage(side, entry->id, mode);
        if (result == kStopped || result == kTokenFailed) return result;
        if (result == kOk) continue;
        if (first == kOk) first = result;
        if (side.unreachable()) break;
    }
    return first;
}

int CalDownSyncDirector::syncPage(CalSyncSide& side, const std::string& bookUri, PageMode mode) {
    CalManager& manager = side.manager();
    const CalItemKind& kind = manager.kind();
    CalItemStore* store = manager.prepared();
    CalBookMetaData book;
    CalBookSnapshot snapshot(kind);
    if (store == nullptr || store->books().get(mpAccount->getAccountId(), bookUri, &book) != kOk ||
        snapshot.load(*store, book) != kOk) {
        return fail(kFailed, kStoresUnreadable);
    }
    CalItemWriter writer(store, &snapshot);
    int written = kOk;
    if (const int result = writePages(side, bookUri, snapshot, &writer, &written); result != kOk)
        return result;
    if (mode == PageMode::kComparing) {
        const int result = deleteProven(side, bookUri, snapshot, &writer, &written);
        if (result != kOk) return result;
    }
    const CalItemWriter::Counts& counts = writer.counts();
    // What the sync wrote itself is examined now, so that no later look goes through it again.
    const bool wrote = counts.inserted + counts.updated + counts.deleted > 0;
    if (wrote && manager.setBookChanged(book.calendar_id) != kOk) written = kFailed;
    SYNC_INFO("%s(%s): %d inserted, %d updated, %d deleted", kind.bookName, bookUri.c_str(), counts.inserted,
              counts.updated, counts.deleted);
    if (written == kOk) return kOk;
    return fail(kFailed, std::string(kind.bookName) + " " + bookUri +
                             ": not everything could be written to the device");
}

int CalDownSyncDirector::writePages(CalSyncSide& side, const std::string& bookUri,
                                    const CalBookSnapshot& snapshot, CalItemWriter* writer, int* written) {
    int content = kOk;
    const int fetched = readPages<CalListPage>(
        [&](const std::string& token, CalListPage* page) { return side.getItems(bookUri, token, page); },
        [&](CalListPage& page) {
            const int result = side.getContent(bookUri, snapshot, &page);
            if (result == kTokenFailed || (result != kOk && side.unreachable())) return result;
            if (result != kOk) content = result;
            if (writer->writePage(page) != kOk) *written = kFailed;
            mProgress.addPage(page.entries.size());
            return kOk;
        },
        [this] { return isStopped(); });
    if (fetched != kOk) {
        if (fetched != kStopped) SYNC_ERR("getListPage fail");
        return fail(fetched,
                    std::string(side.manager().kind().bookName) + " " + bookUri + ": " + side.failure());
    }
    if (writer->writeWaiting() != kOk) *written = kFailed;
    if (content != kOk) *written = kFailed;
    return kOk;
}

int CalDownSyncDirector::deleteProven(CalSyncSide& side, const std::string& bookUri,
                                      const CalBookSnapshot& snapshot, CalItemWriter* writer, int* written) {
    if (!writer->listIsProof()) return kOk;
    const size_t gone = writer->unlisted().size();
    const size_t known = snapshot.knownToServer().size();
    if (deletion_proof::needsSecondLook(known, gone, gone == known)) {
        SYNC_INFO("%zu of %zu %ss are no longer listed, the list is fetched again", gone, known,
                  side.manager().kind().itemName);
        if (const int result = secondLook(side, bookUri, writer); result != kOk) return result;
    }
    if (writer->listIsProof() && writer->deleteUnlisted() != kOk) *written = kFailed;
    return kOk;
}

int CalDownSyncDirector::secondLook(CalSyncSide& side, const std::string& bookUri, CalItemWriter* writer) {
    const int result = readPages<CalListPage>(
        [&](const std::string& token, CalListPage* page) { return side.getIds(bookUri, token, page); },
        [writer](const CalListPage& page) {
            writer->markListed(page);
            return kOk;
        },
        [this] { return isStopped(); });
    if (result == kOk) return kOk;
    if (result != kStopped) SYNC_ERR("getListPage fail");
    return fail(result, std::string(side.manager().kind().bookName) + " " + bookUri + ": " + side.failure());
}
