#include "calendar/CalSyncSide.h"

#include "calendar/CalDataManager.h"
#include "calendar/CalPagePlan.h"
#include "calendar/CalTodoDataManager.h"
#include "common/JsonAccess.h"
#include "common/SyncLog.h"

using sync_result::kOk;
using sync_result::kTokenFailed;

CalEventSide::CalEventSide(Account* account, IProgressObserver* observer,
                           const std::shared_ptr<HttpShare>& share)
    : mBookListTask(account, observer, share),
      mEventListTask(account, observer, share),
      mpLast(&mBookListTask) {}

CalManager& CalEventSide::manager() {
    return CalDataManager::getInstance();
}

int CalEventSide::getBooks(const std::string& pageToken, CalListPage* page) {
    mpLast = &mBookListTask;
    return mBookListTask.getList(pageToken, page);
}

int CalEventSide::getItems(const std::string& bookUri, const std::string& pageToken, CalListPage* page) {
    mpLast = &mEventListTask;
    return mEventListTask.getAllPage(bookUri, pageToken, page);
}

int CalEventSide::getIds(const std::string& bookUri, const std::string& pageToken, CalListPage* page) {
    mpLast = &mEventListTask;
    return mEventListTask.getListPage(bookUri, pageToken, page);
}

CalTodoSide::CalTodoSide(Account* account, IProgressObserver* observer,
                         const std::shared_ptr<HttpShare>& share)
    : mBookListTask(account, observer, share),
      mTodoListTask(account, observer, share),
      mTodoTask(account, observer, share),
      mpLast(&mBookListTask) {}

CalManager& CalTodoSide::manager() {
    return CalTodoDataManager::getInstance();
}

int CalTodoSide::getBooks(const std::string& pageToken, CalListPage* page) {
    mpLast = &mBookListTask;
    return mBookListTask.getList(pageToken, page);
}

int CalTodoSide::getItems(const std::string& bookUri, const std::string& pageToken, CalListPage* page) {
    mpLast = &mTodoListTask;
    return mTodoListTask.getListPage(bookUri, pageToken, page);
}

int CalTodoSide::getContent(const std::string& bookUri, const CalBookSnapshot& snapshot, CalListPage* page) {
    CalList complete;
    int first = kOk;
    for (const CalListInfoPtr& entry : page->entries) {
        if (needsContent(*entry, snapshot)) {
            const int result = fetchTask(bookUri, entry.get());
            if (result == kTokenFailed || (result != kOk && unreachable())) return result;
            if (result != kOk) {
                SYNC_ERR("task(%s) is left out", entry->id.c_str());
                page->idOnly.push_back(entry->id);
                // One that went between the list and this request is no failure.
                if (!mTodoTask.notFound()) first = result;
                continue;
            }
        }
        complete.push_back(entry);
    }
    page->entries = std::move(complete);
    return first;
}

int CalTodoSide::fetchTask(const std::string& listId, CalListInfo* entry) {
    mpLast = &mTodoTask;
    if (const int result = mTodoTask.get(listId, entry->id, &entry->json); result != kOk) return result;
    // The content may be newer than the list.
    const std::string etag = json_access::textOr(jsonObjectOf(entry->json), "etag", "");
    if (!etag.empty()) entry->etag = etag;
    return kOk;
}
